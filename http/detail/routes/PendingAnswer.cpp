#include "http/detail/routes/PendingAnswer.hpp"

#include <utility>

#include "http/detail/routes/Problem.hpp"

namespace velkor::http::detail {

namespace {

int statusOf(const Answer& answer) {
    const auto* const response = std::get_if<Response>(&answer);
    return response == nullptr ? 200 : response->status;
}

}  // namespace

PendingAnswer::PendingAnswer(Function function, std::shared_ptr<Metrics> counts,
                             std::size_t noRoute)
    : give(std::move(function)), metrics(std::move(counts)), route(noRoute) {}

PendingAnswer::~PendingAnswer() {
    if (metrics == nullptr || !give) return;
    try {
        (*this)(problemResponse(ProblemKind::unavailable, "The server is too busy."));
    } catch (...) {
        return;  // nobody is left to be told
    }
}

void PendingAnswer::operator()(Answer&& answer) {
    const Function function = std::exchange(give, nullptr);
    if (!function) return;
    metrics->countRequest(route, statusOf(answer), Clock::now() - begin);
    function(std::move(answer));
}

}  // namespace velkor::http::detail
