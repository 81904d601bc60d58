#pragma once

#include <cstdint>
#include <exception>
#include <list>
#include <map>
#include <optional>
#include <thread>

#include "framework/Future.hpp"

namespace velkor::layers::detail {

/// Who waits until numbered writes have got where they last, and who is still to be told that some
/// have not. Writes get there, or are refused, in the order of their numbers.
///
/// Has no mutex: that of its owner guards it, but for what is made before it is taken and told
/// after it was given back.
class CommitWaiters {
public:
    /// Somebody who waits.
    struct Waiter {
        Promise<bool> promise{};
        std::int64_t upTo = 0;         ///< The last write that is waited for.
        std::thread::id thread{};      ///< Who asked.
        std::exception_ptr refused{};  ///< Why a write of that thread or a waited one was, if any.
    };
    using Waiters = std::list<Waiter>;

    /// A question of the calling thread whether all that was accepted is there, with all the memory
    /// that asking takes.
    class Question {
    public:
        Question();

        /// Afterwards, with no mutex held: resolves with true when all of it is there, and fails
        /// with the reason when some of it is not, or of what this thread wrote since it last
        /// asked.
        Future<bool> answer();

    private:
        friend class CommitWaiters;

        Waiters waiter;
        Future<bool> later;
        std::exception_ptr refused;
    };

    /// Asks for all up to `lastWrite`, or for what was refused alone when nothing is under way.
    void ask(Question& question, std::optional<std::int64_t> lastWrite) noexcept;

    /// `thread` learns that its write of that number was refused: it waits for it, or will ask.
    /// Throws `std::bad_alloc`.
    void noteRefusal(std::thread::id thread, std::int64_t write, const std::exception_ptr& reason);

    /// Those who wait for nothing after the write of that number, who wait here no more.
    Waiters takeUpTo(std::int64_t write) noexcept;

    /// All who wait, who wait here no more.
    Waiters takeAll() noexcept;

    /// All of them will be told `reason`, unless they are told another one already.
    static void refuse(Waiters& told, const std::exception_ptr& reason) noexcept;

    /// Tells them, with no mutex held. A promise for which memory is short is broken, which its
    /// future tells as well.
    static void tell(Waiters&& told) noexcept;

private:
    Waiters waiters;
    std::map<std::thread::id, std::exception_ptr> untold;  // of threads that haven't asked since
};

}  // namespace velkor::layers::detail
