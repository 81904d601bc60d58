#pragma once

#include <memory>
#include <utility>

namespace velkor {

template <class T>
class Future;

}  // namespace velkor

namespace velkor::detail {

template <class T>
class SharedFutureState;

class AnyContinuation;

/// A continuation whose result is there, ready to be run; or nothing.
///
/// Running one can make the next one of its chain ready. It is handed back instead of being run
/// from inside: `runAll` takes the same stack for a chain of any length.
using Step = std::unique_ptr<AnyContinuation>;

/// A continuation of whatever type, as `runAll` sees it.
class AnyContinuation {
public:
    virtual ~AnyContinuation() = default;

protected:
    /// A continuation that is run by `how`, which gives the step after it.
    explicit AnyContinuation(Step (*how)(AnyContinuation&)) noexcept : run(how) {}

private:
    friend void runAll(Step step);

    Step (*const run)(AnyContinuation&);
};

/// Runs `step` and those that it makes ready, one after the other on this thread. Each continuation
/// is destroyed before the next one runs. What one throws passes on.
inline void runAll(Step step) {
    while (step != nullptr) step = step->run(*step);
}

/// Code that takes over the result of a state once there is one. Run at most once.
template <class T>
class Continuation : public AnyContinuation {
public:
    using State = std::shared_ptr<SharedFutureState<T>>;

    Continuation() noexcept : AnyContinuation(&Continuation::runOnSource) {}

    /// Receives a future whose `get` answers at once. Runs on the thread that resolves the state,
    /// or that attaches to a resolved one, with no lock of this library held by the state.
    /// An exception passes on to that thread's caller.
    virtual void invoke(Future<T>&& future) = 0;

    /// As `invoke`, but may hand back what it has made ready instead of running it.
    virtual Step proceed(Future<T>&& future) {
        invoke(std::move(future));
        return nullptr;
    }

    /// Names the state whose result is to be taken over, before this is run as a step.
    void takeOver(State resolved) noexcept { source = std::move(resolved); }

private:
    static Step runOnSource(AnyContinuation& any) {
        auto& self = static_cast<Continuation&>(any);
        return self.proceed(Future<T>(std::move(self.source)));
    }

    State source;
};

}  // namespace velkor::detail
