#pragma once

#include <atomic>
#include <functional>

namespace velkor::testing {

/// What the system says to this program instead of what it would: each an error number, 0 for none.
struct SystemHooks {
    static inline std::atomic<int> inotifyRefused{0};  ///< To `inotify_init1`.
    static inline std::atomic<int> watchRefused{0};    ///< To `inotify_add_watch`.

    /// Runs before the status of an open file is taken, on the thread that has set it.
    static inline thread_local std::function<void()> beforeStatus;
};

/// Sets a hook while it lives.
class Refusal {
public:
    Refusal(std::atomic<int>& toSet, int error) : hook(toSet) { hook = error; }
    ~Refusal() { hook = 0; }

    Refusal(const Refusal&) = delete;
    Refusal& operator=(const Refusal&) = delete;

private:
    std::atomic<int>& hook;
};

}  // namespace velkor::testing
