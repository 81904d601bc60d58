#pragma once

#include <atomic>
#include <thread>

#include "layers/detail/Endings.hpp"

namespace velkor::layers::etcd {

/// One of the threads of a source, which may end the source itself: it goes on alone then, and the
/// end of the process waits for it.
class Running {
public:
    /// The calling thread is this one.
    void begin() noexcept { runner = std::this_thread::get_id(); }

    bool isHere() const noexcept { return runner.load() == std::this_thread::get_id(); }

    /// Nobody waits for the thread, which is the calling one.
    void goOnAlone() {
        layers::detail::Endings::ofAll().add();
        alone = true;
    }
    bool isAlone() const noexcept { return alone; }

private:
    std::atomic<std::thread::id> runner{};
    bool alone = false;  // used by the thread itself alone
};

}  // namespace velkor::layers::etcd
