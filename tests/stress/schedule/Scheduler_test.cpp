#include <gtest/gtest.h>

#include <chrono>
#include <condition_variable>
#include <cstdlib>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "tests/stress/schedule/Exploration.hpp"

namespace velkor::testing::schedule {
namespace {

constexpr Extent onlyAll{2, 0};
constexpr Extent onlyRandom{0, 1000};

/// Adds to a number that it reads and writes under a lock each, but not both under one.
void addInTwoSteps(std::mutex& mutex, int& number) {
    int read = 0;
    {
        const std::lock_guard<std::mutex> lock(mutex);
        read = number;
    }
    const std::lock_guard<std::mutex> lock(mutex);
    number = read + 1;
}

void lostAddition(const Together& together) {
    std::mutex mutex;
    int number = 0;
    const auto add = [&] { addInTwoSteps(mutex, number); };
    together({add, add});
    requireEqual(number, 2, "number");
}

/// Needs three preemptions of two threads.
void threeLookedForInTurn(const Together& together) {
    std::mutex mutex;
    std::string order;
    const auto write = [&](char letter) {
        for (int i = 0; i < 2; ++i) {
            const std::lock_guard<std::mutex> lock(mutex);
            order += letter;
        }
    };
    together({[&] { write('a'); }, [&] { write('b'); }});
    require(order != "abab", "in turn");
}

void oppositeOrders(const Together& together) {
    std::mutex left;
    std::mutex right;
    const auto lockBoth = [](std::mutex& first, std::mutex& second) {
        const std::lock_guard<std::mutex> one(first);
        const std::lock_guard<std::mutex> other(second);
    };
    together({[&] { lockBoth(left, right); }, [&] { lockBoth(right, left); }});
}

struct Signal {
    std::mutex mutex;
    std::condition_variable changed;
    bool given = false;

