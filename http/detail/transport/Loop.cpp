#include "http/detail/transport/Loop.hpp"

#include <algorithm>
#include <boost/asio/post.hpp>
#include <exception>
#include <utility>

#include "http/detail/Loggers.hpp"
#include "http/detail/transport/Acceptor.hpp"
#include "http/detail/transport/Connections.hpp"
#include "http/detail/transport/ResponseText.hpp"

namespace velkor::http::detail::transport {
namespace {

using std::chrono::milliseconds;

// How long answers that are under way are waited for when the server stops.
constexpr milliseconds stopGrace{500};

// How long what had no memory waits before it is begun again.
constexpr milliseconds shortagePause{10};

// How often the times of the connections are looked at: a small part of the shortest of them.
milliseconds tickInterval(const ServerOptions& options) {
    const auto shortest = std::min({options.requestTimeout, options.writeTimeout,
                                    options.idleTimeout, options.commentInterval});
    return std::clamp(shortest / 16, milliseconds(1), milliseconds(250));
}

// What a sink throws doesn't end the thread either.
void reportShortage(const char* reason) noexcept {
    try {
        logger.write(common::error, "Connections may have been lost: ", reason);
    } catch (...) {
        return;
    }
}

}  // namespace

Loop::Loop(std::shared_ptr<Shared> sharedByAll)
    : shared(std::move(sharedByAll)),
      interval(tickInterval(shared->options)),
      running(std::make_shared<Context>(1)),
      work(boost::asio::make_work_guard(*running)),
      ticker(*running) {}

Loop::~Loop() {
    stop();
    join();
}

void Loop::start() {
    thread.emplace([this] { run(); });
}

// The context is stopped twice: by `stop`, and when nothing is left to do.
void Loop::run() noexcept {
    threadId = std::this_thread::get_id();
    runOn();
    running->restart();
    beginStop();
    runOn();
}

// Runs until the context is stopped. What a handler throws, for lack of memory, ends what it was
// about. What the loop itself waits for is begun again, now and then until that succeeds; the
// connections are served meanwhile.
void Loop::runOn() noexcept {
    bool isShort = false;
    const auto note = [&](const char* reason) {
        if (!std::exchange(isShort, true)) reportShortage(reason);
    };
    while (!running->stopped()) {
        try {
            if (isShort) running->run_for(shortagePause);
            resume();
            isShort = false;
            running->run();
        } catch (const std::exception& error) {
            note(error.what());
        } catch (...) {
            note("unknown error");
        }
    }
}

// Those whose time is up end first: that takes no memory.
void Loop::resume() {
    if (!ticking) tick();
    for (const auto& acceptor : acceptors) acceptor->resume();
}

void Loop::take(Arrival&& arrival, Limits::Place&& place) {
    boost::asio::post(*running,
                      [this, arrival = std::move(arrival), place = std::move(place)]() mutable {
                          admit(std::move(arrival), std::move(place));
                      });
}

void Loop::admit(Arrival&& arrival, Limits::Place&& place) {
    if (isStopping()) return;
    try {
        const auto make = arrival.secure ? tlsConnection : plainConnection;
        const std::shared_ptr<Peer> peer =
            make(*this, shared, std::move(arrival), std::move(place));
        peers.emplace(peer.get(), peer);
        peer->begin();
    } catch (...) {
        ++shared->counts->connectionsRefused;
    }
    if (!peers.empty()) armTicker();
}

void Loop::forget(const Peer& peer) noexcept {
    peers.erase(&peer);
    endIfDone();
}

const std::string& Loop::date() {
    const std::time_t now = std::time(nullptr);
    if (now != dateSecond) {
        dateOfSecond = dateText(now);
        dateSecond = now;
    }
    return dateOfSecond;
}

void Loop::stop() noexcept {
    if (!isAskedToStop.exchange(true)) running->stop();
}

void Loop::join() noexcept {
    if (!thread) return;
    thread.reset();
    // Clients that were handed over at the very end are let go.
    running->restart();
    try {
        running->poll();
    } catch (...) {
        return;  // they go with the context
    }
}

void Loop::beginStop() noexcept {
    stopTime = Peer::Clock::now() + stopGrace;
    for (const auto& acceptor : acceptors) acceptor->close();
    // A peer that ends leaves the others where they are, and goes itself.
    for (auto next = peers.begin(); next != peers.end();) {
        const std::shared_ptr<Peer> peer = (next++)->second;
        peer->stop();
    }
    boost::system::error_code ignored;
    ticker.cancel(ignored);  // its next end is the new time
    endIfDone();
}

void Loop::armTicker() {
    if (ticking) return;
    const auto now = Peer::Clock::now();
    ticker.expires_at(isStopping() ? std::min(*stopTime, now + interval) : now + interval);
    ticker.async_wait([this](const boost::system::error_code&) {
        ticking = false;
        tick();
    });
    ticking = true;
}

void Loop::tick() {
    const auto now = Peer::Clock::now();
    const bool timeIsUp = isStopping() && now >= *stopTime;
    for (auto next = peers.begin(); next != peers.end();) {
        const auto present = next++;
        if (!timeIsUp && now < present->second->dueTime()) continue;
        const std::shared_ptr<Peer> peer = present->second;
        if (timeIsUp) {
            peer->end();
        } else {
            peer->expire();
        }
    }
    if (!peers.empty()) armTicker();
}

void Loop::endIfDone() noexcept {
    if (!isStopping() || !peers.empty()) return;
    work.reset();
    boost::system::error_code ignored;
    ticker.cancel(ignored);
}

}  // namespace velkor::http::detail::transport
