#pragma once

#include <boost/asio/buffer.hpp>
#include <chrono>
#include <cstddef>
#include <exception>
#include <memory>
#include <string>
#include <utility>

#include "http/detail/transport/Budget.hpp"
#include "http/detail/transport/Loop.hpp"
#include "http/detail/transport/Peer.hpp"
#include "http/detail/transport/Shared.hpp"

namespace velkor::http::detail::transport {

/// What every connection does: it writes, closes so that the client can read the last answer, and
/// ends, once, whatever is under way.
///
/// At any time a connection does one thing (`Phase`). An error of the socket, and lack of memory,
/// end this connection only.
///
/// `Wire` is what the bytes go through, see `PlainWire`.
template <class Wire>
class WirePeer : public Peer, public std::enable_shared_from_this<WirePeer<Wire>> {
public:
    void expire() noexcept override {
        attempt([this] { onExpired(); });
    }

    void end() noexcept override {
        if (std::exchange(phase, Phase::ended) == Phase::ended) return;
        release();
        wire.close();
        share.take(0);
        place.reset();
        loop.forget(*this);
    }

protected:
    using Error = boost::system::error_code;
    using Milliseconds = std::chrono::milliseconds;

    enum class Phase {
        greeting,   // the start of TLS
        waiting,    // for the first byte of a request
        reading,    // the rest of it
        inviting,   // writes "100 Continue"
        answering,  // the handler is asked
        sending,    // writes the answer
        streaming,  // event stream, nothing to write
        showing,    // event stream, writes
        leaving,    // lets the client read the answer before it closes
        ended
    };

    WirePeer(Loop& servingLoop, std::shared_ptr<Shared> sharedByAll, Arrival&& arrival,
             Limits::Place&& givenPlace)
        : loop(servingLoop),
          shared(std::move(sharedByAll)),
          share(shared->budget),
          place(std::move(givenPlace)),
          wire(*loop.context(), std::move(arrival), *shared) {}

    /// Called when all that was to be written is.
    virtual void onAllWritten() = 0;

    /// Called when the time of the present phase is up.
    virtual void onExpired() = 0;

    /// Gives up what the connection has beside its wire, before that is closed.
    virtual void release() noexcept = 0;

    const ServerOptions& options() const noexcept { return shared->options; }
    TransportCounts& counts() const noexcept { return *shared->counts; }

    template <class Action>
    void attempt(Action&& action) noexcept {
        try {
            action();
        } catch (...) {
            end();
        }
    }

    /// What follows an operation: `next` of `self`, which is this; keeps the connection until then.
    template <class Self, class... Results>
    auto step(Self& self, void (Self::*next)(const Error&, Results...)) {
        return [&self, keeping = this->shared_from_this(), next](const Error& error,
                                                                 Results... results) {
            keeping->attempt([&] { (self.*next)(error, results...); });
        };
    }

    /// Writes `text`, and then `more`.
    void write(std::string text, std::string more = {}) {
        unwritten = std::move(text);
        rest = std::move(more);
        written = 0;
        writeOn();
    }

    void leave() {
        if (loop.isStopping()) return end();
        phase = Phase::leaving;
        expireAfter(leaveTime);
        wire.sayEnd(step(*this, &WirePeer::onEndSaid));
    }

    Loop& loop;
    const std::shared_ptr<Shared> shared;
    Budget::Share share;  // of the bytes of the present request, answer or event
    Limits::Place place;
    Phase phase = Phase::greeting;
    Wire wire;

private:
    // For a client to go once it has been told so.
    static constexpr Milliseconds leaveTime{2000};

    void writeOn() {
        wire.writeSome(boost::asio::buffer(unwritten) + written, step(*this, &WirePeer::onWritten));
    }

    void onWritten(const Error& error, std::size_t size) {
        if (phase == Phase::ended) return;
        if (error) return end();
        counts().bytesWritten += size;
        written += size;
        if (phase == Phase::showing) expireAfter(options().writeTimeout);
        if (written < unwritten.size()) return writeOn();
        if (!rest.empty()) return write(std::exchange(rest, {}));
        unwritten = {};
        onAllWritten();
    }

    // What the client still sends is read for a while: closing at once could take the answer from
    // it.
    void onEndSaid(const Error& /*error*/) {
        if (phase != Phase::leaving) return;
        wire.endWriting();
        readWaste();
    }

    void readWaste() {
        wire.readRaw(boost::asio::buffer(loop.waste()), step(*this, &WirePeer::onWaste));
    }

    void onWaste(const Error& error, std::size_t /*size*/) {
        if (phase != Phase::leaving) return;
        if (error) return end();
        readWaste();
    }

    std::string unwritten;
    std::size_t written = 0;
    std::string rest;  // follows what is unwritten
};

}  // namespace velkor::http::detail::transport