    void wait() {
        std::unique_lock<std::mutex> lock(mutex);
        changed.wait(lock, [this] { return given; });
    }
    void giveUntold() {
        const std::lock_guard<std::mutex> lock(mutex);
        given = true;
    }
    void give() {
        giveUntold();
        changed.notify_one();
    }
};

void notificationLost(const Together& together) {
    Signal signal;
    together({[&] { signal.wait(); }, [&] { signal.giveUntold(); }});
}

void lockedTwice(const Together& together) {
    std::mutex mutex;
    together({[&] {
        const std::lock_guard<std::mutex> lock(mutex);
        mutex.lock();
    }});
}

void nullPointerUsed(const Together& together) {
    std::mutex mutex;
    int number = 1;
    int* volatile shared = &number;
    together({[&] {
                  shared = nullptr;
                  std::this_thread::yield();
                  shared = &number;
              },
              [&] { *shared = 2; }});
}

std::vector<std::string> complaintsOf(const Scenario& scenario, const Extent& extent) {
    return {explore(scenario, extent).complaint, explore(scenario, extent).complaint};
}

TEST(Scheduler, FindsALostAdditionWithOnePreemption) {
    const auto findings = explore(lostAddition, {1, 0});
    EXPECT_NE(findings.complaint.find("number: 1 instead of 2"), std::string::npos);
}

TEST(Scheduler, FindsNothingWithoutPreemptions) {
    EXPECT_EQ(explore(lostAddition, {0, 0}).complaint, "");
}

TEST(Scheduler, FindsALostAdditionByChance) {
    EXPECT_NE(explore(lostAddition, onlyRandom).complaint, "");
}

TEST(Scheduler, TriesAllWithAsManyPreemptionsAsAreAsked) {
    EXPECT_EQ(explore(threeLookedForInTurn, {1, 0}).complaint, "");
    EXPECT_NE(explore(threeLookedForInTurn, {2, 0}).complaint, "");
}

TEST(Scheduler, TellsWhatTheThreadsDid) {
    const std::string complaint = explore(lostAddition, onlyAll).complaint;
    EXPECT_NE(complaint.find("  thread 0 locks #1\n  thread 0 has unlocked #1\n"),
              std::string::npos)
        << complaint;
}

TEST(Scheduler, RepeatsASchedule) {
    for (const Extent& extent : {onlyAll, onlyRandom}) {
        const auto complaints = complaintsOf(lostAddition, extent);
        EXPECT_EQ(complaints.front(), complaints.back());
    }
}

TEST(Scheduler, RepeatsTheScheduleThatIsAskedFor) {
    const std::string complaint = explore(lostAddition, onlyAll).complaint;
    const std::string variable = "VELKOR_SCHEDULE=";
    const auto begin = complaint.find(variable) + variable.size();
    const std::string choices = complaint.substr(begin, complaint.find(' ', begin) - begin);
    setenv("VELKOR_SCHEDULE", choices.c_str(), 1);
    const Findings repeated = explore(lostAddition, {0, 0});
    unsetenv("VELKOR_SCHEDULE");
    EXPECT_EQ(repeated.schedules, 2);
    EXPECT_EQ(repeated.complaint.substr(repeated.complaint.find("repeats:")),
              complaint.substr(complaint.find("repeats:")));
}

TEST(Scheduler, PassesOnWhatAThreadThrows) {
    const Scenario scenario = [](const Together& together) {
        together({[] { throw std::runtime_error("broken"); }, [] {}});
    };
    EXPECT_EQ(explore(scenario, onlyAll).complaint.find("broken"), 0);
}

TEST(Scheduler, LetsAMutexBeLockedAgainThatIsRecursive) {
    const Scenario scenario = [](const Together& together) {
        std::recursive_mutex mutex;
        int inside = 0;
        const auto lockTwice = [&] {
            const std::lock_guard<std::recursive_mutex> outer(mutex);
            ++inside;
            { const std::lock_guard<std::recursive_mutex> inner(mutex); }
            std::this_thread::yield();
            requireEqual(inside, 1, "inside");
            --inside;
        };
        together({lockTwice, lockTwice});
    };
    EXPECT_EQ(explore(scenario, onlyAll).complaint, "");
}

TEST(Scheduler, TriesALockThatAnotherThreadHas) {
    bool failed = false;
    bool succeeded = false;
    const Scenario scenario = [&](const Together& together) {
        std::mutex mutex;
        together({[&] {
                      const std::lock_guard<std::mutex> lock(mutex);
                      std::this_thread::yield();
                  },
                  [&] {
                      const bool locked = mutex.try_lock();
                      (locked ? succeeded : failed) = true;
                      if (locked) mutex.unlock();
                  }});
    };
    EXPECT_EQ(explore(scenario, onlyAll).complaint, "");
    EXPECT_TRUE(failed);
    EXPECT_TRUE(succeeded);
}

TEST(Scheduler, WakesWhoIsNotified) {
    const Scenario scenario = [](const Together& together) {
        Signal signal;
        together({[&] { signal.wait(); }, [&] { signal.give(); }});
    };
    EXPECT_EQ(explore(scenario, onlyAll).complaint, "");
}

TEST(Scheduler, LetsTimePassWhenNobodyCanGoOn) {
    const Scenario scenario = [](const Together& together) {
        std::mutex mutex;
        std::condition_variable never;
        together({[&] {
            std::unique_lock<std::mutex> lock(mutex);
            never.wait_for(lock, std::chrono::hours(1));
        }});
    };
    EXPECT_EQ(explore(scenario, onlyAll).complaint, "");
}

void endsWith(const Scenario& scenario, const std::string& complaint) {
    EXPECT_EXIT(explore(scenario, onlyAll), ::testing::ExitedWithCode(EXIT_FAILURE), complaint);
}

TEST(SchedulerDeathTest, ReportsADeadlock) {
    endsWith(oppositeOrders,
             "nobody can go on:\n"
             "  thread 0 wants #2, which thread 1 has\n"
             "  thread 1 wants #1, which thread 0 has\n"
             "in schedule");
}

TEST(SchedulerDeathTest, ReportsALostNotification) {
    endsWith(notificationLost, "nobody can go on:\n  thread 0 waits on #2\nin schedule");
}

TEST(SchedulerDeathTest, ReportsAMutexThatItsOwnThreadWants) {
    endsWith(lockedTwice, "thread 0 wants #1, which thread 0 has\nin schedule");
}

TEST(SchedulerDeathTest, ReportsASignal) {
    endsWith(nullPointerUsed, "a signal came\nin schedule");
}

}  // namespace
}  // namespace velkor::testing::schedule
