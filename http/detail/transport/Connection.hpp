#pragma once

#include <boost/asio/buffer.hpp>
#include <boost/asio/dispatch.hpp>
#include <cstddef>
#include <memory>
#include <string>
#include <utility>
#include <variant>

#include "http/detail/transport/ReadBuffer.hpp"
#include "http/detail/transport/RequestParser.hpp"
#include "http/detail/transport/ResponseText.hpp"
#include "http/detail/transport/StreamingPeer.hpp"

namespace velkor::http::detail::transport {

/// One client: reads its requests one after the other and writes the answers, until one of them is
/// an event stream.
template <class Wire>
class Connection final : public StreamingPeer<Wire> {
public:
    /// Without a `place` it tells only that there are too many connections.
    Connection(Loop& servingLoop, std::shared_ptr<Shared> sharedByAll, Arrival&& arrival,
               Limits::Place&& givenPlace)
        : Connection(servingLoop, std::move(sharedByAll),
                     Client{arrival.from.clientText(), arrival.secure}, std::move(arrival),
                     std::move(givenPlace)) {}

    void begin() noexcept override {
        attempt([this] {
            if (!place) return this->end();
            this->expireAfter(options().requestTimeout);
            wire.greet(step(&Connection::greeted));
        });
    }

    void stop() noexcept override {
        staysOpen = false;
        if (phase != Phase::answering && phase != Phase::sending) this->end();
    }

private:
    using Base = StreamingPeer<Wire>;
    using Base::attempt;
    using Base::counts;
    using Base::loop;
    using Base::options;
    using Base::phase;
    using Base::place;
    using Base::share;
    using Base::shared;
    using Base::wire;
    using typename Base::Error;
    using typename Base::Phase;

    // What is needed as long as requests are read, and not for an event stream. Before that it
    // stays: the socket may still have its hands on the buffer.
    struct Reading {
        explicit Reading(const ServerOptions& options)
            : parser(options.maxHeaderBytes, options.maxBodyBytes) {}

        RequestParser parser;
        ReadBuffer buffer;
    };

    // Beyond this size a body is written by itself rather than copied.
    static constexpr std::size_t mostCopied = std::size_t{16} << 10U;

    Connection(Loop& servingLoop, std::shared_ptr<Shared> sharedByAll, Client&& who,
               Arrival&& arrival, Limits::Place&& givenPlace)
        : Base(servingLoop, std::move(sharedByAll), std::move(arrival), std::move(givenPlace)),
          client(std::move(who)),
          isWelcome(place) {
        if (!isWelcome) place = shared->limits->refusal();
    }

    template <class... Results>
    auto step(void (Connection::*next)(const Error&, Results...)) {
        return Base::step(*this, next);
    }

    void greeted(const Error& error) {
        if (error) return this->end();
        if (!isWelcome) return refuse(503);
        reading = std::make_unique<Reading>(options());
        awaitRequest();
    }

    void awaitRequest() {
        phase = Phase::waiting;
        this->expireAfter(options().idleTimeout);
        understand();
    }

    // Reads on, or acts on what has been read.
    void understand() {
        auto& [parser, buffer] = *reading;
        if (phase == Phase::waiting && !buffer.bytes().empty()) {
            phase = Phase::reading;
            this->expireAfter(options().requestTimeout);
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
                isHead = parser.isHead();
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
        if (error) return this->end();
        counts().bytesRead += size;
        reading->buffer.commit(size);
        understand();
    }

    void invite() {
        phase = Phase::inviting;
        this->write("HTTP/1.1 100 Continue\r\n\r\n");
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
        this->expireAfter(options().commentInterval);
        shared->handler->handle(std::move(request), [context = loop.context(),
                                                     self = this->weak_from_this(),
                                                     promise = newPromise()](Answer&& answer) {
            boost::asio::dispatch(*context, [self, promise, answer = std::move(answer)]() mutable {
                // Only here, on its thread, may this be the last reference.
                const auto connection = self.lock();
                if (!connection) return;
                static_cast<Connection&>(*connection).onAnswer(std::move(answer));
            });
        });
    }

    // Whoever is to answer holds a copy of it. That of a request before may still be held.
    const std::shared_ptr<const char>& newPromise() {
        if (promised.use_count() != 1) promised = std::make_shared<const char>();
        return promised;
    }

    // An answer is lost when there is no memory to bring it here.
    void lookForAnswer() {
        if (promised.use_count() > 1) return this->expireAfter(options().commentInterval);
        ++counts().answersRefused;
        refuse(503);
    }

    void onAnswer(Answer&& answer) noexcept {
        if (phase != Phase::answering) return;
        attempt([&] {
            if (auto* const response = std::get_if<Response>(&answer)) {
                send(std::move(*response));
            } else {
                stream(std::move(std::get<std::unique_ptr<EventFeed>>(answer)));
            }
        });
    }

    // Whatever was asked for, and be it unknown.
    void refuse(int status) {
        staysOpen = false;
        isHead = false;
        send(shared->handler->refusal(status));
    }

    void send(Response&& response) {
        if (!share.tryTake(isHead ? 0 : response.body.size())) {
            ++counts().answersRefused;
            return send(shared->handler->refusal(503));
        }
        const Staying kept = isOld ? Staying::said : Staying::usual;
        std::string text = headOf(response, staysOpen ? kept : Staying::none, loop.date());
        std::string more;
        if (!isHead && response.body.size() <= mostCopied) {
            text += response.body;
        } else if (!isHead) {
            more = std::move(response.body);
        }
        phase = Phase::sending;
        this->expireAfter(options().writeTimeout);
        this->write(std::move(text), std::move(more));
    }

    void stream(std::unique_ptr<EventFeed>&& events) {
        if (!this->takeStreamPlace()) {
            events.reset();
            return send(shared->handler->refusal(503));
        }
        staysOpen = false;
        if (isHead) {
            phase = Phase::sending;
            this->expireAfter(options().writeTimeout);
            return this->write(streamHead(loop.date()));
        }
        reading.reset();
        this->show(std::move(events));
    }

    void onAllWritten() override {
        if (phase == Phase::showing) return this->showNext();
        if (phase == Phase::inviting) {
            phase = Phase::reading;
            return read();
        }
        if (staysOpen) return awaitRequest();
        this->leave();
    }

    void onExpired() override {
        switch (phase) {
            case Phase::reading:
                ++counts().requestsTimedOut;
                wire.cancel();
                return refuse(408);
            case Phase::answering:
                return lookForAnswer();
            case Phase::streaming:
                return this->onSilence();
            case Phase::sending:
            case Phase::showing:
                ++counts().writesTimedOut;
                return this->end();
            default:
                return this->end();
        }
    }

    const Client client;
    const bool isWelcome;
    bool staysOpen = false;
    bool isHead = false;  // of the present request
    bool isOld = false;
    std::unique_ptr<Reading> reading;
    std::shared_ptr<const char> promised;  // an answer to the present request
};

}  // namespace velkor::http::detail::transport
