#include "http/detail/transport/Listener.hpp"

#include <algorithm>
#include <utility>

#include "http/Refused.hpp"
#include "http/detail/transport/Acceptor.hpp"
#include "http/detail/transport/ListeningSocket.hpp"
#include "http/detail/transport/Loop.hpp"
#include "http/detail/transport/Shared.hpp"
#include "http/detail/transport/Tls.hpp"

namespace velkor::http::detail::transport {

Listener::Listener(const ServerOptions& options, std::shared_ptr<Handler> handler,
                   std::shared_ptr<TransportCounts> counts)
    : shared(std::make_shared<Shared>(options, std::move(handler), std::move(counts),
                                      tlsContext(options.tlsCertificate, options.tlsKey))) {
    std::vector<std::unique_ptr<ListeningSocket>> sockets;
    for (const std::string& text : options.endpoints) {
        sockets.push_back(std::make_unique<ListeningSocket>(Endpoint(text)));
        bound.push_back(sockets.back()->endpoint());
    }
    for (unsigned count = 0; count < options.threads; ++count) loops.emplace_back(shared);
    turn = loops.begin();
    Loop& home = loops.front();
    for (auto& socket : sockets) {
        const bool secure = shared->tls && !socket->endpoint().isUnix();
        home.accept(std::make_shared<Acceptor>(home, std::move(socket), secure, shared,
                                               [this]() -> Loop& { return nextLoop(); }));
    }
    // The first takes clients as soon as it runs, for all of them.
    std::for_each(loops.rbegin(), loops.rend(), [](Loop& loop) { loop.start(); });
}

Listener::~Listener() {
    stop();
}

Loop& Listener::nextLoop() noexcept {
    Loop& chosen = *turn++;
    if (turn == loops.end()) turn = loops.begin();
    return chosen;
}

bool Listener::stop() noexcept {
    for (Loop& loop : loops) loop.stop();
    for (const Loop& loop : loops) {
        if (loop.runsHere()) return false;
    }
    const common::MutexLock lock(joining);
    for (Loop& loop : loops) loop.join();
    return true;
}

}  // namespace velkor::http::detail::transport
