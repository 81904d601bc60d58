#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace velkor::layers::etcd {

/// Which cluster answered, and at which point of its history.
struct Header {
    std::string cluster{};
    std::int64_t revision = 0;
};

/// A key of the server with its bytes.
struct KeyValue {
    std::string key{};
    std::string value{};
    std::int64_t modified = 0;  ///< The revision of its last change.
};

struct RangeAnswer {
    Header header{};
    std::vector<KeyValue> entries{};
};

struct TransactionAnswer {
    Header header{};
    bool succeeded = false;
    std::vector<RangeAnswer> ranges{};  ///< Of those that it read, in their order.
};

struct Event {
    KeyValue entry{};
    bool isRemoval = false;
};

/// What a stream of changes says next.
struct WatchAnswer {
    Header header{};
    bool created = false;
    bool canceled = false;
    std::int64_t compacted = 0;  ///< Not 0: what was to come first is not kept any more.
    std::string reason{};        ///< Why it is canceled.
    std::vector<Event> events{};
};

/// Why a member refused something. The texts are the engine's.
struct ErrorAnswer {
    int code = 2;  ///< As gRPC numbers them; 2: unknown.
    std::string message{};
};

/// These read the answers of the gateway; members of theirs that are not known are ignored. Throw
/// `BadJson`.
RangeAnswer readRange(std::string_view text);
TransactionAnswer readTransaction(std::string_view text);
std::string readToken(std::string_view text);

/// A line of the stream. One that says an error throws `Refused` with it.
WatchAnswer readWatch(std::string_view text);

/// Reads the body of an answer that is none of the above; never throws `BadJson`.
ErrorAnswer readError(std::string_view text);

}  // namespace velkor::layers::etcd
