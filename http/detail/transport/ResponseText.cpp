#include "http/detail/transport/ResponseText.hpp"

#include <array>
#include <ctime>
#include <utility>

namespace velkor::http::detail::transport {
namespace {

std::string_view reasonOf(int status) {
    static constexpr std::array<std::pair<int, std::string_view>, 23> reasons{{
        {200, "OK"},
        {201, "Created"},
        {202, "Accepted"},
        {204, "No Content"},
        {304, "Not Modified"},
        {400, "Bad Request"},
        {401, "Unauthorized"},
        {403, "Forbidden"},
        {404, "Not Found"},
        {405, "Method Not Allowed"},
        {406, "Not Acceptable"},
        {408, "Request Timeout"},
        {409, "Conflict"},
        {413, "Content Too Large"},
        {415, "Unsupported Media Type"},
        {421, "Misdirected Request"},
        {422, "Unprocessable Content"},
        {429, "Too Many Requests"},
        {431, "Request Header Fields Too Large"},
        {500, "Internal Server Error"},
        {501, "Not Implemented"},
        {503, "Service Unavailable"},
        {504, "Gateway Timeout"},
    }};
    for (const auto& [known, reason] : reasons) {
        if (known == status) return reason;
    }
    return "";
}

constexpr std::string_view streamType = "text/event-stream";

// The head of a stream may be asked for alone; a stream has no length.
bool hasLength(const Response& response) {
    return response.status != 204 && response.status != 304 && response.contentType != streamType;
}

void add(std::string& head, std::string_view name, std::string_view value) {
    head.append(name).append(": ").append(value).append("\r\n");
}

std::string beginning(int status, std::string_view date) {
    constexpr std::size_t usualSize = 320;
    std::string head;
    head.reserve(usualSize);
    head.append("HTTP/1.1 ").append(std::to_string(status)).append(" ");
    head.append(reasonOf(status)).append("\r\n");
    add(head, "Date", date);
    head.append("Cache-Control: no-store\r\nX-Content-Type-Options: nosniff\r\n");
    return head;
}

}  // namespace

std::string headOf(const Response& response, Staying staying, std::string_view date) {
    std::string head = beginning(response.status, date);
    if (!response.contentType.empty()) add(head, "Content-Type", response.contentType);
    for (const auto& [name, value] : response.headers) add(head, name, value);
    if (hasLength(response)) {
        add(head, "Content-Length", std::to_string(response.body.size()));
    }
    if (staying == Staying::none) add(head, "Connection", "close");
    if (staying == Staying::said) add(head, "Connection", "keep-alive");
    head.append("\r\n");
    return head;
}

std::string streamHead(std::string_view date) {
    std::string head = beginning(200, date);
    add(head, "Content-Type", streamType);
    add(head, "X-Accel-Buffering", "no");  // a proxy is to pass on each event at once
    add(head, "Connection", "close");
    head.append("\r\n");
    return head;
}

std::string dateText(long long seconds) {
    static constexpr std::array<const char*, 7> days{"Sun", "Mon", "Tue", "Wed",
                                                     "Thu", "Fri", "Sat"};
    static constexpr std::array<const char*, 12> months{"Jan", "Feb", "Mar", "Apr", "May", "Jun",
                                                        "Jul", "Aug", "Sep", "Oct", "Nov", "Dec"};
    const std::time_t time{seconds};
    std::tm parts{};
    ::gmtime_r(&time, &parts);
    std::array<char, 64> text{};
    // The names of days and months are those of the protocol, whatever the locale.
    const int size = std::snprintf(text.data(), text.size(), "%s, %02d %s %04d %02d:%02d:%02d GMT",
                                   days.at(static_cast<std::size_t>(parts.tm_wday)), parts.tm_mday,
                                   months.at(static_cast<std::size_t>(parts.tm_mon)),
                                   parts.tm_year + 1900, parts.tm_hour, parts.tm_min, parts.tm_sec);
    return {text.data(), static_cast<std::size_t>(size)};
}

}  // namespace velkor::http::detail::transport
