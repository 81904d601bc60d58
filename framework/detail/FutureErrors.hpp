#pragma once

#include <exception>

#include "framework/common/Export.hpp"

/// The texts of the errors that promises and futures throw; each is part of the interface.
namespace velkor::detail::future_errors {

inline constexpr const char* promiseInvalid = "Promise state isn't valid!";
inline constexpr const char* futureAlreadyRetrieved = "Promise already returned a future.";
inline constexpr const char* alreadyResolved = "Promise already resolved.";
inline constexpr const char* brokenPromise = "Promise destroyed before it provided a value.";
inline constexpr const char* nullException = "A promise can't be resolved with a null exception.";
inline constexpr const char* futureInvalid = "Future state isn't valid!";
inline constexpr const char* alreadyTaken =
    "Future already returned it's value or has an associated continuation.";
inline constexpr const char* cancelled = "Future has been cancelled.";
inline constexpr const char* invalidState = "Invalid Future state reached.";

}  // namespace velkor::detail::future_errors

namespace velkor::detail {

/// Throws `std::runtime_error` with `text`. Out of line, so that the checks that lead here stay
/// small where they are inlined.
[[noreturn]] VELKOR_EXPORT void throwFutureError(const char* text);

/// Rethrows `error`. If the object thrown is itself a non-null `std::exception_ptr`, the exception
/// that it points to is thrown instead: one level, no more. When `error` is null, throws
/// `std::runtime_error` with `future_errors::brokenPromise`; that takes no memory: the text was
/// made when the library was loaded, and the runtime keeps a reserve for the exceptions themselves.
[[noreturn]] VELKOR_EXPORT void rethrowUnwrapped(std::exception_ptr error);

/// Throws `std::invalid_argument` with `future_errors::nullException` when `error` is null.
VELKOR_EXPORT void requireException(const std::exception_ptr& error);

}  // namespace velkor::detail
