#include "tests/stress/histories/StoreHistory.hpp"

#include <gtest/gtest.h>

#include <functional>
#include <limits>
#include <string>

namespace velkor::testing {
namespace {

using Kind = StoreCall::Kind;
using Told = Signal::Kind;

constexpr auto all = std::numeric_limits<std::uint64_t>::max();

StoreRecord call(std::size_t thread, std::uint64_t invoked, std::uint64_t responded, Kind kind,
                 const std::string& key, const std::string& answer, int value = 0) {
    StoreRecord record{{{kind, key, value}, answer, invoked, responded}, thread};
    if (kind == Kind::read) {
        record.recorded.call = {Kind::read};
        record.recorded.call.keys = {key};
    }
    return record;
}

Signal told(std::size_t thread, std::uint64_t begun, const std::string& value) {
    return {Told::value, "a", value, std::nullopt, thread, begun, begun + 1};
}

// Two writes by the thread 1, each told to the one watcher inside of it, and the end.
StoreHistory twoWrites() {
    StoreHistory history;
    history.calls = {call(1, 10, 20, Kind::set, "a", "1", 1),
                     call(1, 30, 40, Kind::set, "a", "1", 2),
                     call(0, 50, 51, Kind::getOption, "a", "2@override")};
    WatchLog log{WatchLog::Kind::values, "a", 1, true, all};
    log.signals = {{Told::subscribed, "", "", {}, 0, 2, 3},
                   told(1, 15, "1"),
                   told(1, 35, "2"),
                   {Told::completed, "", "", {}, 0, 60, 61}};
    history.watches = {log};
    return history;
}

// The same, told to a watcher of changes.
StoreHistory twoChanges() {
    StoreHistory history = twoWrites();
    WatchLog& log = history.watches[0];
    log.kind = WatchLog::Kind::changes;
    log.watched = "";
    log.signals[1].text = "1@override";
    log.signals[1].version = 1;
    log.signals[2].text = "2@override";
    log.signals[2].version = 2;
    return history;
}

StoreHistory twoToldWrites() {
    StoreHistory history = twoWrites();
    history.watchersOfAKey = 1;
    return history;
}

TEST(StoreHistoryRules, FaultlessHistoriesAreTaken) {
    EXPECT_EQ(complaintOf(twoWrites()), "");
    EXPECT_EQ(complaintOf(twoChanges()), "");
    EXPECT_EQ(complaintOf(twoToldWrites()), "");
}

struct Fault {
    const char* complaint;  // the beginning
    StoreHistory (*faultless)();
    std::function<void(StoreHistory&, std::vector<Signal>&)> put;
};

const std::vector<Fault> faults{
    {"a watcher of 'a' was not subscribed first, once", twoWrites,
     [](auto&, auto& signals) { std::swap(signals[0], signals[1]); }},
    {"a watcher of 'a' was not subscribed first, once", twoWrites,
     [](auto&, auto& signals) { signals.erase(signals.begin()); }},
    {"a watcher of 'a' was not subscribed first, once", twoWrites,
     [](auto&, auto& signals) { signals.insert(signals.begin(), signals.front()); }},
    {"a watcher of 'a' got more than it asked for", twoWrites,
     [](auto& history, auto&) { history.watches[0].requested = 1; }},
    {"a watcher of 'a' was told of a failure", twoWrites,
     [](auto&, auto& signals) { signals.back().kind = Told::failed; }},
    {"a watcher of 'a' was told of the end 0 times", twoWrites,
     [](auto&, auto& signals) { signals.pop_back(); }},
    {"a watcher of 'a' was told of the end 2 times", twoWrites,
     [](auto&, auto& signals) { signals.push_back(signals.back()); }},
    {"a watcher of 'a' was told more after the end", twoWrites,
     [](auto&, auto& signals) { std::swap(signals[2], signals[3]); }},
    {"a watcher of 'a' was told of the end after a cancel", twoWrites,
     [](auto& history, auto&) { history.watches[0].cancelled = 45; }},
    {"a watcher of 'a' was told something new after a cancel", twoWrites,
     [](auto& history, auto& signals) {
         signals.pop_back();
         history.watches[0].cancelled = 25;
     }},
    {"a watcher of '' was told two things at the same time", twoChanges,
     [](auto&, auto& signals) { signals[1].ended = signals[2].begun + 1; }},
    {"a watcher of '' was told of an older version after a newer one", twoChanges,
     [](auto&, auto& signals) { signals[1].version = 3; }},
    {"a watcher of '' was not told of the end of a", twoChanges,
     [](auto&, auto& signals) { signals.erase(signals.begin() + 2); }},
    {"a watcher of '' was not told of the end of a", twoChanges,
     [](auto&, auto& signals) { signals.erase(signals.begin() + 1, signals.begin() + 3); }},
    {"a watcher of 'a' was not told of the end of a", twoWrites,
     [](auto&, auto& signals) { signals.erase(signals.begin() + 2); }},
    // Told of what was not there at the time.
    {"no order", twoWrites, [](auto&, auto& signals) { signals[1].text = "7"; }},
    {"no order", twoWrites,
     [](auto& history, auto& signals) {
         // A value that had been replaced before the watch began.
         history.watches[0].fromTheStart = false;
         history.watches[0].opened = 45;
         signals.erase(signals.begin() + 2);
         signals[1].begun = 48;
     }},
    {"no order", twoWrites, [](auto&, auto& signals) { signals[2].begun = 29; }},
    {"no order", twoChanges, [](auto&, auto& signals) { signals[1].text = "1@default"; }},
    {"version 1 has two values of a: 1@override and 2@override", twoChanges,
     [](auto& history, auto&) {
         auto reading = call(2, 11, 45, Kind::read, "a", "2@override");
         reading.version = 1;
         history.calls.push_back(reading);
     }},
    {"no order", twoChanges,
     [](auto& history, auto&) {
         auto reading = call(2, 11, 45, Kind::read, "a", "1@override");
         reading.version = 3;
         history.calls.push_back(reading);
     }},
    // Everything must be told inside of the writes, in their order.
    {"of 'a' no order", twoToldWrites,
     [](auto&, auto& signals) { signals.erase(signals.begin() + 1); }},
    {"of 'a' no order", twoToldWrites,
     [](auto&, auto& signals) { signals.insert(signals.begin() + 2, told(1, 17, "1")); }},
    {"of 'a' no order", twoToldWrites, [](auto&, auto& signals) { signals[1].text = "2"; }},
    {"a watcher of 'a' was told outside of a write", twoToldWrites,
     [](auto&, auto& signals) { signals[1].thread = 2; }},
    {"of 'a' no order", twoToldWrites,
     [](auto& history, auto& signals) {
         // Two writes side by side, told in the other order than that of their answers.
         history.calls[0] = call(1, 10, 40, Kind::set, "a", "1", 1);
         history.calls[1] = call(2, 10, 41, Kind::set, "a", "1", 2);
         history.calls[2] = call(0, 50, 51, Kind::getOption, "a", "1@override");
         signals[1] = told(2, 15, "2");
         signals[2] = told(1, 35, "1");
     }},
};

TEST(StoreHistoryRules, EachFaultIsNamed) {
    for (const Fault& fault : faults) {
        StoreHistory history = fault.faultless();
        fault.put(history, history.watches[0].signals);
        const std::string complaint = complaintOf(history);
        EXPECT_EQ(complaint.rfind(fault.complaint, 0), 0U) << fault.complaint << " | " << complaint;
    }
}

TEST(StoreHistoryRules, CallThatBeganBeforeACancelMayStillTell) {
    StoreHistory history = twoWrites();
    history.watches[0].cancelled = 33;
    history.watches[0].signals.pop_back();
    EXPECT_EQ(complaintOf(history), "");
}

}  // namespace
}  // namespace velkor::testing
