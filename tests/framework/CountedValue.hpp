#pragma once

#include <functional>
#include <stdexcept>
#include <utility>

namespace velkor::testing {

/// A value that counts how often one of its kind is copied. Used by one thread at a time.
struct CountedValue {
    explicit CountedValue(int value) : number(value) {}
    CountedValue(const CountedValue& other) : number(other.number) { ++copies; }
    CountedValue(CountedValue&& other) noexcept : number(std::exchange(other.number, -1)) {}
    CountedValue& operator=(const CountedValue&) = delete;
    CountedValue& operator=(CountedValue&&) = delete;
    ~CountedValue() = default;

    int number;
    static inline int copies = 0;
};

/// A value whose move throws `std::runtime_error` while it is armed.
struct FailsToMove {
    explicit FailsToMove(bool isArmed) : armed(isArmed) {}
    FailsToMove(FailsToMove&& other) : armed(other.armed) {
        if (armed) throw std::runtime_error("can't be moved");
    }
    FailsToMove& operator=(FailsToMove&&) = delete;

    bool armed;
};

/// A value that calls `onMove` whenever it is moved.
struct ObservedMove {
    explicit ObservedMove(std::function<void()> observer) : onMove(std::move(observer)) {}
    ObservedMove(ObservedMove&& other) : onMove(other.onMove) { onMove(); }
    ObservedMove& operator=(ObservedMove&&) = delete;

    std::function<void()> onMove;
};

}  // namespace velkor::testing
