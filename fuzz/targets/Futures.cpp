// Operations on promises and futures, with continuations that throw, call back and give things up,
// and on a model of them. Both have to leave the same trace.

#include <algorithm>
#include <deque>
#include <exception>
#include <memory>
#include <stdexcept>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "framework/Future.hpp"
#include "fuzz/Choices.hpp"
#include "fuzz/Finding.hpp"
#include "fuzz/Performer.hpp"
#include "fuzz/Targets.hpp"
#include "fuzz/models/ModelFuture.hpp"

namespace velkor::fuzz {
namespace {

/// One thing that is done to some of three promises and four futures:
///
///     n P        a new promise           d P        gives it up
///     m P P      moves one to another    v P VALUE  sets a value      e P KIND   sets an error
///     f P F      gets the future         g F        its result        c F        cancels
///     t F F TAKES THROWS REACTION        continues the first, the second is the future of that
///     M F F      moves one to another    D F        gives it up
struct Step {
    char operation = 'n';
    std::size_t promise = 0;
    std::size_t future = 0;
    std::size_t other = 0;
    std::string value{};
    bool takes = false;
    bool throws = false;
    std::shared_ptr<const Step> reaction{};
};

constexpr std::size_t promiseCount = 3;
constexpr std::size_t futureCount = 4;

Step readStep(Choices& choices, int depth = 2) {
    constexpr std::string_view onPromises = "ndmvef";
    Step step;
    step.operation = choices.oneOf("nvftgecdmMD");
    if (onPromises.find(step.operation) != std::string_view::npos) {
        step.promise = choices.below(promiseCount);
        if (step.operation == 'm') step.other = choices.below(promiseCount);
        if (step.operation == 'v') step.value = std::to_string(choices.below(10));
        if (step.operation == 'e') step.other = choices.below(3);
        if (step.operation == 'f') step.future = choices.below(futureCount);
        return step;
    }
    step.future = choices.below(futureCount);
    if (step.operation == 'M') step.other = choices.below(futureCount);
    if (step.operation != 't') return step;
    step.other = choices.below(futureCount);
    step.takes = choices.isOdd();
    step.throws = choices.isOdd();
    if (depth > 0 && choices.isOdd()) {
        step.reaction = std::make_shared<const Step>(readStep(choices, depth - 1));
    }
    return step;
}

// An error, one that is wrapped in another exception pointer, or none.
std::exception_ptr errorOf(std::size_t kind) {
    if (kind == 2) return nullptr;
    const auto error = std::make_exception_ptr(std::runtime_error("error"));
    return kind == 0 ? error : std::make_exception_ptr(error);
}

/// Promises and futures, real or model, with the continuations that they call.
template <template <class> class AnyPromise, template <class> class AnyFuture>
class System : public Performer<Step> {
public:
    using Value = std::string;

    /// Gives everything up, also what continuations make then as long as they have steps left.
    void end() {
        const auto isThere = [](const auto& promise) { return promise != nullptr; };
        while (std::any_of(promises.begin(), promises.end(), isThere)) {
            for (auto& promise : promises) const auto givenUp = std::move(promise);
        }
        for (auto& future : futures) future = AnyFuture<Value>();
    }

protected:
    /// Whether `get` would wait: there is one thread only.
    virtual bool waits(const AnyFuture<Value>& future) = 0;

private:
    std::string carryOut(const Step& step) override {
        switch (step.operation) {
            case 'g':
                return result(futures[step.future]);
            case 'c':
                futures[step.future].cancel();
                return "";
            case 't':
                return continueWith(step);
            case 'M':
                futures[step.other] = std::move(futures[step.future]);
                return "";
            case 'D':
                futures[step.future] = AnyFuture<Value>();
                return "";
            case 'n': {
                const auto before =
                    std::exchange(promises[step.promise], std::make_unique<AnyPromise<Value>>());
                return "";
            }
            default:
                return promises[step.promise] == nullptr ? "no promise" : onPromise(step);
        }
    }

    std::string onPromise(const Step& step) {
        switch (step.operation) {
            case 'd': {
                const auto givenUp = std::move(promises[step.promise]);
                return "";
            }
            case 'm': {
                auto moved =
                    std::make_unique<AnyPromise<Value>>(std::move(*promises[step.promise]));
                const auto before = std::exchange(promises[step.other], std::move(moved));
                return "";
            }
            case 'v':
                promises[step.promise]->setValue(step.value);
                return "";
            case 'e':
                promises[step.promise]->setException(errorOf(step.other));
                return "";
            default:
                futures[step.future] = promises[step.promise]->getFuture();
                return "";
        }
    }

    std::string result(AnyFuture<Value>& future) {
        if (waits(future)) return "would wait";
        return future.get();
    }

    std::string continueWith(const Step& step) {
        auto next = futures[step.future].then([this, step](AnyFuture<Value>&& future) -> Value {
            note("continues");
            if (step.takes) takeFrom(future);
            if (step.reaction) perform(*step.reaction);
            if (step.throws) throw std::runtime_error("a continuation");
            return "continued";
        });
        futures[step.other] = std::move(next);
        return "";
    }

    void takeFrom(AnyFuture<Value>& future) {
        try {
            note("takes " + future.get());
        } catch (const std::exception& error) {
            note(std::string("takes error ") + error.what());
        }
    }

    std::vector<std::unique_ptr<AnyPromise<Value>>> promises =
        std::vector<std::unique_ptr<AnyPromise<Value>>>(promiseCount);
    std::vector<AnyFuture<Value>> futures = std::vector<AnyFuture<Value>>(futureCount);
};

/// Says of each `get` whether it would wait.
class Model final : public System<models::ModelPromise, models::ModelFuture> {
public:
    std::deque<bool> waiting{};

private:
    bool waits(const models::ModelFuture<Value>& future) override {
        waiting.push_back(future.waits());
        return waiting.back();
    }
};

/// Is told by the model which of them would.
class Real final : public System<Promise, Future> {
public:
    explicit Real(std::deque<bool>& told) : waiting(told) {}

private:
    bool waits(const Future<Value>& /*future*/) override {
        expectThat(!waiting.empty(), "The model asks for as many results", "none is left");
        const bool next = waiting.front();
        waiting.pop_front();
        return next;
    }

    std::deque<bool>& waiting;
};

const Target target("futures", [](std::string_view input) {
    constexpr int mostSteps = 30;
    Model model;
    Real real(model.waiting);
    expectSameTraces(Choices(input), mostSteps, model, real,
                     [](Choices& choices) { return readStep(choices); });
});

}  // namespace
}  // namespace velkor::fuzz
