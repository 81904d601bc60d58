#pragma once

#include <signal.h>

#include <memory>
#include <optional>
#include <thread>
#include <utility>

#include "layers/detail/Endings.hpp"

namespace velkor::layers {

/// A thread that its owner waits for, unless the owner ends on that very thread, which then goes on
/// alone; the end of the process waits for it, and so does the unloading of the library that
/// started it. What it runs shares its state by shared pointers, and touches its owner no more once
/// it has given up its reference to it. It takes no signals of the process: those are for threads
/// that know what they mean.
///
/// The owner asks the thread to end before it destroys this.
class OwnThread {
public:
    /// Lives on such a thread while that holds a reference which may become the last one, of the
    /// owner or of what keeps the owner alive: others may give up theirs meanwhile and end the
    /// process, which waits. Made before the reference is taken, and destroyed after it is given
    /// up.
    class Borrowing {
    public:
        Borrowing() { detail::Endings::ofLibrary().borrow(); }
        ~Borrowing() { detail::Endings::ofLibrary().giveBack(); }

        Borrowing(const Borrowing&) = delete;
        Borrowing& operator=(const Borrowing&) = delete;
    };

    /// Starts a thread that runs `function` and destroys it. Throws `std::system_error` when the
    /// system refuses.
    template <class F>
    explicit OwnThread(F function)
        : OwnThread(SignalsBlocked(), std::make_shared<bool>(false), std::move(function)) {}

    ~OwnThread() {
        if (thread.front().get_id() != std::this_thread::get_id()) {
            thread.front().join();
            return;
        }
        *isAlone = true;
        detail::Endings::ofLibrary().adopt(thread);
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

    // The function is destroyed where it is: to move it might take memory, which may be short by
    // then.
    template <class F>
    OwnThread(const SignalsBlocked&, const std::shared_ptr<bool>& alone, F&& function)
        : isAlone(alone), thread(1) {
        thread.front() =
            std::thread([alone, own = std::optional<F>(std::forward<F>(function))]() mutable {
                (*own)();
                own.reset();
                if (*alone) detail::Endings::ofLibrary().noteEnd();
            });
    }

    const std::shared_ptr<bool> isAlone;  // used by the thread itself alone
    detail::Endings::Threads thread;      // the one
};

}  // namespace velkor::layers
