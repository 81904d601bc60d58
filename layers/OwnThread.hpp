#pragma once

#include <signal.h>

#include <thread>
#include <utility>

namespace velkor::layers {

/// A thread that its owner waits for, unless the owner ends on that very thread, which then goes on
/// alone. What it runs shares its state by shared pointers, and touches its owner no more once it
/// has given up its reference to it. It takes no signals of the process: those are for threads that
/// know what they mean.
///
/// The owner asks the thread to end before it destroys this.
class OwnThread {
public:
    /// Starts a thread that runs `function`. Throws `std::system_error` when the system refuses.
    template <class F>
    explicit OwnThread(F function) : OwnThread(SignalsBlocked(), std::move(function)) {}

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
    /// Holds all signals back from the calling thread while it lives, and from one that is started
    /// meanwhile.
    class SignalsBlocked {
    public:
        SignalsBlocked() {
            sigset_t all;
            ::sigfillset(&all);
            ::pthread_sigmask(SIG_SETMASK, &all, &before);
        }
        ~SignalsBlocked() { ::pthread_sigmask(SIG_SETMASK, &before, nullptr); }

        SignalsBlocked(const SignalsBlocked&) = delete;
        SignalsBlocked& operator=(const SignalsBlocked&) = delete;

    private:
        sigset_t before{};
    };

    template <class F>
    OwnThread(const SignalsBlocked&, F&& function) : thread(std::forward<F>(function)) {}

    std::thread thread;
};

}  // namespace velkor::layers
