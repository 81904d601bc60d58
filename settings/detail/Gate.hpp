#pragma once

#include <mutex>

#include "framework/common/Mutex.hpp"

namespace velkor::settings::detail {

/// What the deliveries to one setting pass through one after the other. Recursive: a callback may
/// end the setting that it is called by.
class VELKOR_CAPABILITY("mutex") Gate {
    friend class Passage;
    std::recursive_mutex native;
};

/// Holds a `Gate` while it lives.
class VELKOR_SCOPED_CAPABILITY Passage {
public:
    explicit Passage(Gate& gate) VELKOR_ACQUIRE(gate) : lock(gate.native) {}
    ~Passage() VELKOR_RELEASE() = default;

    Passage(const Passage&) = delete;
    Passage& operator=(const Passage&) = delete;

private:
    std::unique_lock<std::recursive_mutex> lock;
};

}  // namespace velkor::settings::detail
