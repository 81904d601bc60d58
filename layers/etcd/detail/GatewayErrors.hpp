#pragma once

#include <stdexcept>
#include <string>

namespace velkor::layers::etcd {

/// The source ends: whatever it was waiting for is given up.
class Stopped : public std::runtime_error {
public:
    Stopped() : std::runtime_error("the source ends") {}
};

/// A member that can't be reached, doesn't answer in time, or answers what makes no sense. What was
/// asked of it may have been done, unless nothing had been sent.
class Unreachable : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

/// A member that refused what was asked of it.
class Refused : public std::runtime_error {
public:
    Refused(int grpcCode, const std::string& message)
        : std::runtime_error(message.empty() ? "error " + std::to_string(grpcCode) : message),
          code(grpcCode) {}

    /// What was asked for has not been done, and will not be.
    bool isFinal() const noexcept {
        return code == invalidArgument || code == notFound || code == permissionDenied ||
               code == exhausted || code == failedPrecondition || code == outOfRange ||
               isUnauthenticated();
    }

    /// The token is not valid any more.
    bool isUnauthenticated() const noexcept { return code == unauthenticated; }

    /// The revision that was asked for is none that this member keeps, or has reached.
    bool isOutOfRange() const noexcept { return code == outOfRange; }

private:
    static constexpr int invalidArgument = 3;
    static constexpr int notFound = 5;
    static constexpr int permissionDenied = 7;
    static constexpr int exhausted = 8;
    static constexpr int failedPrecondition = 9;
    static constexpr int outOfRange = 11;
    static constexpr int unauthenticated = 16;

    int code;
};

}  // namespace velkor::layers::etcd
