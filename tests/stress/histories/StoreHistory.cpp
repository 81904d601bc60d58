#include "tests/stress/histories/StoreHistory.hpp"

#include <algorithm>
#include <limits>
#include <map>
#include <sstream>

namespace velkor::testing {

namespace {

using Kind = StoreCall::Kind;

bool begins(const std::string& prefix, const std::string& key) {
    return key.compare(0, prefix.size(), prefix) == 0;
}

bool isTold(const Signal& signal, const StoreRecord& call) {
    return call.thread == signal.thread && call.recorded.invoked < signal.begun &&
           signal.begun < call.recorded.responded;
}

/// The rules for subscribers, looked at in one log.
class WatchRules {
public:
    WatchRules(const WatchLog& watchLog, const StoreHistory& whole)
        : log(watchLog), history(whole) {}

    std::string complaint() const {
        for (const auto rule :
             {&WatchRules::opening, &WatchRules::demand, &WatchRules::ending, &WatchRules::silence,
              &WatchRules::oneAtATime, &WatchRules::versions, &WatchRules::finalValues}) {
            const std::string broken = (this->*rule)();
            if (!broken.empty()) return "a watcher of '" + log.watched + "' " + broken + spelled();
        }
        return "";
    }

private:
    std::size_t count(Signal::Kind kind) const {
        return static_cast<std::size_t>(
            std::count_if(log.signals.begin(), log.signals.end(),
                          [kind](const Signal& signal) { return signal.kind == kind; }));
    }

    std::string opening() const {
        const bool first =
            !log.signals.empty() && log.signals.front().kind == Signal::Kind::subscribed;
        return first && count(Signal::Kind::subscribed) == 1 ? ""
                                                             : "was not subscribed first, once";
    }

    std::string demand() const {
        return count(Signal::Kind::value) <= log.requested ? "" : "got more than it asked for";
    }

    std::string ending() const {
        if (count(Signal::Kind::failed) > 0) return "was told of a failure";
        const std::size_t completions = count(Signal::Kind::completed);
        if (log.cancelled) return completions == 0 ? "" : "was told of the end after a cancel";
        if (completions != 1)
            return "was told of the end " + std::to_string(completions) + " times";
        return log.signals.back().kind == Signal::Kind::completed ? ""
                                                                  : "was told more after the end";
    }

    std::string silence() const {
        if (!log.cancelled) return "";
        for (const Signal& signal : log.signals) {
            const auto isRunning = [&](const StoreRecord& call) {
                return isTold(signal, call) && call.recorded.invoked < *log.cancelled;
            };
            if (signal.begun > *log.cancelled &&
                std::none_of(history.calls.begin(), history.calls.end(), isRunning)) {
                return "was told something new after a cancel";
            }
        }
        return "";
    }

    std::string oneAtATime() const {
        if (log.kind != WatchLog::Kind::changes) return "";
        const auto overlap = std::adjacent_find(
            log.signals.begin(), log.signals.end(),
            [](const Signal& left, const Signal& right) { return right.begun < left.ended; });
        return overlap == log.signals.end() ? "" : "was told two things at the same time";
    }

    std::string versions() const {
        std::map<std::string, std::uint64_t> newest;
        for (const Signal& signal : log.signals) {
            if (!signal.version) continue;
            std::uint64_t& known = newest[signal.key];
            if (*signal.version < known) return "was told of an older version after a newer one";
            known = *signal.version;
        }
        return "";
    }

    std::string finalValues() const {
        const auto all = std::numeric_limits<std::uint64_t>::max();
        if (!log.fromTheStart || log.requested != all || log.cancelled) return "";
        std::map<std::string, std::pair<std::uint64_t, std::string>> newest;
        for (const StoreRecord& call : history.calls) {
            const auto& recorded = call.recorded;
            if (recorded.call.kind != Kind::getOption) continue;
            auto& known = newest[recorded.call.key];
            known = std::max(known, {recorded.invoked, recorded.answer});
        }
        for (const auto& [key, final] : newest) {
            const std::string& option = final.second;
            const bool known = log.kind == WatchLog::Kind::changes ? endsOn(key, option)
                                                                   : hasBeenTold(key, option);
            if (!known) return "was not told of the end of " + key + ": " + option;
        }
        return "";
    }

    bool endsOn(const std::string& key, const std::string& option) const {
        if (!begins(log.watched, key)) return true;
        const auto last = std::find_if(log.signals.rbegin(), log.signals.rend(),
                                       [&](const Signal& signal) { return signal.key == key; });
        return last == log.signals.rend() ? begins("No option", option) : last->text == option;
    }

    bool hasBeenTold(const std::string& key, const std::string& option) const {
        if (key != log.watched || key.find('.') != std::string::npos) return true;
        if (begins("No option", option)) return true;
        const std::string value = option.substr(0, option.find('@'));
        return std::any_of(log.signals.begin(), log.signals.end(),
                           [&](const Signal& signal) { return signal.text == value; });
    }

    std::string spelled() const {
        static const char* const names[] = {"onSubscribe", "onNext", "onComplete", "onError"};
        std::string text = "; opened at " + std::to_string(log.opened);
        if (log.cancelled) text += ", cancelled by " + std::to_string(*log.cancelled);
        for (const Signal& signal : log.signals) {
            text += "\n  [" + std::to_string(signal.begun) + ", " + std::to_string(signal.ended) +
                    "] by thread " + std::to_string(signal.thread) + ": " +
                    names[static_cast<int>(signal.kind)] + " " + signal.key + " " + signal.text;
            if (signal.version) text += " version " + std::to_string(*signal.version);
        }
        return text + "\n";
    }

