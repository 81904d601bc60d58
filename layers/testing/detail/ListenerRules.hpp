#pragma once

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <memory>
#include <string>
#include <tuple>
#include <vector>

#include "layers/testing/detail/SampleValues.hpp"
#include "layers/testing/detail/Trial.hpp"

// Whom a source tells of its changes, and when. Each rule is a function of the same name as its
// test, and holds for every way in which the source changes.
namespace velkor::layers::testing::detail {

/// Calls `rule` for each way in which the source of a subject changes, with a new source that holds
/// the first of the sample values for "contract.first".
template <class Rule>
void forEachWay(const MakeSubject& makeSubject, const Rule& rule) {
    const SampleValues value(*makeSubject());
    const ValueMap initial = {{"contract.first", value[0]}};
    const auto ways = Trial(makeSubject(), initial).ways();
    if (ways.empty()) GTEST_SKIP() << "It never changes.";
    for (const Way way : ways) {
        SCOPED_TRACE(way);
        rule(std::make_shared<Trial>(makeSubject(), initial), way, value);
        if (::testing::Test::HasFailure()) return;
    }
}

/// The same for a source that changes by itself.
template <class Rule>
void forEachWayOfAChangingSource(const MakeSubject& makeSubject, const Rule& rule) {
    if (dynamic_cast<ChangingSubject*>(makeSubject().get()) == nullptr) {
        GTEST_SKIP() << "It doesn't change by itself.";
    }
    forEachWay(makeSubject, rule);
}

using TrialPtr = std::shared_ptr<Trial>;

inline void everyChangeIsToldOnce(const MakeSubject& makeSubject) {
    forEachWay(makeSubject, [](const TrialPtr& trial, Way way, const SampleValues& value) {
        const auto told = trial->listen();
        ASSERT_TRUE(trial->finish(way, "contract.first", value[1], *told));
        ASSERT_TRUE(trial->finish(way, "contract.second", value[2], *told));
        std::vector<std::string> expected = {"contract.first", "contract.second"};
        if (trial->losesKeys(way)) {
            ASSERT_TRUE(trial->finish(way, "contract.first", {}, *told));
            expected.emplace_back("contract.first");
        }
        // A second call for the change before comes before this one.
        ASSERT_TRUE(trial->finish(way, "contract.last", value[3], *told));
        expected.emplace_back("contract.last");
        EXPECT_EQ(told->all(), expected);
    });
}

inline void toldWhenItCanBeRead(const MakeSubject& makeSubject) {
    forEachWay(makeSubject, [](const TrialPtr& trial, Way way, const SampleValues& value) {
        const auto told = std::make_shared<Noted<std::string>>();
        const auto found = std::make_shared<Noted<std::string>>();
        trial->source()->setChangeListener(
            [told, found, source = trial->source().get()](const std::string& key) {
                found->note(source->has(key) ? describe(source->get(key)) : "nothing");
                told->note(key);
            });
        ASSERT_TRUE(trial->finish(way, "contract.first", value[1], *told));
        ASSERT_TRUE(trial->finish(way, "contract.second", value[2], *told));
        EXPECT_EQ(found->all().front(), describe(value[1])) << "a value that was replaced";
        EXPECT_EQ(found->all().back(), describe(value[2])) << "a new key";
        if (!trial->losesKeys(way)) return;
        ASSERT_TRUE(trial->finish(way, "contract.first", {}, *told));
        EXPECT_EQ(found->all().back(), "nothing") << "a key that has gone";
    });
}

inline void toldWithoutALockOfTheSource(const MakeSubject& makeSubject) {
    forEachWay(makeSubject, [](const TrialPtr& trial, Way way, const SampleValues& value) {
        const auto reads = std::make_shared<Noted<bool>>();
        const std::weak_ptr<ConfigurationSource> source = trial->source();
        trial->source()->setChangeListener(
            [reads, source, patience = trial->patience()](const std::string& key) {
                const auto read = onOwnThread([key, asked = source.lock()] {
                    if (asked->has(key)) asked->get(key);
                    asked->keys();
                });
                reads->note(read.comes(patience));
            });
        trial->begin(way, "contract.first", value[1]);
        ASSERT_TRUE(reads->begins(2 * trial->patience())) << "The listener was not called.";
        EXPECT_TRUE(reads->all().front())
            << "While the listener runs, another thread can't read the source.";
    });
}

inline void listenerCanBeReplaced(const MakeSubject& makeSubject) {
    forEachWay(makeSubject, [](const TrialPtr& trial, Way way, const SampleValues& value) {
        const auto former = trial->listen();
        ASSERT_TRUE(trial->finish(way, "contract.first", value[1], *former));
        const auto calls = former->all();
        const auto latter = trial->listen();
        ASSERT_TRUE(trial->finish(way, "contract.second", value[2], *latter));
        EXPECT_FALSE(latter->all().empty()) << "The listener that came later was not called.";
        EXPECT_EQ(former->all(), calls) << "The listener that was replaced was called.";
    });
}

/// Whether a listener is called no more after it was taken back.
inline ::testing::AssertionResult takesItsListenerBack(Trial& trial, Way way,
                                                       const SampleValues& value) {
    const auto former = trial.listen();
    if (auto told = trial.finish(way, "contract.first", value[1], *former); !told) return told;
    const auto calls = former->all();
    trial.source()->setChangeListener({});
    trial.begin(way, "contract.second", value[2]);
    // By the time of this change the one before has been made.
    const auto latter = trial.listen();
    if (auto told = trial.finish(way, "contract.third", value[3], *latter); !told) return told;
    if (former->all() == calls) return ::testing::AssertionSuccess();
    return ::testing::AssertionFailure() << "The listener that was taken back was called.";
}

inline void listenerCanBeTakenBack(const MakeSubject& makeSubject) {
    forEachWay(makeSubject, [](const TrialPtr& trial, Way way, const SampleValues& value) {
        EXPECT_TRUE(takesItsListenerBack(*trial, way, value));
    });
}

/// How long a thread that ought to be waiting is given to show that it isn't. A right source makes
/// the rule last this long.
inline constexpr std::chrono::milliseconds grace{500};

inline void detachingWaitsForTheListener(const MakeSubject& makeSubject) {
    forEachWayOfAChangingSource(
        makeSubject, [](const TrialPtr& trial, Way way, const SampleValues& value) {
            struct Call {
                Noted<std::string> begun;
                Noted<bool> mayEnd;
                std::atomic<bool> isRunning{false};
            };
            const auto call = std::make_shared<Call>();
            trial->source()->setChangeListener(
                [call, patience = trial->patience()](const std::string& key) {
                    call->isRunning = true;
                    call->begun.note(key);
                    std::ignore = call->mayEnd.begins(patience);
                    call->isRunning = false;
                });
            const auto change = onOwnThread(
                [trial, way, other = value[1]] { trial->begin(way, "contract.first", other); });
            ASSERT_TRUE(call->begun.begins(trial->patience())) << "The listener was not called.";

            auto ranAfterwards = onOwnThread([trial, call] {
                trial->source()->setChangeListener({});
                return call->isRunning.load();
            });
            std::ignore = ranAfterwards.comes(grace);
            call->mayEnd.note(true);
            ASSERT_TRUE(ranAfterwards.comes(trial->patience())) << "It waits for no call.";
            EXPECT_FALSE(ranAfterwards.get())
                << "The listener was still running when it had been taken back.";
            EXPECT_TRUE(change.comes(trial->patience()));
        });
}

inline void listenerMayDetachItself(const MakeSubject& makeSubject) {
    forEachWayOfAChangingSource(
        makeSubject, [](const TrialPtr& trial, Way way, const SampleValues& value) {
            const auto detached = std::make_shared<Noted<std::string>>();
            trial->source()->setChangeListener(
                [detached, source = trial->source().get()](const std::string& key) {
                    const auto kept = detached;  // the listener may go with what it holds
                    source->setChangeListener({});
                    kept->note(key);
                });
            const auto change = onOwnThread(
                [trial, way, other = value[1]] { trial->begin(way, "contract.first", other); });
            ASSERT_TRUE(detached->begins(trial->patience()))
                << "The source waits for the listener that calls it.";
            ASSERT_TRUE(change.comes(trial->patience()));
            const auto latter = trial->listen();
            EXPECT_TRUE(trial->finish(way, "contract.second", value[2], *latter));
        });
}

}  // namespace velkor::layers::testing::detail
