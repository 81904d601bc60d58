#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace velkor::layers::etcd {

/// A change that a transaction makes: bytes for a key of the server, or its removal.
struct KeyChange {
    std::string key;
    std::optional<std::string> value{};

    /// Refused unless the key, as this says, is there or not, and was changed last in that revision
    /// or before.
    struct Condition {
        std::int64_t revision;
        bool exists;
    };
    Condition condition{};
};

/// The end of the range of all keys that `prefix` begins.
std::string endOfPrefix(const std::string& prefix);

// The bodies of requests to the gateway.

/// All keys that `prefix` begins.
std::string rangeRequest(const std::string& prefix);

/// One key, as it was in `revision`.
std::string pastRequest(const std::string& key, std::int64_t revision);

/// The changes from `revision` on of keys that `prefix` begins.
std::string watchRequest(const std::string& prefix, std::int64_t revision);

/// A sign of life on the stream.
std::string progressRequest();

/// As many comparisons, or operations, the server takes in one transaction unless told otherwise.
constexpr std::size_t mostInTransaction = 128;

/// All of `changes`, each of another key, or, where a condition isn't met, the keys as they are.
/// The server takes one comparison for each change at least. A key that is to be there and isn't
/// meets the condition, unless a second comparison says so: those are made strictly, and wherever
/// the server takes as many.
std::string transactionRequest(const std::vector<KeyChange>& changes, bool isStrict);

/// Several keys at one moment.
std::string readRequest(const std::vector<std::string>& keys);

std::string authenticationRequest(const std::string& user, const std::string& password);

}  // namespace velkor::layers::etcd
