#include "http/detail/routes/WriteRecord.hpp"

#include <exception>
#include <utility>

#include "http/detail/Loggers.hpp"
#include "http/detail/routes/Target.hpp"

namespace velkor::http::detail {

namespace {

constexpr std::size_t mostBytes = 1000;

}  // namespace

WriteRecord::WriteRecord(const Call& call) {
    begin.append(call.route->method).append(" ").append(call.route->path);
    begin.append(" by ").append(call.visitor.name);
    begin.append(" from ").append(call.request.client.address);
}

void WriteRecord::add(const std::string& key) {
    std::string name = percentEncoded(key);
    if (keys.size() + name.size() > mostBytes) {
        ++unnamed;
        return;
    }
    keys += keys.empty() ? ": " : ", ";
    keys += name;
}

void WriteRecord::answer(PendingAnswer& pending, Response&& response) const {
    const std::string others =
        unnamed == 0 ? "" : (keys.empty() ? "" : " and ") + std::to_string(unnamed) + " more";
    try {
        logger.write(common::warning, "write: ", begin, keys, others, " -> ", response.status);
    } catch (const std::exception&) {
        // What was done is done, whatever a sink of the log says.
    }
    pending(std::move(response));
}

}  // namespace velkor::http::detail
