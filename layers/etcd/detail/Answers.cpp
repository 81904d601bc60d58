#include "layers/etcd/detail/Answers.hpp"

#include <cstddef>
#include <limits>
#include <optional>
#include <utility>

#include "layers/etcd/detail/Base64.hpp"
#include "layers/etcd/detail/GatewayErrors.hpp"
#include "layers/etcd/detail/JsonReader.hpp"

namespace velkor::layers::etcd {

namespace {

/// The texts of the engine are shorter.
constexpr std::size_t longestReason = 1000;

std::string readBytes(JsonReader& reader) {
    auto bytes = fromBase64(reader.plainText());
    if (!bytes) throw BadJson("JSON member is no base64");
    return std::move(*bytes);
}

Header readHeader(JsonReader& reader) {
    Header header;
    reader.object([&](std::string_view name) {
        if (name == "cluster_id") {
            header.cluster = reader.text();
        } else if (name == "revision") {
            header.revision = reader.integer();
        } else {
            reader.skip();
        }
    });
    return header;
}

KeyValue readEntry(JsonReader& reader) {
    KeyValue entry;
    reader.object([&](std::string_view name) {
        if (name == "key") {
            entry.key = readBytes(reader);
        } else if (name == "value") {
            entry.value = readBytes(reader);
        } else if (name == "mod_revision") {
            entry.modified = reader.integer();
        } else {
            reader.skip();
        }
    });
    return entry;
}

RangeAnswer readRange(JsonReader& reader) {
    RangeAnswer answer;
    reader.object([&](std::string_view name) {
        if (name == "header") {
            answer.header = readHeader(reader);
        } else if (name == "kvs") {
            reader.array([&] { answer.entries.push_back(readEntry(reader)); });
        } else {
            reader.skip();
        }
    });
    return answer;
}

void readResponse(JsonReader& reader, TransactionAnswer& answer) {
    reader.object([&](std::string_view name) {
        if (name == "response_range") {
            answer.ranges.push_back(readRange(reader));
        } else {
            reader.skip();
        }
    });
}

Event readEvent(JsonReader& reader) {
    Event event;
    reader.object([&](std::string_view name) {
        if (name == "type") {
            event.isRemoval = reader.plainText() == "DELETE";
        } else if (name == "kv") {
            event.entry = readEntry(reader);
        } else {
            reader.skip();
        }
    });
    return event;
}

WatchAnswer readResult(JsonReader& reader) {
    WatchAnswer answer;
    reader.object([&](std::string_view name) {
        if (name == "header") {
            answer.header = readHeader(reader);
        } else if (name == "created") {
            answer.created = reader.boolean();
        } else if (name == "canceled") {
            answer.canceled = reader.boolean();
        } else if (name == "compact_revision") {
            answer.compacted = reader.integer();
        } else if (name == "cancel_reason") {
            answer.reason = reader.text();
        } else if (name == "events") {
            reader.array([&] { answer.events.push_back(readEvent(reader)); });
        } else {
            reader.skip();
        }
    });
    return answer;
}

// Answers call it "code", streams "grpc_code".
ErrorAnswer readError(JsonReader& reader) {
    ErrorAnswer error;
    reader.object([&](std::string_view name) {
        if (name == "code" || name == "grpc_code") {
            error.code = static_cast<int>(reader.integer());
        } else if (name == "message") {
            error.message = reader.text();
        } else {
            reader.skip();
        }
    });
    return error;
}

// Any server answers something.
void requireCluster(const Header& header) {
    const bool isRevision =
        header.revision > 0 && header.revision < std::numeric_limits<std::int64_t>::max();
    if (header.cluster.empty() || !isRevision) throw BadJson("JSON answer is of no cluster");
}

void requirePast(const KeyValue& entry, const Header& header) {
    if (entry.modified > 0 && entry.modified <= header.revision) return;
    throw BadJson("JSON revision makes no sense");
}

/// Reads one text as a whole.
template <class Read>
auto readWhole(std::string_view text, Read read) {
    JsonReader reader(text);
    auto answer = read(reader);
    reader.end();
    return answer;
}

}  // namespace

RangeAnswer readRange(std::string_view text) {
    auto answer = readWhole(text, [](JsonReader& reader) { return readRange(reader); });
    requireCluster(answer.header);
    for (const KeyValue& entry : answer.entries) requirePast(entry, answer.header);
    return answer;
}

TransactionAnswer readTransaction(std::string_view text) {
    auto whole = readWhole(text, [](JsonReader& reader) {
        TransactionAnswer answer;
        reader.object([&](std::string_view name) {
            if (name == "header") {
                answer.header = readHeader(reader);
            } else if (name == "succeeded") {
                answer.succeeded = reader.boolean();
            } else if (name == "responses") {
                reader.array([&] { readResponse(reader, answer); });
            } else {
                reader.skip();
            }
        });
        return answer;
    });
    requireCluster(whole.header);
    return whole;
}

std::string readToken(std::string_view text) {
    return readWhole(text, [](JsonReader& reader) {
        std::string token;
        reader.object([&](std::string_view name) {
            if (name == "token") {
                token = reader.text();
            } else {
                reader.skip();
            }
        });
        return token;
    });
}

WatchAnswer readWatch(std::string_view text) {
    return readWhole(text, [](JsonReader& reader) {
        std::optional<WatchAnswer> answer;
        std::optional<ErrorAnswer> error;
        reader.object([&](std::string_view name) {
            if (name == "result") {
                answer = readResult(reader);
            } else if (name == "error" && reader.isObject()) {
                error = readError(reader);
            } else {
                reader.skip();
            }
        });
        if (error) throw Refused(error->code, error->message);
        if (!answer) throw BadJson("JSON text is no change");
        for (const Event& event : answer->events) requirePast(event.entry, answer->header);
        return std::move(*answer);
    });
}

ErrorAnswer readError(std::string_view text) {
    try {
        auto error = readWhole(text, [](JsonReader& reader) { return readError(reader); });
        if (error.message.size() > longestReason) error.message.clear();
        return error;
    } catch (const BadJson&) {
        return {};
    }
}

}  // namespace velkor::layers::etcd
