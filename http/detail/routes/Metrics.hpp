#pragma once

#include <array>
#include <atomic>
#include <chrono>
#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace velkor::http::detail {

/// What the service counts of requests and events. Thread-safe without locks: a text that is made
/// meanwhile may show some of a request and not all of it.
class Metrics {
public:
    using Count = std::atomic<std::uint64_t>;

    /// Counts requests by what `routeNames` call their routes; a request of none of them has the
    /// number behind the last one.
    explicit Metrics(const std::vector<std::string>& routeNames);

    /// A request of the route with that number was answered with `status` after `elapsed`.
    void countRequest(std::size_t route, int status, std::chrono::nanoseconds elapsed) noexcept;

    /// The number of requests, and how long they took, as Prometheus reads them.
    void writeRequests(std::string& out) const;

    Count watchesOpen{0};
    Count changeStreamsOpen{0};
    Count valuesDelivered{0};
    Count valuesConflated{0};  ///< Of watches: replaced by a newer value before they were shown.

private:
    /// The statuses that there are; all others count as the last one.
    static constexpr std::array<int, 13> statuses{200, 204, 400, 401, 403, 404, 405,
                                                  408, 409, 413, 422, 503, 500};
    /// Microseconds, each the end of a bucket.
    static constexpr std::array<std::uint64_t, 8> bucketEnds{
        10, 50, 250, 1'000, 10'000, 100'000, 1'000'000, 10'000'000};

    struct Row {
        std::string name;
        std::array<Count, statuses.size()> byStatus{};
        std::array<Count, bucketEnds.size() + 1> buckets{};
        Count nanoseconds{0};
    };

    static void writeSeconds(const Row& row, std::string& out);

    std::vector<Row> rows;
};

/// "name value\n", with what explains it in front: one metric in the text form of Prometheus.
void writeMetric(std::string& out, std::string_view name, std::string_view type,
                 std::string_view help, std::uint64_t value);

/// "# HELP ..." and "# TYPE ..." of the metric `name`.
void writeMetricHead(std::string& out, std::string_view name, std::string_view type,
                     std::string_view help);

/// `text` as the value of a label, without the quotes.
std::string labelText(std::string_view text);

}  // namespace velkor::http::detail
