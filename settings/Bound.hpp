#pragma once

#include <exception>
#include <functional>
#include <iterator>
#include <memory>
#include <optional>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "settings/ChangeHandle.hpp"
#include "settings/Converted.hpp"
#include "settings/Fields.hpp"
#include "settings/Reader.hpp"
#include "settings/SettingError.hpp"
#include "settings/Status.hpp"
#include "settings/detail/ValueState.hpp"

namespace velkor::settings {

namespace detail {

/// What a `Bound` is made of.
template <class Struct>
struct Shape {
    std::string prefix;
    std::vector<typename Fields<Struct>::Field> fields{};
    std::vector<std::function<std::optional<Reason>(const Struct&)>> validators{};

    void add(const Fields<Struct>& given) {
        auto more = given.below(prefix);
        fields.insert(fields.end(), std::make_move_iterator(more.begin()),
                      std::make_move_iterator(more.end()));
    }

    template <class Validator,
              class = std::enable_if_t<std::is_invocable_v<const Validator&, const Struct&>>>
    void add(Validator validator) {
        using Answer = std::invoke_result_t<const Validator&, const Struct&>;
        if constexpr (std::is_convertible_v<Answer, std::string>) {
            validators.push_back([validator](const Struct& value) -> std::optional<Reason> {
                std::string text = validator(value);
                if (text.empty()) return std::nullopt;
                return Reason{std::move(text)};
            });
        } else {
            validators.push_back(std::move(validator));
        }
    }

    std::vector<Declared> declared() const {
        std::vector<Declared> keys;
        for (const auto& field : fields) keys.push_back(field.declared);
        return keys;
    }
};

/// The state of a struct.
template <class Struct>
class StructState final : public ValueState<Struct, SnapshotCell<Struct>> {
public:
    explicit StructState(Shape<Struct> given)
        : ValueState<Struct, SnapshotCell<Struct>>(given.prefix, given.declared()),
          shape(std::move(given)) {}

private:
    Verdict judge(const std::optional<configuration::Option>* options, bool first) override
        VELKOR_REQUIRES(this->gate) {
        Verdict verdict;
        Struct value{};
        for (const auto& field : shape.fields) field.put(*options++, first, value, verdict);
        // Validators see whole structs only.
        if (verdict.holds) validate(value, verdict);
        if (verdict.holds) this->propose(std::move(value));
        return verdict;
    }

    void validate(const Struct& value, Verdict& verdict) const {
        for (const auto& validator : shape.validators) {
            const std::optional<Reason> reason = reasonOf(validator, value);
            if (reason) verdict.refuse(shape.prefix + ": " + reason->text, common::error);
        }
    }

    template <class Validator>
    static std::optional<Reason> reasonOf(const Validator& validator, const Struct& value) {
        try {
            return validator(value);
        } catch (const std::exception& error) {
            return failedCheck(false, error.what());
        }
    }

    const Shape<Struct> shape;
};

/// How the fields of a struct stand.
VELKOR_EXPORT BoundStatus boundStatusOf(const SettingState& state);

}  // namespace detail

/// Several keys of a store as one struct, kept up to date: one immutable snapshot, never half of a
/// change.
///
///     struct Server { int port; std::string host; std::vector<std::string> peers; };
///     Bound<Server> server(store, "server",
///         fields(&Server::port, "port", 8080, between(1, 65535), &Server::host, "host"),
///         [](const Server& all) { return all.peers.empty() ? "no peers" : ""; });
///
/// When one of the keys changes, all are read at one moment. The struct is published only if every
/// value fits and no validator objects; otherwise the last good struct stays, and all errors are
/// reported together. Keys that the store's `apply` changes together are changed together here.
/// Keys that are set one after the other are so here, too.
///
/// `Struct` is default-constructible; members that are no field have what `Struct{}` gives them.
/// Errors, callbacks, threads and lifetime are as those of a `Setting`.
template <class Struct>
class Bound {
public:
    using Reader = settings::Reader<Struct>;

    /// Each key is `prefix`, a point and the name of the field; with an empty prefix the name
    /// alone. `parts` are what `fields` gives, and validators: callables that take a `const
    /// Struct&` and give a text, empty if all is well, or a `std::optional<Reason>`. They may be
    /// called by several threads. Throws as the constructor of `Setting`, `SettingError` with all
    /// errors.
    template <class... Parts>
    Bound(const std::shared_ptr<configuration::ConfigurationImpl>& store, std::string prefix,
          const Fields<Struct>& first, Parts&&... parts)
        : state(std::make_shared<detail::StructState<Struct>>(
              shapeOf(std::move(prefix), first, std::forward<Parts>(parts)...))),
          following(state, store) {}

    /// The struct, which never changes and lives as long as it is held. Takes a lock for a moment:
    /// for cold code.
    std::shared_ptr<const Struct> snapshot() const { return state->cell.held(); }

    /// A reader for hot code of one thread.
    Reader reader() const {
        return Reader(std::shared_ptr<const detail::SnapshotCell<Struct>>(state, &state->cell));
    }

    /// Calls `callback` when a field has become another one; see `Setting::onChange`.
    [[nodiscard]] ChangeHandle onChange(
        std::function<void(const Struct& before, const Struct& now)> callback) {
        return {state, state->addCallback(std::move(callback))};
    }

    /// How the fields stand, and why the newest values are not taken, if so.
    BoundStatus status() const { return detail::boundStatusOf(*state); }

private:
    template <class... Parts>
    static detail::Shape<Struct> shapeOf(std::string prefix, Parts&&... parts) {
        detail::Shape<Struct> shape{std::move(prefix)};
        (shape.add(std::forward<Parts>(parts)), ...);
        return shape;
    }

    const std::shared_ptr<detail::StructState<Struct>> state;
    const detail::Following following;
};

}  // namespace velkor::settings