    const WatchLog& log;
    const StoreHistory& history;
};

/// A delivery is a read of its key at some moment between the beginning of the watch and itself.
std::vector<StoreRecord> deliveriesOf(const std::vector<WatchLog>& watches) {
    std::vector<StoreRecord> reads;
    for (const WatchLog& log : watches) {
        const auto kind = log.kind == WatchLog::Kind::changes ? Kind::getOption : Kind::get;
        for (const Signal& signal : log.signals) {
            if (signal.kind != Signal::Kind::value) continue;
            reads.push_back({{{kind, signal.key}, signal.text, log.opened, signal.begun},
                             signal.thread,
                             signal.version});
        }
    }
    return reads;
}

/// What was told inside of a write is part of its answer. Since it has the store to itself until
/// everybody is told, it comes after the one that was told of before, and before its own telling.
std::string countTold(const WatchLog& log, std::vector<StoreRecord>& calls) {
    std::uint64_t before = 0;
    for (const Signal& signal : log.signals) {
        if (signal.kind != Signal::Kind::value) continue;
        const auto write = std::find_if(calls.begin(), calls.end(), [&](const StoreRecord& call) {
            return !StoreModel::isRead(call.recorded.call) && isTold(signal, call);
        });
        if (write == calls.end())
            return "a watcher of '" + log.watched + "' was told outside of a write\n";
        auto& recorded = write->recorded;
        if (recorded.answer.find(" told ") == std::string::npos) recorded.answer += " told";
        recorded.answer += " " + signal.text;
        recorded.invoked = std::max(recorded.invoked, before);
        before = signal.begun;
    }
    return "";
}

// Only now: a write is found by its own end.
void endWithTheFirstTelling(const WatchLog& log, std::vector<StoreRecord>& calls) {
    for (const Signal& signal : log.signals) {
        for (StoreRecord& call : calls) {
            if (signal.kind != Signal::Kind::value || StoreModel::isRead(call.recorded.call))
                continue;
            if (isTold(signal, call)) call.recorded.responded = signal.begun;
        }
    }
}

/// What a call with a version says of each of its keys.
std::map<std::string, std::string> optionsOf(const Recorded<StoreCall>& recorded) {
    if (recorded.call.kind == Kind::getOption) {
        const bool known = !begins("No option", recorded.answer);
        return {{recorded.call.key, known ? recorded.answer : "-"}};
    }
    std::map<std::string, std::string> options;
    std::istringstream answers(recorded.answer);
    for (const std::string& key : recorded.call.keys) std::getline(answers, options[key], ',');
    return options;
}

std::string complaintOfVersions(const std::vector<StoreRecord>& calls) {
    std::map<std::pair<std::uint64_t, std::string>, std::string> known;
    for (const StoreRecord& call : calls) {
        if (!call.version) continue;
        for (const auto& [key, option] : optionsOf(call.recorded)) {
            const auto entry = known.emplace(std::pair(*call.version, key), option).first;
            if (entry->second == option) continue;
            return "version " + std::to_string(*call.version) + " has two values of " + key + ": " +
                   option + " and " + entry->second + "\n";
        }
    }
    return "";
}

// Of two that have versions, the one with the greater version is the newer one, and those of one
// version are equal.
std::string complaintOfOrder(const std::vector<StoreRecord>& calls, std::size_t watchers) {
    const std::string complaint = complaintOfVersions(calls);
    if (!complaint.empty()) return complaint;
    std::vector<std::size_t> versioned;
    Linearizability<StoreModel>::History history;
    for (const StoreRecord& call : calls) {
        if (call.version) versioned.push_back(history.size());
        history.push_back(call.recorded);
    }
    std::sort(versioned.begin(), versioned.end(), [&](std::size_t left, std::size_t right) {
        return std::pair(*calls[left].version, calls[left].recorded.responded) <
               std::pair(*calls[right].version, calls[right].recorded.responded);
    });
    for (std::size_t i = 1; i < versioned.size(); ++i) {
        history[versioned[i]].after = versioned[i - 1];
    }
    return Linearizability<StoreModel>::complaintOf(std::move(history), StoreModel(watchers));
}

// Keys that no call brings together are looked at one by one, which is faster.
std::string complaintOfWrites(std::vector<StoreRecord> calls, const StoreHistory& history) {
    std::vector<WatchLog> ofChanges;
    for (const WatchLog& log : history.watches) {
        if (log.kind == WatchLog::Kind::changes) {
            ofChanges.push_back(log);
            continue;
        }
        const std::string complaint = countTold(log, calls);
        if (!complaint.empty()) return complaint;
    }
    for (const WatchLog& log : history.watches) {
        if (log.kind == WatchLog::Kind::values) endWithTheFirstTelling(log, calls);
    }
    for (StoreRecord& read : deliveriesOf(ofChanges)) calls.push_back(std::move(read));
    std::map<std::string, std::vector<StoreRecord>> ofKey;
    for (StoreRecord& call : calls) ofKey[call.recorded.call.key].push_back(std::move(call));
    for (const auto& [key, own] : ofKey) {
        const std::string complaint = complaintOfOrder(own, *history.watchersOfAKey);
        if (!complaint.empty()) return "of '" + key + "' " + complaint;
    }
    return "";
}

}  // namespace

std::string complaintOf(const StoreHistory& history) {
    for (const WatchLog& log : history.watches) {
        const std::string complaint = WatchRules(log, history).complaint();
        if (!complaint.empty()) return complaint;
    }
    if (history.watchersOfAKey) return complaintOfWrites(history.calls, history);
    std::vector<StoreRecord> calls = history.calls;
    for (StoreRecord& read : deliveriesOf(history.watches)) calls.push_back(std::move(read));
    return complaintOfOrder(calls, 0);
}

}  // namespace velkor::testing
