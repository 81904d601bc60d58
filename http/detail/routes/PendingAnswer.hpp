#pragma once

#include <chrono>
#include <cstddef>
#include <functional>
#include <memory>

#include "http/detail/Exchange.hpp"
#include "http/detail/routes/Metrics.hpp"

namespace velkor::http::detail {

/// The answer that a request is owed: given once, and counted. One that is destroyed before says
/// that the service is not available. Moved from, it owes nothing. Used by one thread at a time.
class PendingAnswer {
public:
    using Function = std::function<void(Answer&&)>;

    /// To be given to `function`, and counted by `counts` for what is of no route.
    PendingAnswer(Function function, std::shared_ptr<Metrics> counts, std::size_t noRoute);
    ~PendingAnswer();

    PendingAnswer(PendingAnswer&& other) noexcept = default;
    PendingAnswer& operator=(PendingAnswer&&) = delete;

    /// Counts the answer for the route with that number.
    void belongsTo(std::size_t routeNumber) noexcept { route = routeNumber; }

    /// Owes nothing any more: somebody else answers.
    void withdraw() noexcept { give = nullptr; }

    /// Gives the answer, unless one was given before.
    void operator()(Answer&& answer);

private:
    using Clock = std::chrono::steady_clock;

    Function give;
    std::shared_ptr<Metrics> metrics;
    std::size_t route;
    Clock::time_point begin = Clock::now();
};

}  // namespace velkor::http::detail
