#pragma once

#include <functional>
#include <optional>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

#include "configuration/Option.hpp"
#include "settings/detail/Declared.hpp"
#include "settings/detail/KeyRule.hpp"

namespace velkor::settings {

/// The fields of a struct that a `Bound` reads, made by `fields`.
template <class Struct>
class Fields {
public:
    /// For use by `Bound`: one field, whose key is complete.
    struct Field {
        detail::Declared declared;
        /// Puts the value into the struct; without one, the verdict becomes a refusal.
        std::function<void(const std::optional<configuration::Option>& option, bool first,
                           Struct& into, detail::Verdict& verdict)>
            put;
    };

    /// For use by `Bound`: the fields below `prefix`. Throws `SettingError` if a default is not
    /// right.
    std::vector<Field> below(const std::string& prefix) const {
        std::vector<Field> made;
        for (const auto& make : makers) made.push_back(make(prefix));
        return made;
    }

    /// For use by `fields`: adds a field, and what follows its arguments.
    template <class Member, class... Rest>
    void add(Member Struct::*member, std::string name, Rest&&... rest) {
        addTo(Draft<Member>{member, std::move(name), {}, {}}, std::forward<Rest>(rest)...);
    }

private:
    template <class Member>
    struct Draft {
        Member Struct::*member;
        std::string name;
        std::optional<Member> fallback;
        std::vector<std::function<void(detail::KeyRule<Member>&)>> modifiers;
    };

    template <class Member>
    void addTo(Draft<Member> draft) {
        makers.push_back([draft = std::move(draft)](const std::string& prefix) {
            detail::KeyRule<Member> rule(prefix.empty() ? draft.name : prefix + "." + draft.name);
            if (draft.fallback) rule.setDefault(*draft.fallback);
            for (const auto& modify : draft.modifiers) modify(rule);
            rule.requireRightDefault();
            return bind(draft.member, std::move(rule));
        });
    }

    template <class Member, class Given, class... Rest>
    void addTo(Draft<Member> draft, Given&& given, Rest&&... rest) {
        using Plain = std::decay_t<Given>;
        if constexpr (std::is_member_object_pointer_v<Plain>) {
            addTo(std::move(draft));
            add(given, std::forward<Rest>(rest)...);
        } else if constexpr (detail::isModifier<Member, Plain>) {
            draft.modifiers.push_back(
                [given = Plain(std::forward<Given>(given))](auto& rule) { rule.add(given); });
            addTo(std::move(draft), std::forward<Rest>(rest)...);
        } else {
            detail::requireNoTextAsTruth<Member, Given>();
            static_assert(std::is_convertible_v<Given, Member>,
                          "a field's default converts to the field's type");
            draft.fallback.emplace(static_cast<Member>(std::forward<Given>(given)));
            addTo(std::move(draft), std::forward<Rest>(rest)...);
        }
    }

    template <class Member>
    static Field bind(Member Struct::*member, detail::KeyRule<Member> rule) {
        detail::Declared declared = rule.declaration();
        return {std::move(declared), [member, rule = std::move(rule)](
                                         const std::optional<configuration::Option>& option,
                                         bool first, Struct& into, detail::Verdict& verdict) {
                    auto value = rule.judge(option, first, verdict);
                    if (value) into.*member = std::move(*value);
                }};
    }

    std::vector<std::function<Field(const std::string&)>> makers;
};

/// Fields of a struct for a `Bound`, each a member, the name of its key below the prefix, and then,
/// as for a `Setting`, a default, a constraint and attributes, if any:
///
///     fields(&Server::port, "port", 8080, between(1, 65535),
///            &Server::host, "host", notEmpty())
template <class Struct, class Member, class... Rest>
Fields<Struct> fields(Member Struct::*member, std::string name, Rest&&... rest) {
    Fields<Struct> made;
    made.add(member, std::move(name), std::forward<Rest>(rest)...);
    return made;
}

}  // namespace velkor::settings
