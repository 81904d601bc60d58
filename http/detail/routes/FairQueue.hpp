#pragma once

#include <algorithm>
#include <cstddef>
#include <deque>
#include <functional>
#include <list>
#include <optional>
#include <string>
#include <utility>

namespace velkor::http::detail {

/// Jobs that wait, of several owners who take turns: one that has many waiting doesn't keep the
/// others from theirs. Not thread-safe. Runs and destroys no job.
class FairQueue {
public:
    using Job = std::function<void()>;

    /// A queue with room for `mostWaiting` jobs.
    explicit FairQueue(std::size_t mostWaiting) : most(mostWaiting) {}

    bool empty() const noexcept { return turns.empty(); }

    /// Adds a job of `owner`. Where there is no room gives the job that has to go: the newest one
    /// of whoever has the most waiting, which is this one unless another owner has more.
    std::optional<Job> push(const std::string& owner, Job job) {
        std::optional<Job> loser;
        const auto own = turnOf(owner);
        if (count == most) {
            const auto largest = largestTurn();
            const std::size_t ownCount = own == turns.end() ? 0 : own->jobs.size();
            if (largest == turns.end() || largest->jobs.size() <= ownCount + 1) return job;
            loser = std::move(largest->jobs.back());
            largest->jobs.pop_back();  // not the only one
            --count;
        }
        const auto turn = own == turns.end() ? turns.insert(own, Turn{owner, {}}) : own;
        turn->jobs.push_back(std::move(job));
        ++count;
        return loser;
    }

    /// Takes the job that is next; there is one.
    Job pop() {
        Turn& turn = turns.front();
        Job job = std::move(turn.jobs.front());
        turn.jobs.pop_front();
        --count;
        if (turn.jobs.empty()) {
            turns.pop_front();
        } else {
            turns.splice(turns.end(), turns, turns.begin());
        }
        return job;
    }

private:
    struct Turn {
        std::string owner;
        std::deque<Job> jobs;
    };
    using Turns = std::list<Turn>;

    Turns::iterator turnOf(const std::string& owner) {
        return std::find_if(turns.begin(), turns.end(),
                            [&](const Turn& turn) { return turn.owner == owner; });
    }

    Turns::iterator largestTurn() {
        return std::max_element(turns.begin(), turns.end(), [](const Turn& a, const Turn& b) {
            return a.jobs.size() < b.jobs.size();
        });
    }

    std::size_t most;
    std::size_t count = 0;
    Turns turns;  // the one whose turn is next first
};

}  // namespace velkor::http::detail
