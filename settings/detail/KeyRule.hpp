#pragma once

#include <exception>
#include <optional>
#include <string>
#include <type_traits>
#include <utility>

#include "configuration/Option.hpp"
#include "settings/Attributes.hpp"
#include "settings/Constraint.hpp"
#include "settings/Conversion.hpp"
#include "settings/SettingError.hpp"
#include "settings/detail/Declared.hpp"

namespace velkor::settings::detail {

/// Whether a `Given` is what may follow the default in the declaration of a `T`.
template <class T, class Given>
inline constexpr bool isModifier =
    isRule<Given> || std::is_same_v<Given, Constraint<T>> || std::is_same_v<Given, Attribute>;

/// Whether a default of type `Given` would become a truth value whatever it says, as a text does.
template <class T, class Given>
inline constexpr bool isAlwaysTrue =
    std::is_pointer_v<std::decay_t<Given>>&& isOneOf<T, bool, std::optional<bool>>;

/// Does not compile where the default is one that is always true.
template <class T, class Given>
constexpr void requireNoTextAsTruth() {
    static_assert(!isAlwaysTrue<T, Given>,
                  "a text is no default of a bool: it would always be true");
}

/// What a program has declared of one key, with its type. Immutable once it is complete.
template <class T>
class KeyRule {
public:
    explicit KeyRule(std::string key) {
        declared.key = std::move(key);
        declared.type = Conversion<T>::typeName();
        if constexpr (isOptional<T>) setDefault(T());
    }

    void setDefault(T value) {
        declared.fallback = Conversion<T>::show(value);
        fallback.emplace(std::move(value));
    }

    template <class Given>
    void add(Given&& given) {
        if constexpr (std::is_same_v<std::decay_t<Given>, Attribute>) {
            given.addTo(declared);
        } else {
            constraint = Constraint<T>(std::forward<Given>(given));
            declared.constraint = constraint.description();
        }
    }

    /// Throws `SettingError` if the default is not right itself.
    void requireRightDefault() const {
        if (!fallback) return;
        const std::optional<Reason> reason = refusal(*fallback);
        if (reason) throw SettingError(unfitDefaultOf(declared, *reason));
    }

    /// The value that `option` gives, with its standing and complaints added to `verdict`; nothing
    /// if the setting has to keep the one it has. `first`: it has none yet.
    std::optional<T> judge(const std::optional<configuration::Option>& option, bool first,
                           Verdict& verdict) const {
        if (!option) {
            if (!fallback) verdict.refuse(absenceOf(declared), common::warning);
            return byDefault(verdict);
        }
        Converted<T> read = convert(*option);
        if (read) {
            Standing& standing = verdict.standings.emplace_back();
            standing.value = Conversion<T>::show(read.value());
            standing.source = option->source;
            return std::optional<T>(std::move(read).value());
        }
        const std::string complaint = refusalOf(declared, *option, read.reason());
        if (first && declared.orDefault && fallback) {
            verdict.complain(complaint);
            return byDefault(verdict);
        }
        verdict.refuse(complaint, common::error);
        return std::nullopt;
    }

    const Declared& declaration() const noexcept { return declared; }

private:
    std::optional<T> byDefault(Verdict& verdict) const {
        if (fallback) verdict.standings.push_back({*declared.fallback, "", {}});
        return fallback;
    }

    Converted<T> convert(const configuration::Option& option) const {
        Converted<T> read = Conversion<T>::from(option.value);
        if (!read) return read;
        std::optional<Reason> reason = refusal(read.value());
        if (reason) return std::move(*reason);
        return read;
    }

    std::optional<Reason> refusal(const T& value) const {
        try {
            return constraint.check(value);
        } catch (const std::exception& error) {
            return failedCheck(declared.secret, error.what());
        }
    }

    Declared declared{};
    std::optional<T> fallback;
    Constraint<T> constraint;
};

}  // namespace velkor::settings::detail
