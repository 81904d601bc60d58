#include "tests/stress/histories/Linearizability.hpp"

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace velkor::testing {
namespace {

/// One number that can be read, written and exchanged.
struct Register {
    enum class Kind { read, write, exchange };
    struct Call {
        Kind kind;
        int value = 0;
    };

    static bool isRead(const Call& call) { return call.kind == Kind::read; }
    std::string read(const Call&) const { return std::to_string(value); }
    std::string write(const Call& call) {
        const int before = std::exchange(value, call.value);
        return call.kind == Kind::exchange ? std::to_string(before) : "done";
    }
    std::string state() const { return std::to_string(value); }
    static std::string textOf(const Call& call) {
        return isRead(call) ? "read" : "write " + std::to_string(call.value);
    }

    int value = 0;
};

using History = Linearizability<Register>::History;
using Entry = Recorded<Register::Call>;

Entry read(std::uint64_t invoked, std::uint64_t responded, int answer) {
    return {{Register::Kind::read}, std::to_string(answer), invoked, responded};
}

Entry write(std::uint64_t invoked, std::uint64_t responded, int value) {
    return {{Register::Kind::write, value}, "done", invoked, responded};
}

Entry exchange(std::uint64_t invoked, std::uint64_t responded, int value, int before) {
    return {{Register::Kind::exchange, value}, std::to_string(before), invoked, responded};
}

bool isLinearizable(const History& history) {
    return Linearizability<Register>::complaintOf(history, Register()).empty();
}

struct Example {
    const char* what;
    History history;
};

TEST(Linearizability, OrdersThatExistAreFound) {
    const std::vector<Example> examples{
        {"nothing at all", {}},
        {"one after the other", {write(1, 2, 7), read(3, 4, 7)}},
        {"a read beside a write, before it", {write(1, 4, 7), read(2, 3, 0)}},
        {"a read beside a write, after it", {write(1, 4, 7), read(2, 3, 7)}},
        {"reads that turn beside a write", {write(1, 8, 7), read(2, 3, 0), read(4, 5, 7)}},
        {"writes that end in the other order",
         {write(1, 10, 1), write(2, 3, 2), read(4, 5, 2), read(11, 12, 1)}},
        {"exchanges that only one order explains",
         {exchange(1, 10, 1, 3), exchange(2, 9, 2, 0), exchange(3, 8, 3, 2), read(11, 12, 1)}},
        {"the wrong guess at first",
         {write(1, 9, 1), write(2, 10, 2), read(3, 8, 2), read(11, 12, 1)}},
        {"many at once",
         {exchange(1, 20, 1, 0), exchange(2, 19, 2, 1), exchange(3, 18, 3, 2),
          exchange(4, 17, 4, 3), exchange(5, 16, 5, 4), exchange(6, 15, 6, 5), read(21, 22, 6)}},
    };
    for (const Example& example : examples) {
        EXPECT_TRUE(isLinearizable(example.history)) << example.what;
    }
}

TEST(Linearizability, HistoriesWithoutAnOrderAreRefused) {
    const std::vector<Example> examples{
        {"a value that nobody wrote", {read(1, 2, 7)}},
        {"a read of what was replaced", {write(1, 2, 1), write(3, 4, 2), read(5, 6, 1)}},
        {"a read that comes before its write", {read(1, 2, 7), write(3, 4, 7)}},
        {"reads that turn back", {write(1, 10, 7), read(2, 3, 7), read(4, 5, 0)}},
        {"two readers that see two orders",
         {write(1, 20, 1), write(2, 20, 2), read(3, 4, 1), read(5, 6, 2), read(7, 8, 1)}},
        {"two exchanges of the same value", {exchange(1, 4, 1, 0), exchange(2, 3, 2, 0)}},
        {"a lost update", {exchange(1, 6, 1, 0), exchange(2, 5, 2, 1), read(7, 8, 1)}},
        {"a circle of exchanges", {exchange(1, 4, 1, 2), exchange(2, 3, 2, 1)}},
    };
    for (const Example& example : examples) {
        EXPECT_FALSE(isLinearizable(example.history)) << example.what;
    }
}

TEST(Linearizability, WhatComesAfterAnotherInAnyCaseIsKeptInThatOrder) {
    History history{write(1, 10, 7), read(2, 9, 0), read(3, 8, 7)};
    ASSERT_TRUE(isLinearizable(history));
    history[1].after = 2;
    EXPECT_FALSE(isLinearizable(history));
    history[1].after.reset();
    history[2].after = 1;
    EXPECT_TRUE(isLinearizable(history));
}

TEST(Linearizability, OrderOfTheListMeansNothing) {
    EXPECT_TRUE(isLinearizable({read(3, 4, 7), write(1, 2, 7)}));
    EXPECT_FALSE(isLinearizable({write(3, 4, 7), read(1, 2, 7)}));
}

TEST(Linearizability, ComplaintSaysHowFarItGot) {
    EXPECT_EQ(Linearizability<Register>::complaintOf({write(1, 2, 7), read(3, 4, 8)}, Register()),
              "no order of the calls explains the answers\n"
              "these do, as far as any:\n"
              "  [1, 2] write 7 -> done\n"
              "which leaves 7\n"
              "and next should come one of\n"
              "  [3, 4] read -> 8\n");
}

// Twenty writes side by side have more orders than anybody could try.
TEST(Linearizability, EqualSituationsAreVisitedOnce) {
    History history;
    for (std::uint64_t i = 0; i < 14; ++i) history.push_back(write(i, 100, 1));
    history.push_back(read(101, 102, 2));
    EXPECT_FALSE(isLinearizable(history));
}

}  // namespace
}  // namespace velkor::testing
