#pragma once

#include <chrono>
#include <cstddef>
#include <filesystem>
#include <string>

namespace velkor::layers {

/// What an `EtcdSource` does when no member has answered by the time that it may take to start.
enum class StartWithoutServer {
    fail,       ///< `open` throws.
    lastKnown,  ///< It starts with the values of `lastKnownFile`; without any, `open` throws.
    empty,      ///< It starts without values.
};

/// How an `EtcdSource` works.
struct EtcdOptions {
    /// How long `open` waits for the values at most, and what it does without them.
    std::chrono::milliseconds startWithin = std::chrono::seconds(5);
    StartWithoutServer withoutServer = StartWithoutServer::fail;

    /// The file that keeps the last known values beside the server, with their revision; empty:
    /// none. Made and replaced by the source, by way of one with ".new" behind its name; for its
    /// owner alone. Each source has a file of its own.
    std::filesystem::path lastKnownFile{};

    /// How long a member may be silent before it is given up, 100 ms at least. It is asked for a
    /// sign of life three times as often.
    std::chrono::milliseconds silence = std::chrono::seconds(3);

    /// How long a write may take: to reach a member, and again until that answers. Behind one of
    /// unknown outcome it may take an attempt to connect longer to be refused.
    std::chrono::milliseconds writeWithin = std::chrono::seconds(5);

    /// The pauses between attempts to connect: the first, doubled each time, up to the longest.
    /// Each is shortened by up to half of it at random.
    std::chrono::milliseconds shortestPause = std::chrono::milliseconds(100);
    std::chrono::milliseconds longestPause = std::chrono::seconds(5);

    /// A write is refused when another has changed the key since this source saw it last. That
    /// holds for every `set` and `unset` of this source; of what `apply` changes together one such
    /// key refuses all. What this source wrote itself it has seen. Where only some writes are to be
    /// compared, a second source of the same prefix makes those.
    bool compareAndSwap = false;

    /// PEM files for endpoints that begin with "https:": who may have signed the certificates of
    /// the members (empty: whom the system trusts), and the certificate and key of this client
    /// (empty: none). Read again for each connection.
    std::string caFile{};
    std::string certificateFile{};
    std::string keyFile{};

    /// The user, and the file whose first line is the password, read whenever the members ask for
    /// it; empty: no user.
    std::string user{};
    std::string passwordFile{};

    /// As many bytes a member may answer at most. One that answers more is given up.
    std::size_t longestAnswer = std::size_t{512} << 20U;
};

}  // namespace velkor::layers
