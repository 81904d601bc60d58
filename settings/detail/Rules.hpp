#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "settings/Conversion.hpp"
#include "settings/Converted.hpp"
#include "settings/Rule.hpp"
#include "settings/detail/Order.hpp"

namespace velkor::settings::detail {

inline std::optional<Reason> refusedUnless(bool holds, const std::string& description) {
    if (holds) return std::nullopt;
    return Reason{"not " + description};
}

template <class Low>
struct AtLeast : Rule {
    explicit AtLeast(Low bound) : low(std::move(bound)) {}

    std::string description() const { return "at least " + Conversion<Low>::show(low); }

    template <class T>
    std::optional<Reason> check(const T& value) const {
        return refusedUnless(isAtMost(low, value), description());
    }

    Low low;
};

template <class High>
struct AtMost : Rule {
    explicit AtMost(High bound) : high(std::move(bound)) {}

    std::string description() const { return "at most " + Conversion<High>::show(high); }

    template <class T>
    std::optional<Reason> check(const T& value) const {
        return refusedUnless(isAtMost(value, high), description());
    }

    High high;
};

template <class Low, class High>
struct Between : Rule {
    Between(Low least, High most) : low(std::move(least)), high(std::move(most)) {}

    std::string description() const {
        return "between " + Conversion<Low>::show(low) + " and " + Conversion<High>::show(high);
    }

    template <class T>
    std::optional<Reason> check(const T& value) const {
        return refusedUnless(isAtMost(low, value) && isAtMost(value, high), description());
    }

    Low low;
    High high;
};

template <class Choice>
struct OneOf : Rule {
    explicit OneOf(std::vector<Choice> given) : choices(std::move(given)) {}

    std::string description() const {
        return "one of: " + Conversion<std::vector<Choice>>::show(choices);
    }

    template <class T>
    std::optional<Reason> check(const T& value) const {
        for (const Choice& choice : choices) {
            if (isSame(value, choice)) return std::nullopt;
        }
        return refusedUnless(false, description());
    }

    std::vector<Choice> choices;
};

struct NotEmpty : Rule {
    std::string description() const { return "not empty"; }

    template <class T>
    std::optional<Reason> check(const T& value) const {
        if (!value.empty()) return std::nullopt;
        return Reason{"empty"};
    }
};

template <class Predicate>
struct Matching : Rule {
    Matching(std::string given, Predicate test)
        : meaning(std::move(given)), predicate(std::move(test)) {}

    std::string description() const { return meaning; }

    template <class T>
    std::optional<Reason> check(const T& value) const {
        return refusedUnless(predicate(value), meaning);
    }

    std::string meaning;
    Predicate predicate;
};

template <class ElementRule>
struct Each : Rule {
    explicit Each(ElementRule given) : rule(std::move(given)) {}

    std::string description() const { return "each " + rule.description(); }

    template <class T>
    std::optional<Reason> check(const std::vector<T>& list) const {
        std::size_t index = 0;
        for (const T& element : list) {
            const std::optional<Reason> reason = rule.check(element);
            if (reason) return ofElement(index, *reason);
            ++index;
        }
        return std::nullopt;
    }

    ElementRule rule;
};

template <class First, class Second>
struct Both : Rule {
    Both(First one, Second other) : first(std::move(one)), second(std::move(other)) {}

    std::string description() const { return first.description() + ", " + second.description(); }

    template <class T>
    std::optional<Reason> check(const T& value) const {
        std::optional<Reason> reason = first.check(value);
        return reason ? reason : second.check(value);
    }

    First first;
    Second second;
};

}  // namespace velkor::settings::detail
