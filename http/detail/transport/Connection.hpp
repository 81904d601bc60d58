#pragma once

#include <boost/asio/buffer.hpp>
#include <boost/asio/dispatch.hpp>
#include <boost/asio/post.hpp>
#include <chrono>
#include <exception>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <variant>

#include "http/detail/transport/Loop.hpp"
#include "http/detail/transport/Peer.hpp"
#include "http/detail/transport/ReadBuffer.hpp"
#include "http/detail/transport/RequestParser.hpp"
#include "http/detail/transport/ResponseText.hpp"
#include "http/detail/transport/Shared.hpp"

namespace velkor::http::detail::transport {

/// One client: reads its requests one after the other, writes the answers, shows an event stream.
///
/// At any time it does one thing (`Phase`), and one operation of its socket is under way; beside
/// those of an event stream one that notices that the client goes. An error of the socket, and lack
/// of memory, end this connection only.
///
/// `Wire` is what the bytes go through, see `PlainWire`.
template <class Wire>
class Connection final : public Peer, public std::enable_shared_from_this<Connection<Wire>> {
public:
    /// Without a `place` it tells only that there are too many connections.
    Connection(Loop& servingLoop, std::shared_ptr<Shared> sharedByAll, Arrival&& arrival,
               Limits::Place&& givenPlace)
        : loop(servingLoop),
          shared(std::move(sharedByAll)),
          share(shared->budget),
          client{arrival.from.clientText(), arrival.secure},
          place(std::move(givenPlace)),
          isWelcome(place),
          wire(*loop.context(), std::move(arrival), *shared) {
        if (!isWelcome) place = shared->limits->refusal();
    }

    void begin() noexcept override {
        attempt([this] {
            if (!place) return end();
            expireAfter(options().requestTimeout);
            wire.greet(step(&Connection::greeted));
        });
    }

    void expire() noexcept override {
        attempt([this] { onExpired(); });
    }

    void stop() noexcept override {
        staysOpen = false;
        if (phase != Phase::answering && phase != Phase::sending) end();
    }

    void end() noexcept override {
        if (std::exchange(phase, Phase::ended) == Phase::ended) return;
        feed.reset();
        wire.close();
        share.take(0);
        streamPlace.reset();
        place.reset();
        loop.forget(*this);
    }

private:
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

    // What is needed as long as requests are read, and not for an event stream. Before that it
    // stays: the socket may still have its hands on the buffer.
    struct Reading {
        explicit Reading(const ServerOptions& options)
            : parser(options.maxHeaderBytes, options.maxBodyBytes) {}

        RequestParser parser;
        ReadBuffer buffer;
    };

    // For a client to go once it has been told so.
    static constexpr Milliseconds leaveTime{2000};

    // After which it is looked whether there is room for an event.
    static constexpr Milliseconds roomTime{100};

    // Beyond this size a body is written by itself rather than copied.
    static constexpr std::size_t mostCopied = std::size_t{16} << 10U;

    const ServerOptions& options() const noexcept { return shared->options; }
    TransportCounts& counts() const noexcept { return *shared->counts; }
    bool isStreaming() const noexcept {
        return phase == Phase::streaming || phase == Phase::showing;
    }

    template <class Action>
    void attempt(Action&& action) noexcept {
        try {
            action();
        } catch (const std::exception&) {
            end();
        }
    }

    // What follows an operation; keeps the connection until then.
    template <class... Results>
    auto step(void (Connection::*next)(const Error&, Results...)) {
        return [self = this->shared_from_this(), next](const Error& error, Results... results) {
            self->attempt([&] { ((*self).*next)(error, results...); });
        };
    }

    void greeted(const Error& error) {
        if (error) return end();
        if (!isWelcome) return refuse(503);
        reading = std::make_unique<Reading>(options());
        awaitRequest();
    }

    void awaitRequest() {
        phase = Phase::waiting;
        expireAfter(options().idleTimeout);
        understand();
    }

    // Reads on, or acts on what has been read.
    void understand() {
        auto& [parser, buffer] = *reading;
        if (phase == Phase::waiting && !buffer.bytes().empty()) {
            phase = Phase::reading;
            expireAfter(options().requestTimeout);
        }
        buffer.consume(parser.put(buffer.bytes()));
        switch (parser.state()) {
            case RequestParser::State::refused:
                ++counts().requestsRefused;
                return refuse(parser.refusal());
            case RequestParser::State::complete:
                return answer();
            case RequestParser::State::incomplete:
                return readMore();
        }
    }

    // Reads on if there is nothing against the request so far.
    void readMore() {
        RequestParser& parser = reading->parser;
        if (const Request* const head = parser.takeHead()) {
            Request known = *head;
            known.client = client;
            if (auto objection = shared->handler->objection(known)) {
                staysOpen = false;
                return send(std::move(*objection));
            }
        }
        if (!share.tryTake(parser.bodySize())) {
            ++counts().answersRefused;
            return refuse(503);
        }
        if (parser.takeExpectation()) return invite();
        read();
    }

    void read() {
        ReadBuffer& buffer = reading->buffer;
        const std::size_t room = buffer.makeRoom();
        wire.readSome(boost::asio::buffer(buffer.room(), room), step(&Connection::onRead));
    }

    void onRead(const Error& error, std::size_t size) {
        if (phase != Phase::waiting && phase != Phase::reading) return;
        if (error) return end();
        counts().bytesRead += size;
        reading->buffer.commit(size);
        understand();
    }

    void invite() {
        phase = Phase::inviting;
        write("HTTP/1.1 100 Continue\r\n\r\n");
    }

