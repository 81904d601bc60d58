#pragma once

#include <gtest/gtest.h>

#include <chrono>
#include <cstdint>
#include <memory>
#include <string>
#include <thread>
#include <utility>

#include "http/ServerOptions.hpp"
#include "http/detail/transport/Listener.hpp"
#include "tests/http/transport/HttpClient.hpp"
#include "tests/http/transport/ScriptedHandler.hpp"

namespace velkor::http::detail::transport {

/// A listener on a port of its own, and what it counts.
struct Serving {
    explicit Serving(ServerOptions options = {}, ScriptedHandler::Script script = {})
        : handler(std::make_shared<ScriptedHandler>(std::move(script))),
          counts(std::make_shared<TransportCounts>()),
          listener(std::make_unique<Listener>(options, handler, counts)) {}

    std::uint16_t port() const { return listener->endpoints().front().port(); }

    const std::shared_ptr<ScriptedHandler> handler;
    const std::shared_ptr<TransportCounts> counts;
    std::unique_ptr<Listener> listener;
};

/// Whether `condition` holds before the usual patience is over. For what the server counts, which
/// no one is told of.
template <class Condition>
[[nodiscard]] bool eventually(Condition condition) {
    const auto limit = std::chrono::steady_clock::now() + velkor::testing::patience;
    while (!condition()) {
        if (std::chrono::steady_clock::now() > limit) return false;
        std::this_thread::yield();
    }
    return true;
}

/// A script that answers "GET /stream" with a stream that `control` is for, all else by its echo.
inline ScriptedHandler::Script streaming(std::shared_ptr<FeedControl> control) {
    return [control = std::move(control)](Request&& request, const ScriptedHandler::Reply& answer) {
        if (request.target != "/stream") return answer(ScriptedHandler::echo(request));
        answer(std::make_unique<ControlledFeed>(control));
    };
}

}  // namespace velkor::http::detail::transport
