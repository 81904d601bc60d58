#pragma once

#include <string>
#include <type_traits>
#include <utility>
#include <variant>

namespace velkor::settings {

/// Why a value does not fit, to be read on behind a colon: "not a whole number in plain digits". It
/// never repeats the value or a part of it, so that it may be shown for a secret.
struct Reason {
    std::string text;
};

/// A `T` made from a value, or the reason why there is none.
template <class T>
class [[nodiscard]] Converted {
public:
    Converted(T value) : result(std::in_place_index<0>, std::move(value)) {}
    Converted(Reason reason) : result(std::in_place_index<1>, std::move(reason)) {}

    /// A bare text is no reason; it would be taken for `true`.
    Converted(const char*) = delete;

    /// Whether there is a value.
    explicit operator bool() const noexcept { return result.index() == 0; }

    /// The value; throws `std::bad_variant_access` when there is none.
    const T& value() const& { return std::get<0>(result); }
    T value() && { return std::get<0>(std::move(result)); }

    /// The reason; throws `std::bad_variant_access` when there is a value.
    const Reason& reason() const& { return std::get<1>(result); }
    Reason reason() && { return std::get<1>(std::move(result)); }

    /// What `next` makes of the value, a `Converted` of any type; the reason when there is none.
    template <class Next>
    std::invoke_result_t<Next, T> then(Next&& next) && {
        if (!*this) return std::move(*this).reason();
        return std::forward<Next>(next)(std::move(*this).value());
    }

private:
    std::variant<T, Reason> result;
};

}  // namespace velkor::settings
