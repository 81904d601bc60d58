#include "layers/etcd/detail/Requests.hpp"

#include <Poco/JSON/Object.h>

#include "layers/etcd/detail/Base64.hpp"
#include "messages/JsonText.hpp"

namespace velkor::layers::etcd {

namespace {

std::string quoted(const std::string& plain) {
    return '"' + plain + '"';
}

std::string bytes(const std::string& content) {
    return quoted(toBase64(content));
}

// Numbers of 64 bits stand in strings.
std::string number(std::int64_t content) {
    return quoted(std::to_string(content));
}

// All keys follow the key of one byte 0, which stands for none here.
std::string rangeOf(const std::string& prefix) {
    const std::string first = prefix.empty() ? std::string(1, '\0') : prefix;
    return R"("key":)" + bytes(first) + R"(,"range_end":)" + bytes(endOfPrefix(prefix));
}

void append(std::string& list, const std::string& element) {
    list += list.empty() ? "" : ",";
    list += element;
}

void appendComparisons(std::string& list, const KeyChange& change, bool isToBeThere) {
    const auto compare = [&](const std::string& comparison) {
        append(list, R"({"key":)" + bytes(change.key) + "," + comparison + "}");
    };
    if (!change.condition.exists) {
        return compare(R"("target":"VERSION","result":"EQUAL","version":"0")");
    }
    compare(R"("target":"MOD","result":"LESS","mod_revision":)" +
            number(change.condition.revision + 1));
    if (isToBeThere) compare(R"("target":"VERSION","result":"GREATER","version":"0")");
}

std::string readOperation(const std::string& key) {
    return R"({"request_range":{"key":)" + bytes(key) + "}}";
}

std::string operationOf(const KeyChange& change) {
    if (!change.value) return R"({"request_delete_range":{"key":)" + bytes(change.key) + "}}";
    return R"({"request_put":{"key":)" + bytes(change.key) + R"(,"value":)" + bytes(*change.value) +
           "}}";
}

}  // namespace

std::string endOfPrefix(const std::string& prefix) {
    std::string end = prefix;
    while (!end.empty() && end.back() == '\xFF') end.pop_back();
    if (end.empty()) return std::string(1, '\0');
    end.back() = static_cast<char>(static_cast<unsigned char>(end.back()) + 1);
    return end;
}

std::string rangeRequest(const std::string& prefix) {
    return "{" + rangeOf(prefix) + "}";
}

std::string pastRequest(const std::string& key, std::int64_t revision) {
    return R"({"key":)" + bytes(key) + R"(,"revision":)" + number(revision) + "}";
}

std::string watchRequest(const std::string& prefix, std::int64_t revision) {
    return R"({"create_request":{)" + rangeOf(prefix) + R"(,"start_revision":)" + number(revision) +
           "}}\n";
}

std::string progressRequest() {
    return "{\"progress_request\":{}}\n";
}

std::string transactionRequest(const std::vector<KeyChange>& changes, bool isStrict) {
    const bool isToBeThere = isStrict || 2 * changes.size() <= mostInTransaction;
    std::string comparisons;
    std::string operations;
    std::string reads;
    for (const KeyChange& change : changes) {
        appendComparisons(comparisons, change, isToBeThere);
        append(operations, operationOf(change));
        append(reads, readOperation(change.key));
    }
    return R"({"compare":[)" + comparisons + R"(],"success":[)" + operations + R"(],"failure":[)" +
           reads + "]}";
}

std::string readRequest(const std::vector<std::string>& keys) {
    std::string operations;
    for (const auto& key : keys) append(operations, readOperation(key));
    return R"({"success":[)" + operations + "]}";
}

std::string authenticationRequest(const std::string& user, const std::string& password) {
    Poco::JSON::Object request;
    request.set("name", user);
    request.set("password", password);
    return messages::renderJson(request);
}

}  // namespace velkor::layers::etcd
