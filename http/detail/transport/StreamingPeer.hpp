#pragma once

#include <boost/asio/post.hpp>
#include <memory>
#include <optional>
#include <string>
#include <utility>

#include "http/detail/transport/ResponseText.hpp"
#include "http/detail/transport/WirePeer.hpp"

namespace velkor::http::detail::transport {

/// What a connection does that shows an event stream. An event is asked for when the former one has
/// been written, and when there is room for it; a comment now and then keeps proxies from closing.
/// Beside the writes one operation notices that the client goes.
template <class Wire>
class StreamingPeer : public WirePeer<Wire> {
protected:
    using Base = WirePeer<Wire>;
    using Base::Base;
    using Base::counts;
    using Base::loop;
    using Base::options;
    using Base::phase;
    using Base::share;
    using Base::shared;
    using Base::wire;
    using typename Base::Error;
    using typename Base::Milliseconds;
    using typename Base::Phase;

    /// Takes a place for a stream; false if there is none.
    bool takeStreamPlace() {
        streamPlace = shared->limits->stream();
        if (!streamPlace) ++counts().streamsRefused;
        return static_cast<bool>(streamPlace);
    }

    /// Shows `events`, with the place that was taken.
    void show(std::unique_ptr<EventFeed>&& events) {
        feed = std::move(events);
        showText(streamHead(loop.date()));
        feed->start([context = loop.context(), self = this->weak_from_this()] {
            boost::asio::post(*context, [self] {
                // Only here, on its thread, may this be the last reference.
                const auto connection = self.lock();
                if (connection) static_cast<StreamingPeer&>(*connection).onReady();
            });
        });
        wire.awaitClient(this->step(*this, &StreamingPeer::onClient));
    }

    /// Goes on with the next event, or waits for it.
    void showNext() {
        share.take(0);
        waitsForRoom = !shared->budget.hasRoom();
        if (waitsForRoom) {
            phase = Phase::streaming;
            return this->expireAfter(roomTime);
        }
        std::optional<std::string> event = feed->next();
        if (event) {
            ++counts().eventsWritten;
            share.take(event->size());
            return showText(std::move(*event));
        }
        if (feed->isOver()) {
            release();
            return this->leave();
        }
        phase = Phase::streaming;
        this->expireAfter(options().commentInterval);
    }

    /// The time of the phase `streaming` is up.
    void onSilence() {
        if (waitsForRoom) return showNext();
        showText(": \n\n");
    }

    void release() noexcept override {
        feed.reset();
        streamPlace.reset();
    }

private:
    // After which it is looked whether there is room for an event.
    static constexpr Milliseconds roomTime{100};

    void showText(std::string text) {
        phase = Phase::showing;
        this->expireAfter(options().writeTimeout);
        this->write(std::move(text));
    }

    void onReady() noexcept {
        if (phase == Phase::streaming) this->attempt([this] { showNext(); });
    }

    // The client has gone, or says what nobody asked for.
    void onClient(const Error& /*error*/) {
        if (phase == Phase::streaming || phase == Phase::showing) this->end();
    }

    std::unique_ptr<EventFeed> feed;
    Limits::Place streamPlace;
    bool waitsForRoom = false;
};

}  // namespace velkor::http::detail::transport
