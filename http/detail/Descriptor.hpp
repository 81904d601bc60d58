#pragma once

#include <unistd.h>

#include <utility>

namespace velkor::http::detail {

/// A descriptor of the system, closed with its owner.
class Descriptor {
public:
    Descriptor() = default;
    explicit Descriptor(int owned) noexcept : number(owned) {}
    ~Descriptor() {
        if (number >= 0) ::close(number);
    }

    Descriptor(Descriptor&& other) noexcept : number(other.release()) {}
    Descriptor& operator=(Descriptor&& other) noexcept {
        std::swap(number, other.number);
        return *this;
    }

    /// Whether there is one.
    explicit operator bool() const noexcept { return number >= 0; }

    int get() const noexcept { return number; }

    /// Gives it to the caller, who closes it.
    int release() noexcept { return std::exchange(number, -1); }

private:
    int number = -1;
};

}  // namespace velkor::http::detail
