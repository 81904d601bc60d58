#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <optional>
#include <string>
#include <unordered_set>
#include <utility>
#include <vector>

namespace velkor::testing {

/// A call as a history keeps it: what was asked, what was answered, and a moment before the call
/// and one after it on a clock that all threads share.
template <class Call>
struct Recorded {
    Call call;
    std::string answer;
    std::uint64_t invoked = 0;
    std::uint64_t responded = 0;
    std::optional<std::size_t> after{};  ///< The index of one that took effect before, in any case.
};

/// Whether the calls of a history can be put in an order, each between its two moments, in which a
/// `Model`, which does one after the other, gives the same answers.
///
/// A depth-first search over the calls that may come next, which never visits twice what the same
/// calls have made of the model. Calls that change nothing are taken as soon as they fit: whatever
/// order there is stays one when such a call is moved to the front.
///
/// A `Model` is a value with
///
///     using Call = ...;
///     static bool isRead(const Call&);            // changes nothing
///     std::string read(const Call&) const;        // the answer
///     std::string write(const Call&);             // the answer, and changes the model
///     std::string state() const;                  // equal for equal models only
///     static std::string textOf(const Call&);     // for who reads the complaint
template <class Model>
class Linearizability {
public:
    using Call = typename Model::Call;
    using History = std::vector<Recorded<Call>>;

    /// Looks for an order of `history`, which begins with `initial`. Nothing, or how far it got.
    static std::string complaintOf(History history, const Model& initial) {
        return Linearizability(std::move(history)).searchFrom(initial);
    }

private:
    // So many different situations that the search is given up: far more than an order takes.
    static constexpr std::size_t mostSituations = 1'000'000;

    struct Situation {
        std::vector<std::size_t> order;
        std::vector<std::size_t> next;
        Model model;
    };

    explicit Linearizability(History recorded) : calls(sorted(std::move(recorded))) {
        placed.assign(calls.size(), '0');
    }

    // By the moment of the call; the indices of `after` follow.
    static History sorted(History history) {
        std::vector<std::size_t> order(history.size());
        for (std::size_t i = 0; i < order.size(); ++i) order[i] = i;
        std::sort(order.begin(), order.end(), [&](std::size_t left, std::size_t right) {
            return history[left].invoked < history[right].invoked;
        });
        std::vector<std::size_t> place(history.size());
        for (std::size_t i = 0; i < order.size(); ++i) place[order[i]] = i;
        History result;
        for (const std::size_t index : order) {
            result.push_back(std::move(history[index]));
            if (result.back().after) result.back().after = place[*result.back().after];
        }
        return result;
    }

    std::string searchFrom(const Model& initial) {
        if (search(initial)) return "";
        return (seen.size() < mostSituations ? "no order of the calls explains the answers"
                                             : "no order of the calls found") +
               textOf(*furthest);
    }

    bool search(const Model& model) {
        const std::size_t before = order.size();
        placeReads(model);
        if (order.size() == calls.size()) return true;
        noteHowFar(model);
        if (seen.size() < mostSituations && seen.insert(placed + model.state()).second &&
            searchWrites(model)) {
            return true;
        }
        while (order.size() > before) takeBack();
        return false;
    }

    bool searchWrites(const Model& model) {
        auto candidates = mayComeNext();
        // The one that ended first came first, as a rule.
        std::sort(candidates.begin(), candidates.end(), [&](std::size_t left, std::size_t right) {
            return calls[left].responded < calls[right].responded;
        });
        for (const std::size_t index : candidates) {
            if (Model::isRead(calls[index].call)) continue;
            Model next = model;
            if (next.write(calls[index].call) != calls[index].answer) continue;
            place(index);
            if (search(next)) return true;
            takeBack();
            if (next.state() == model.state()) return false;
        }
        return false;
    }

    void placeReads(const Model& model) {
        for (bool progress = true; progress;) {
            progress = false;
            for (const std::size_t index : mayComeNext()) {
                const auto& recorded = calls[index];
                if (!Model::isRead(recorded.call)) continue;
                if (model.read(recorded.call) != recorded.answer) continue;
                place(index);
                progress = true;
            }
        }
    }

    // Those that had begun before any other one that is left had ended.
    std::vector<std::size_t> mayComeNext() const {
        std::vector<std::size_t> found;
        auto firstEnd = std::numeric_limits<std::uint64_t>::max();
        for (std::size_t i = 0; i < calls.size() && calls[i].invoked < firstEnd; ++i) {
            if (isPlaced(i)) continue;
            firstEnd = std::min(firstEnd, calls[i].responded);
            if (!calls[i].after || isPlaced(*calls[i].after)) found.push_back(i);
        }
        return found;
    }

    bool isPlaced(std::size_t index) const { return placed[index] == '1'; }

    void place(std::size_t index) {
        placed[index] = '1';
        order.push_back(index);
    }

    void takeBack() {
        placed[order.back()] = '0';
        order.pop_back();
    }

    void noteHowFar(const Model& model) {
        if (furthest && order.size() < furthest->order.size()) return;
        furthest = Situation{order, mayComeNext(), model};
    }

    std::string textOf(const Situation& situation) const {
        std::string text = "\nthese do, as far as any:\n";
        for (const std::size_t index : situation.order) text += textOf(index);
        text += "which leaves " + situation.model.state() + "\nand next should come one of\n";
        for (const std::size_t index : situation.next) text += textOf(index);
        return text;
    }

    std::string textOf(std::size_t index) const {
        const auto& recorded = calls[index];
        return "  [" + std::to_string(recorded.invoked) + ", " +
               std::to_string(recorded.responded) + "] " + Model::textOf(recorded.call) + " -> " +
               recorded.answer + "\n";
    }

    const History calls;  // by the moment of the call
    std::string placed;   // '1' for each call that has its place in the order
    std::vector<std::size_t> order;
    std::unordered_set<std::string> seen;
    std::optional<Situation> furthest;
};

}  // namespace velkor::testing
