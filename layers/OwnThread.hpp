#pragma once

#include <thread>
#include <utility>

namespace velkor::layers {

/// A thread that its owner waits for, unless the owner ends on that very thread, which then goes on
/// alone. What it runs shares its state by shared pointers, and touches its owner no more once it
/// has given up its reference to it.
///
/// The owner asks the thread to end before it destroys this.
class OwnThread {
public:
    /// Starts a thread that runs `function`. Throws `std::system_error` when the system refuses.
    template <class F>
    explicit OwnThread(F&& function) : thread(std::forward<F>(function)) {}

    ~OwnThread() {
        if (thread.get_id() == std::this_thread::get_id()) {
            thread.detach();
        } else {
            thread.join();
        }
    }

    OwnThread(const OwnThread&) = delete;
    OwnThread& operator=(const OwnThread&) = delete;

private:
    std::thread thread;
};

}  // namespace velkor::layers
