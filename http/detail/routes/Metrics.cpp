#include "http/detail/routes/Metrics.hpp"

#include <algorithm>

namespace velkor::http::detail {

namespace {

constexpr std::string_view requestCount = "velkor_http_requests_total";
constexpr std::string_view requestSeconds = "velkor_http_request_seconds";

// Without a trip over doubles: what is counted is whole.
std::string seconds(std::uint64_t count, std::uint64_t perSecond) {
    std::string fraction = std::to_string(count % perSecond + perSecond).substr(1);
    while (!fraction.empty() && fraction.back() == '0') fraction.pop_back();
    const std::string whole = std::to_string(count / perSecond);
    return fraction.empty() ? whole : whole + "." + fraction;
}

}  // namespace

void writeMetricHead(std::string& out, std::string_view name, std::string_view type,
                     std::string_view help) {
    out.append("# HELP ").append(name).append(" ").append(help);
    out.append("\n# TYPE ").append(name).append(" ").append(type).append("\n");
}

void writeMetric(std::string& out, std::string_view name, std::string_view type,
                 std::string_view help, std::uint64_t value) {
    writeMetricHead(out, name, type, help);
    out.append(name).append(" ").append(std::to_string(value)).append("\n");
}

std::string labelText(std::string_view text) {
    std::string escaped;
    for (const char character : text) {
        if (character == '\\' || character == '"') escaped += '\\';
        if (character == '\n') {
            escaped += "\\n";
        } else {
            escaped += character;
        }
    }
    return escaped;
}

Metrics::Metrics(const std::vector<std::string>& routeNames) : rows(routeNames.size() + 1) {
    for (std::size_t i = 0; i < routeNames.size(); ++i) rows[i].name = routeNames[i];
    rows.back().name = "none";
}

void Metrics::countRequest(std::size_t route, int status,
                           std::chrono::nanoseconds elapsed) noexcept {
    constexpr auto relaxed = std::memory_order_relaxed;
    Row& row = rows[route];
    const auto* const found = std::find(statuses.begin(), statuses.end() - 1, status);
    row.byStatus[static_cast<std::size_t>(found - statuses.begin())].fetch_add(1, relaxed);
    const auto nanoseconds = static_cast<std::uint64_t>(elapsed.count());
    const auto* const bucket =
        std::lower_bound(bucketEnds.begin(), bucketEnds.end(), nanoseconds / 1000);
    row.buckets[static_cast<std::size_t>(bucket - bucketEnds.begin())].fetch_add(1, relaxed);
    row.nanoseconds.fetch_add(nanoseconds, relaxed);
}

void Metrics::writeRequests(std::string& out) const {
    writeMetricHead(out, requestCount, "counter", "Requests by route and status of the answer.");
    for (const Row& row : rows) {
        for (std::size_t i = 0; i < statuses.size(); ++i) {
            const std::uint64_t count = row.byStatus[i];
            if (count == 0) continue;
            out.append(requestCount).append("{route=\"").append(row.name);
            out.append("\",status=\"").append(std::to_string(statuses[i])).append("\"} ");
            out.append(std::to_string(count)).append("\n");
        }
    }
    writeMetricHead(out, requestSeconds, "histogram", "From the request to its answer, by route.");
    for (const Row& row : rows) writeSeconds(row, out);
}

void Metrics::writeSeconds(const Row& row, std::string& out) {
    const std::string label = "{route=\"" + row.name + "\"";
    std::string lines;
    std::uint64_t count = 0;
    for (std::size_t i = 0; i < row.buckets.size(); ++i) {
        count += row.buckets[i];
        const std::string end = i < bucketEnds.size() ? seconds(bucketEnds[i], 1'000'000) : "+Inf";
        lines.append(requestSeconds).append("_bucket").append(label).append(",le=\"");
        lines.append(end).append("\"} ").append(std::to_string(count)).append("\n");
    }
    if (count == 0) return;
    lines.append(requestSeconds).append("_sum").append(label).append("} ");
    lines.append(seconds(row.nanoseconds, 1'000'000'000)).append("\n");
    lines.append(requestSeconds).append("_count").append(label).append("} ");
    out.append(lines.append(std::to_string(count)).append("\n"));
}

}  // namespace velkor::http::detail
