#pragma once

#include <functional>
#include <memory>
#include <utility>

namespace velkor::reactive_streams {

/// What has happened to the values of one test.
struct ValueLog {
    int copies = 0;
    int alive = 0;
    std::function<void()> whenDestroyed;  // run by the destructor of each value not moved from
};

/// A value that keeps account of itself.
class TrackedValue {
public:
    TrackedValue(std::shared_ptr<ValueLog> valueLog, int valueNumber)
        : number(valueNumber), log(std::move(valueLog)) {
        ++log->alive;
    }

    TrackedValue(const TrackedValue& other) : number(other.number), log(other.log) {
        ++log->copies;
        ++log->alive;
    }

    TrackedValue(TrackedValue&& other) noexcept : number(other.number), log(std::move(other.log)) {}

    TrackedValue& operator=(TrackedValue other) noexcept {
        std::swap(number, other.number);
        log.swap(other.log);
        return *this;
    }

    ~TrackedValue() {
        if (log == nullptr) return;
        --log->alive;
        if (log->whenDestroyed) log->whenDestroyed();
    }

    int number;

private:
    std::shared_ptr<ValueLog> log;
};

}  // namespace velkor::reactive_streams
