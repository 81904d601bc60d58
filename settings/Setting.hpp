#pragma once

#include <memory>
#include <optional>
#include <string>
#include <type_traits>
#include <utility>

#include "configuration/ConfigurationImpl.hpp"
#include "settings/Attributes.hpp"
#include "settings/ChangeHandle.hpp"
#include "settings/Constraint.hpp"
#include "settings/Conversion.hpp"
#include "settings/Reader.hpp"
#include "settings/SettingError.hpp"
#include "settings/Status.hpp"
#include "settings/detail/Cell.hpp"
#include "settings/detail/KeyRule.hpp"
#include "settings/detail/ValueState.hpp"

namespace velkor::settings {

namespace detail {

/// Where a setting publishes its value: a small one in itself, so that it is read without a look
/// into its state; any other in the state, which readers share.
template <class T>
using CellOf = std::conditional_t<fitsAtomic<T>, AtomicCell<T>&, SnapshotCell<T>>;

/// The state of a setting of one key.
template <class T>
class KeyState final : public ValueState<T, CellOf<T>> {
public:
    /// `published`: the cell of a small value.
    template <class... Published>
    explicit KeyState(KeyRule<T> declaredRule, Published&... published)
        : ValueState<T, CellOf<T>>(declaredRule.declaration().key, {declaredRule.declaration()},
                                   published...),
          rule(std::move(declaredRule)) {}

private:
    Verdict judge(const std::optional<configuration::Option>* options, bool first) override
        VELKOR_REQUIRES(this->gate) {
        Verdict verdict;
        this->propose(rule.judge(*options, first, verdict));
        return verdict;
    }

    const KeyRule<T> rule;
};

/// "server.port" as its own setting says it stands.
VELKOR_EXPORT Status statusOf(const SettingState& state);

/// How the value of a setting is read: small types.
template <class T, bool = fitsAtomic<T>>
class SettingAccess {
public:
    /// The value: one load.
    operator T() const noexcept { return cell.load(); }
    T get() const noexcept { return cell.load(); }

protected:
    explicit SettingAccess(KeyRule<T>&& rule)
        : state(std::make_shared<KeyState<T>>(std::move(rule), cell)) {}

private:
    AtomicCell<T> cell;

protected:
    const std::shared_ptr<KeyState<T>> state;
};

/// All others.
template <class T>
class SettingAccess<T, false> {
public:
    using Reader = settings::Reader<T>;

    /// A copy of the value.
    T get() const { return *snapshot(); }

    /// The value, which never changes and lives as long as it is held. Takes a lock for a moment:
    /// for cold code.
    std::shared_ptr<const T> snapshot() const { return state->cell.held(); }

    /// A reader for hot code of one thread.
    Reader reader() const {
        return Reader(std::shared_ptr<const SnapshotCell<T>>(state, &state->cell));
    }

protected:
    explicit SettingAccess(KeyRule<T>&& rule)
        : state(std::make_shared<KeyState<T>>(std::move(rule))) {}

    const std::shared_ptr<KeyState<T>> state;
};

}  // namespace detail

/// The value of one key of a store as a `T`, kept up to date:
///
///     Setting<int> port(store, "server.port", 8080, between(1, 65535));
///     if (port > limit) ...
///
/// `T` is any type with a `Conversion`. Where it is trivially copyable and at most 8 bytes long,
/// the setting converts to it by one load; of others there are snapshots and readers.
///
/// A value that does not fit is an error at construction only. Later the last good value stays; the
/// error is logged on the channel "velkor::settings", once for each change, and found in `status`.
/// A key that vanishes gives the default back; without one the last good value stays, with an
/// error.
///
/// A change has reached the setting when the call that makes it returns, unless another thread is
/// telling of changes just then, or the call is made in a callback: then it has soon.
///
/// Thread-safe, but for construction and destruction. May outlive the store, whose last value it
/// keeps. Destruction waits for a callback that runs on another thread, and of the last setting of
/// a store for the store: hold no lock that a callback needs, and do not destroy a setting inside a
/// source, or inside a subscriber of the store, while others change it.
template <class T>
class Setting : public detail::SettingAccess<T> {
public:
    /// Without a default there must be a value, except where `T` is optional: then the default is
    /// nothing. `modifiers` are a constraint and attributes, in any order. Throws `SettingError` if
    /// there is no value or it does not fit, `std::invalid_argument` "A setting needs a store.",
    /// and what a source throws.
    template <class... Modifiers,
              class = std::enable_if_t<(detail::isModifier<T, std::decay_t<Modifiers>> && ...)>>
    Setting(const std::shared_ptr<configuration::ConfigurationImpl>& store, std::string key,
            Modifiers&&... modifiers)
        : Setting(store, ruleOf(detail::KeyRule<T>(std::move(key)),
                                std::forward<Modifiers>(modifiers)...)) {}

    /// With a default, which must itself be right: otherwise `SettingError`.
    template <class... Modifiers,
              class = std::enable_if_t<(detail::isModifier<T, std::decay_t<Modifiers>> && ...)>>
    Setting(const std::shared_ptr<configuration::ConfigurationImpl>& store, std::string key,
            T defaultValue, Modifiers&&... modifiers)
        : Setting(store, ruleOf(withDefault(std::move(key), std::move(defaultValue)),
                                std::forward<Modifiers>(modifiers)...)) {}

    /// Does not compile: as the default of a `bool` a text would be `true`, whatever it says.
    template <class Character, class... Modifiers,
              class = std::enable_if_t<detail::isAlwaysTrue<T, const Character*>>>
    Setting(const std::shared_ptr<configuration::ConfigurationImpl>& store, std::string key,
            const Character* defaultText, Modifiers&&...)
        : Setting(store, std::move(key)) {
        detail::requireNoTextAsTruth<T, decltype(defaultText)>();
    }

    /// Calls `callback` with the value before and the value now when it has become another one, on
    /// the thread that makes the change, never nested and never twice at once. It may call the
    /// store and end the setting. What it throws is logged. Lasts as long as the handle.
    [[nodiscard]] ChangeHandle onChange(
        std::function<void(const T& before, const T& now)> callback) {
        return {this->state, this->state->addCallback(std::move(callback))};
    }

    /// How the setting stands.
    Status status() const { return detail::statusOf(*this->state); }

    const std::string& key() const noexcept { return this->state->name(); }

private:
    Setting(const std::shared_ptr<configuration::ConfigurationImpl>& store,
            detail::KeyRule<T>&& rule)
        : detail::SettingAccess<T>(std::move(rule)), following(this->state, store) {}

    static detail::KeyRule<T> withDefault(std::string key, T value) {
        detail::KeyRule<T> rule(std::move(key));
        rule.setDefault(std::move(value));
        return rule;
    }

    template <class... Modifiers>
    static detail::KeyRule<T> ruleOf(detail::KeyRule<T> rule, Modifiers&&... modifiers) {
        (rule.add(std::forward<Modifiers>(modifiers)), ...);
        rule.requireRightDefault();
        return rule;
    }

    const detail::Following following;
};

}  // namespace velkor::settings