    void answer() {
        ++counts().requestsRead;
        RequestParser& parser = reading->parser;
        staysOpen = parser.keepsAlive() && !loop.isStopping();
        isHead = parser.isHead();
        isOld = parser.isOld();
        Request request = parser.take();
        request.client = client;
        phase = Phase::answering;
        expireNever();
        shared->handler->handle(
            std::move(request),
            [context = loop.context(), self = this->weak_from_this()](Answer&& answer) {
                boost::asio::dispatch(*context, [self, answer = std::move(answer)]() mutable {
                    // Only here, on its thread, may this be the last reference.
                    const auto connection = self.lock();
                    if (connection) connection->onAnswer(std::move(answer));
                });
            });
    }

    void onAnswer(Answer&& answer) noexcept {
        if (phase != Phase::answering) return;
        attempt([&] {
            if (auto* const response = std::get_if<Response>(&answer)) {
                send(std::move(*response));
            } else {
                show(std::move(std::get<std::unique_ptr<EventFeed>>(answer)));
            }
        });
    }

    void refuse(int status) {
        staysOpen = false;
        send(shared->handler->refusal(status));
    }

    void send(Response&& response) {
        if (!share.tryTake(isHead ? 0 : response.body.size())) {
            ++counts().answersRefused;
            return send(shared->handler->refusal(503));
        }
        const Staying kept = isOld ? Staying::said : Staying::usual;
        std::string text = headOf(response, staysOpen ? kept : Staying::none, loop.date());
        if (!isHead && response.body.size() <= mostCopied) {
            text += response.body;
        } else if (!isHead) {
            rest = std::move(response.body);
        }
        phase = Phase::sending;
        expireAfter(options().writeTimeout);
        write(std::move(text));
    }

    void show(std::unique_ptr<EventFeed>&& events) {
        streamPlace = shared->limits->stream();
        if (!streamPlace) {
            ++counts().streamsRefused;
            events.reset();
            return send(shared->handler->refusal(503));
        }
        staysOpen = false;
        if (isHead) {
            phase = Phase::sending;
            expireAfter(options().writeTimeout);
            return write(streamHead(loop.date()));
        }
        reading.reset();
        feed = std::move(events);
        showText(streamHead(loop.date()));
        feed->start([context = loop.context(), self = this->weak_from_this()] {
            boost::asio::post(*context, [self] {
                const auto connection = self.lock();
                if (connection) connection->onReady();
            });
        });
        wire.awaitClient(step(&Connection::onClient));
    }

    void onReady() noexcept {
        if (phase == Phase::streaming) attempt([this] { showNext(); });
    }

    // The client of a stream has gone, or says what nobody asked for.
    void onClient(const Error& /*error*/) {
        if (isStreaming()) end();
    }

    void showNext() {
        share.take(0);
        waitsForRoom = !shared->budget.hasRoom();
        if (waitsForRoom) {
            phase = Phase::streaming;
            return expireAfter(roomTime);
        }
        std::optional<std::string> event = feed->next();
        if (event) {
            ++counts().eventsWritten;
            share.take(event->size());
            return showText(std::move(*event));
        }
        if (feed->isOver()) {
            feed.reset();
            streamPlace.reset();
            return leave();
        }
        phase = Phase::streaming;
        expireAfter(options().commentInterval);
    }

    void showText(std::string text) {
        phase = Phase::showing;
        expireAfter(options().writeTimeout);
        write(std::move(text));
    }

    void write(std::string text) {
        unwritten = std::move(text);
        written = 0;
        writeOn();
    }

    void writeOn() {
        wire.writeSome(boost::asio::buffer(unwritten) + written, step(&Connection::onWritten));
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

    void onAllWritten() {
        if (phase == Phase::showing) return showNext();
        if (phase == Phase::inviting) {
            phase = Phase::reading;
            return read();
        }
        if (staysOpen) return awaitRequest();
        leave();
    }

    // What the client still sends is read for a while: closing at once could take the answer from
    // it.
    void leave() {
        if (loop.isStopping()) return end();
        phase = Phase::leaving;
        expireAfter(leaveTime);
        wire.sayEnd(step(&Connection::onEndSaid));
    }

    void onEndSaid(const Error& /*error*/) {
        if (phase != Phase::leaving) return;
        wire.endWriting();
        wire.readRaw(boost::asio::buffer(loop.waste()), step(&Connection::onWaste));
    }

    void onWaste(const Error& error, std::size_t /*size*/) {
        if (phase != Phase::leaving) return;
        if (error) return end();
        wire.readRaw(boost::asio::buffer(loop.waste()), step(&Connection::onWaste));
    }

    void onExpired() {
        switch (phase) {
            case Phase::reading:
                ++counts().requestsTimedOut;
                wire.cancel();
                return refuse(408);
            case Phase::streaming:
                if (waitsForRoom) return showNext();
                return showText(": \n\n");
            case Phase::sending:
            case Phase::showing:
                ++counts().writesTimedOut;
                return end();
            default:
                return end();
        }
    }

    Loop& loop;
    const std::shared_ptr<Shared> shared;
    Budget::Share share;  // of the bytes of the present request, answer or event
    const Client client;
    Limits::Place place;
    const bool isWelcome;
    Phase phase = Phase::greeting;
    bool staysOpen = false;
    bool isHead = false;  // of the present request
    bool isOld = false;
    bool waitsForRoom = false;  // of a stream: for that of its next event
    Wire wire;
    std::unique_ptr<Reading> reading;
    std::string unwritten;
    std::size_t written = 0;
    std::string rest;  // follows what is unwritten
    std::unique_ptr<EventFeed> feed;
    Limits::Place streamPlace;
};

}  // namespace velkor::http::detail::transport
