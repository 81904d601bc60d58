// A chain of continuations takes no more of the stack than one of them, however it ends, and each
// link runs as it would alone: in order, on the thread that resolves, before that call returns.

#include <gtest/gtest.h>

#include <exception>
#include <memory>
#include <stdexcept>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "framework/Future.hpp"
#include "tests/support/Sanitizers.hpp"
#include "tests/support/Thrown.hpp"

namespace {

using velkor::Future;
using velkor::makeFailedFuture;
using velkor::makeReadyFuture;
using velkor::Promise;
using velkor::testing::thrownText;

// More than a stack holds, should each take of it.
constexpr int manyLinks = velkor::testing::isSanitized ? 100'000 : 1'000'000;

int addOne(Future<int>&& result) {
    return result.get() + 1;
}

std::exception_ptr reason() {
    return std::make_exception_ptr(std::invalid_argument("reason"));
}

/// The end of a chain of `manyLinks` more links after `first`.
template <class Callable>
Future<int> chainAfter(Future<int>& first, Callable callable) {
    Future<int> last = first.then(callable);
    for (int link = 1; link < manyLinks; ++link) last = last.then(callable);
    return last;
}

class FutureChains : public ::testing::Test {
protected:
    auto countRun() {
        return [this](Future<int>&&) { return ++runs; };
    }

    int runs = 0;  // outlives the promise, whose destructor runs what still waits
    std::unique_ptr<Promise<int>> promise = std::make_unique<Promise<int>>();
    Future<int> first = promise->getFuture();
};

TEST_F(FutureChains, ValueReachesTheEnd) {
    Future<int> last = chainAfter(first, addOne);
    promise->setValue(0);
    EXPECT_EQ(last.get(), manyLinks);
}

TEST_F(FutureChains, ExceptionReachesTheEnd) {
    Future<int> last = chainAfter(first, addOne);
    promise->setException(reason());
    EXPECT_EQ(thrownText<std::invalid_argument>([&] { last.get(); }), "reason");
}

// Throwing is slow: the other chains look at how many links have run.

TEST_F(FutureChains, DestroyedPromiseReachesTheEnd) {
    const Future<int> last = chainAfter(first, countRun());
    promise.reset();
    EXPECT_EQ(runs, manyLinks);
}

TEST_F(FutureChains, CancelOfTheFirstFutureReachesTheEnd) {
    Future<int> next = first.then(countRun());
    const Future<int> last = chainAfter(next, countRun());
    first.cancel();
    EXPECT_EQ(runs, manyLinks);
}

TEST_F(FutureChains, EndOfAStateWithoutAPromiseReachesTheEnd) {
    auto state = std::make_shared<velkor::detail::SharedFutureState<int>>();
    Future<int> start = state->retrieveFuture(state);
    Future<int> next = start.then(countRun());
    const Future<int> last = chainAfter(next, countRun());
    start = Future<int>();
    state.reset();
    EXPECT_EQ(runs, manyLinks);
}

TEST_F(FutureChains, NobodyNeedWaitForTheEnd) {
    chainAfter(first, countRun());
    promise->setValue(0);
    EXPECT_EQ(runs, manyLinks);
}

TEST_F(FutureChains, NobodyNeedWaitForTheEndOfAnAbandonedOne) {
    chainAfter(first, countRun());
    first = Future<int>();
    promise.reset();
    EXPECT_EQ(runs, manyLinks);
}

TEST_F(FutureChains, LinksRunInOrderOnTheResolvingThread) {
    bool inOrder = true;
    std::thread::id resolving;
    Future<int> last = chainAfter(first, [&](Future<int>&& result) {
        inOrder = inOrder && result.get() == runs && std::this_thread::get_id() == resolving;
        return ++runs;
    });
    std::thread([&] {
        resolving = std::this_thread::get_id();
        promise->setValue(0);
    }).join();
    EXPECT_TRUE(inOrder);
    EXPECT_EQ(runs, manyLinks);
}

TEST_F(FutureChains, LinkAfterAReadyResultRunsWhenItIsAttached) {
    bool atOnce = true;
    Future<int> last = makeReadyFuture(0);
    for (int link = 0; link < manyLinks; ++link) {
        last = last.then([&](Future<int>&& result) {
            ++runs;
            return result.get() + 1;
        });
        atOnce = atOnce && runs == link + 1;
    }
    EXPECT_TRUE(atOnce);
    EXPECT_EQ(last.get(), manyLinks);
}

TEST_F(FutureChains, LinkAfterAFailureRunsWhenItIsAttached) {
    const auto rethrow = [this](Future<int>&& result) {
        ++runs;
        return result.get();
    };
    Future<int> last = makeFailedFuture<int>(reason()).then(rethrow).then(rethrow).then(rethrow);
    EXPECT_EQ(runs, 3);
    EXPECT_EQ(thrownText<std::invalid_argument>([&] { last.get(); }), "reason");
}

// What a callable itself resolves is its own affair: that has run when its call returns.

class FutureChainSteps : public FutureChains {
protected:
    /// A link that writes `name` down and passes its value on.
    auto step(const std::string& name) {
        return [this, name](Future<int>&& result) {
            steps.push_back(name);
            return result.get();
        };
    }

    std::vector<std::string> steps;
};

TEST_F(FutureChainSteps, PromiseResolvedByALinkHasRunItsContinuationsOnReturn) {
    Promise<int> other;
    Future<int> otherLast = other.getFuture().then(step("other 1")).then(step("other 2"));
    Future<int> last = first
                           .then([&](Future<int>&& result) {
                               steps.emplace_back("before");
                               other.setValue(1);
                               steps.emplace_back("after");
                               return result.get();
                           })
                           .then(step("next"));
    promise->setValue(0);
    EXPECT_EQ(steps, (std::vector<std::string>{"before", "other 1", "other 2", "after", "next"}));
}

TEST_F(FutureChainSteps, PromiseDestroyedByALinkHasRunItsContinuationsOnReturn) {
    auto other = std::make_unique<Promise<int>>();
    Future<int> otherLast = other->getFuture().then(step("other 1")).then(step("other 2"));
    Future<int> last = first
                           .then([&](Future<int>&& result) {
                               steps.emplace_back("before");
                               other.reset();
                               steps.emplace_back("after");
                               return result.get();
                           })
                           .then(step("next"));
    promise->setValue(0);
    EXPECT_EQ(steps, (std::vector<std::string>{"before", "other 1", "other 2", "after", "next"}));
}

TEST_F(FutureChainSteps, WholeChainHasRunWhenTheResolvingCallReturns) {
    Future<int> last = first.then(step("1")).then(step("2")).then(step("3"));
    promise->setValue(0);
    steps.emplace_back("returned");
    EXPECT_EQ(steps, (std::vector<std::string>{"1", "2", "3", "returned"}));
}

TEST_F(FutureChainSteps, CallableIsDestroyedBeforeTheNextLinkRuns) {
    auto witness = std::shared_ptr<void>(nullptr, [this](void*) { steps.emplace_back("gone"); });
    Future<int> last =
        first.then([held = std::move(witness)](Future<int>&& result) { return result.get(); })
            .then(step("next"));
    promise->setValue(0);
    EXPECT_EQ(steps, (std::vector<std::string>{"gone", "next"}));
}

}  // namespace
