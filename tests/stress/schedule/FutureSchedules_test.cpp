#include <gtest/gtest.h>

#include <exception>
#include <memory>
#include <optional>
#include <stdexcept>
#include <string>
#include <utility>

#include "framework/Future.hpp"
#include "tests/stress/schedule/Schedules.hpp"

namespace velkor::testing::schedule {
namespace {

const std::string cancelledText = "Future has been cancelled.";
const std::string takenText =
    "Future already returned it's value or has an associated continuation.";
const std::string destroyedText = "Promise destroyed before it provided a value.";
const std::string resolvedText = "Promise already resolved.";

/// What a future gives, or the text that it throws.
template <class T>
std::string outcomeOf(Future<T>& future) {
    try {
        return std::to_string(future.get());
    } catch (const std::runtime_error& error) {
        return error.what();
    }
}

void requireText(const std::string& actual, const std::string& expected) {
    require(actual == expected, "'" + actual + "' instead of '" + expected + "'");
}

class FutureSchedules : public Schedules {};

TEST_F(FutureSchedules, WhoWaitsGetsTheValue) {
    expectAlways([](const Together& together) {
        Promise<int> promise;
        auto future = promise.getFuture();
        together({[&] { requireText(outcomeOf(future), "1"); }, [&] { promise.setValue(1); }});
    });
}

TEST_F(FutureSchedules, WhoWaitsMayDestroyBothEnds) {
    expectAlways([](const Together& together) {
        auto promise = std::make_unique<Promise<int>>();
        auto future = std::make_unique<Future<int>>(promise->getFuture());
        auto* const resolving = promise.get();
        together({[&] {
                      requireText(outcomeOf(*future), "1");
                      promise.reset();
                      future.reset();
                  },
                  [&] { resolving->setValue(1); }});
    });
}

TEST_F(FutureSchedules, WhoWaitsHearsOfACancellation) {
    expectAlways([](const Together& together) {
        Promise<int> promise;
        auto future = std::make_shared<Future<int>>(promise.getFuture());
        together(
            {[&] { requireText(outcomeOf(*future), cancelledText); }, [&] { future->cancel(); }});
    });
}

TEST_F(FutureSchedules, ACancellationBesideAValueLeavesOneOfThem) {
    expectAlways([](const Together& together) {
        Promise<int> promise;
        auto future = promise.getFuture();
        std::string outcome;
        together({[&] { outcome = outcomeOf(future); }, [&] { promise.setValue(1); },
                  [&] { future.cancel(); }});
        require(outcome == "1" || outcome == cancelledText, outcome);
    });
}

TEST_F(FutureSchedules, WhoWaitsHearsOfADestroyedPromise) {
    expectAlways([](const Together& together) {
        std::optional<Promise<int>> promise(std::in_place);
        auto future = promise->getFuture();
        together(
            {[&] { requireText(outcomeOf(future), destroyedText); }, [&] { promise.reset(); }});
    });
}

TEST_F(FutureSchedules, OneOfTwoWhoWaitGetsTheValue) {
    expectAlways([](const Together& together) {
        Promise<int> promise;
        auto future = promise.getFuture();
        std::string outcomes[2];
        together({[&] { outcomes[0] = outcomeOf(future); },
                  [&] { outcomes[1] = outcomeOf(future); }, [&] { promise.setValue(1); }});
        if (outcomes[0] != "1") std::swap(outcomes[0], outcomes[1]);
        requireText(outcomes[0], "1");
        requireText(outcomes[1], takenText);
    });
}

TEST_F(FutureSchedules, OneOfTwoResultsIsRefused) {
    expectAlways([](const Together& together) {
        Promise<int> promise;
        auto future = promise.getFuture();
        int refused = 0;
        const auto resolve = [&](int value) {
            try {
                promise.setValue(value);
            } catch (const std::runtime_error& error) {
                requireText(error.what(), resolvedText);
                ++refused;
            }
        };
        together({[&] { resolve(1); }, [&] { resolve(2); }});
        requireEqual(refused, 1, "refused");
        require(future.get() > 0, "no result");
    });
}

TEST_F(FutureSchedules, OneOfTwoFuturesIsRefused) {
    expectAlways([](const Together& together) {
        Promise<int> promise;
        int refused = 0;
        const auto retrieve = [&] {
            try {
                promise.getFuture();
            } catch (const std::runtime_error&) {
                ++refused;
            }
        };
        together({retrieve, retrieve});
        requireEqual(refused, 1, "refused");
    });
}

TEST_F(FutureSchedules, AContinuationRunsOnce) {
    expectAlways([](const Together& together) {
        Promise<int> promise;
        auto future = promise.getFuture();
        int runs = 0;
        together({[&] {
                      auto next = future.then([&](Future<int> result) {
                          ++runs;
                          return result.get() + 1;
                      });
                      requireText(outcomeOf(next), "2");
                  },
                  [&] { promise.setValue(1); }});
        requireEqual(runs, 1, "runs");
    });
}

TEST_F(FutureSchedules, AContinuationBesideACancellationRunsOrIsDestroyed) {
    expectAlways([](const Together& together) {
        Promise<int> promise;
        auto future = promise.getFuture();
        int runs = 0;
        std::string outcome;
        together({[&] {
                      auto next = future.then([&](Future<int> result) {
                          ++runs;
                          return result.get() + 1;
                      });
                      outcome = outcomeOf(next);
                  },
                  [&] { promise.setValue(1); }, [&] { future.cancel(); }});
        requireText(outcome, runs == 1 ? "2" : destroyedText);
    });
}

TEST_F(FutureSchedules, AChainOfContinuationsPassesTheValueOn) {
    expectAlways([](const Together& together) {
        Promise<int> promise;
        auto future = promise.getFuture();
        const auto more = [](Future<int> result) { return result.get() + 1; };
        together({[&] {
                      auto last = future.then(more).then(more);
                      requireText(outcomeOf(last), "3");
                  },
                  [&] { promise.setValue(1); }});
    });
}

TEST_F(FutureSchedules, AMovedFutureGetsTheValue) {
    expectAlways([](const Together& together) {
        Promise<int> promise;
        auto future = promise.getFuture();
        together({[&] {
                      Future<int> moved;
                      moved = std::move(future);
                      requireText(outcomeOf(moved), "1");
                      requireText(outcomeOf(future), "Future state isn't valid!");
                  },
                  [&] {
                      Promise<int> moved(std::move(promise));
                      moved.setValue(1);
                  }});
    });
}

TEST_F(FutureSchedules, AFutureBehindAContinuationThatTookNothingGivesTheValue) {
    expectAlways([](const Together& together) {
        Promise<int> promise;
        auto future = promise.getFuture();
        Future<int> kept;
        together({[&] {
                      auto next = future.then([&](Future<int> result) {
                          kept = std::move(result);
                          return 0;
                      });
                      next.get();
                      requireText(outcomeOf(kept), "1");
                  },
                  [&] { promise.setValue(1); }});
    });
}

}  // namespace
}  // namespace velkor::testing::schedule
