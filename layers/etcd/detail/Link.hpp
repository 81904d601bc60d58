#pragma once

#include <openssl/types.h>

#include <boost/asio/buffer.hpp>
#include <boost/asio/error.hpp>
#include <boost/system/error_code.hpp>
#include <boost/system/system_error.hpp>

#include <chrono>
#include <cstddef>
#include <memory>

#include "layers/etcd/EtcdOptions.hpp"
#include "layers/etcd/detail/Endpoint.hpp"
#include "layers/etcd/detail/Stop.hpp"

namespace velkor::layers::etcd {

/// A connection to an endpoint, over TLS where that says so. A stream that Beast reads from and
/// writes to: no call takes longer than the deadline, and all end by `Stopped` with the source.
///
/// For one thread. What was read up to a deadline isn't lost: the next call goes on.
class Link {
public:
    using Time = std::chrono::steady_clock::time_point;

    /// Connects by `deadline`, but that looking a host name up takes as long as the system lets it.
    /// Throws `Unreachable` with the reason. `stop` outlives this.
    Link(const Endpoint& endpoint, const EtcdOptions& options, const Stop& stop, Time deadline);
    ~Link();

    Link(const Link&) = delete;
    Link& operator=(const Link&) = delete;

    void setDeadline(Time end) { deadline = end; }

    /// Whether the other side has ended the connection, or said something unasked.
    bool isDisturbed();

    // A SyncReadStream and SyncWriteStream.

    template <class Buffers>
    std::size_t read_some(const Buffers& buffers, boost::system::error_code& error) {
        const boost::asio::mutable_buffer buffer = firstOf<boost::asio::mutable_buffer>(buffers);
        return read(buffer.data(), buffer.size(), error);
    }

    template <class Buffers>
    std::size_t write_some(const Buffers& buffers, boost::system::error_code& error) {
        const boost::asio::const_buffer buffer = firstOf<boost::asio::const_buffer>(buffers);
        return write(buffer.data(), buffer.size(), error);
    }

    template <class Buffers>
    std::size_t read_some(const Buffers& buffers) {
        boost::system::error_code error;
        const std::size_t size = read_some(buffers, error);
        if (error) throw boost::system::system_error(error);
        return size;
    }

    template <class Buffers>
    std::size_t write_some(const Buffers& buffers) {
        boost::system::error_code error;
        const std::size_t size = write_some(buffers, error);
        if (error) throw boost::system::system_error(error);
        return size;
    }

private:
    /// The first of `buffers` that has room or content.
    template <class Buffer, class Buffers>
    static Buffer firstOf(const Buffers& buffers) {
        for (auto each = boost::asio::buffer_sequence_begin(buffers);
             each != boost::asio::buffer_sequence_end(buffers); ++each) {
            const Buffer buffer = *each;
            if (buffer.size() > 0) return buffer;
        }
        return {};
    }

    void secure(const Endpoint& endpoint, const EtcdOptions& options);
    std::size_t read(void* target, std::size_t size, boost::system::error_code& error);
    std::size_t write(const void* content, std::size_t size, boost::system::error_code& error);

    /// Calls `attempt` until it gives a size, or waits for what it says.
    template <class Attempt>
    std::size_t untilDone(Attempt attempt, short events, boost::system::error_code& error);

    const Stop& stop;
    Time deadline;
    const int socket;
    std::unique_ptr<SSL, void (*)(SSL*)> tls;
};

}  // namespace velkor::layers::etcd
