#pragma once

#include <array>
#include <atomic>
#include <boost/asio/executor_work_guard.hpp>
#include <boost/asio/io_context.hpp>
#include <boost/asio/steady_timer.hpp>
#include <chrono>
#include <ctime>
#include <memory>
#include <optional>
#include <string>
#include <thread>
#include <unordered_map>
#include <utility>
#include <vector>

#include "http/detail/transport/ListeningSocket.hpp"
#include "http/detail/transport/Peer.hpp"
#include "http/detail/transport/Shared.hpp"
#include "layers/OwnThread.hpp"

namespace velkor::http::detail::transport {

class Acceptor;

/// A thread, and the connections that it serves: each is used on this thread only, so none needs a
/// lock. One clock for all of them finds those whose time is up.
///
/// Members are called on the loop's thread unless they say otherwise.
class Loop {
public:
    using Context = boost::asio::io_context;

    explicit Loop(std::shared_ptr<Shared> sharedByAll);

    /// Stops and waits, as `stop` and `join`.
    ~Loop();

    Loop(const Loop&) = delete;
    Loop& operator=(const Loop&) = delete;

    /// What runs on the thread. It may outlive the loop: who has to post from elsewhere shares it.
    const std::shared_ptr<Context>& context() const noexcept { return running; }

    /// Lets `acceptor` work here until the loop stops. Before `start`.
    void accept(std::shared_ptr<Acceptor> acceptor) { acceptors.push_back(std::move(acceptor)); }

    /// Starts the thread; called once. Throws `std::system_error` when the system refuses.
    void start();

    /// Serves a client that has come: with `place`, or, without one, by telling that there are too
    /// many. Thread-safe. May throw `std::bad_alloc`: the client is lost then.
    void take(Arrival&& arrival, Limits::Place&& place);

    /// Gives up its reference to `peer`, which has ended.
    void forget(const Peer& peer) noexcept;

    /// Whether the connections are to end behind their answers.
    bool isStopping() const noexcept { return stopTime.has_value(); }

    /// The present second, for the header Date.
    const std::string& date();

    /// Where bytes go that nobody wants.
    std::array<char, 4096>& waste() noexcept { return wasted; }

    /// Takes no more clients, ends the streams and the idle connections, then, within half a
    /// second, those that are being answered. Thread-safe; needs no memory, and doesn't wait.
    void stop() noexcept;

    /// Waits until all connections have ended, after `stop`. From one other thread at a time, and
    /// after all loops that hand clients over to this one.
    void join() noexcept;

    /// Whether this is the loop's thread. Thread-safe.
    bool runsHere() const noexcept { return std::this_thread::get_id() == threadId; }

private:
    void run() noexcept;
    void runOn() noexcept;
    void resume();
    void admit(Arrival&& arrival, Limits::Place&& place);
    void beginStop() noexcept;
    void armTicker();
    void tick();
    void endIfDone() noexcept;

    const std::shared_ptr<Shared> shared;
    const std::chrono::milliseconds interval;
    const std::shared_ptr<Context> running;
    std::optional<boost::asio::executor_work_guard<Context::executor_type>> work;
    std::vector<std::shared_ptr<Acceptor>> acceptors;
    std::atomic<bool> isAskedToStop{false};
    boost::asio::steady_timer ticker;
    bool ticking = false;
    std::unordered_map<const Peer*, std::shared_ptr<Peer>> peers;
    std::optional<Peer::Clock::time_point> stopTime;
    std::time_t dateSecond = -1;
    std::string dateOfSecond;
    std::array<char, 4096> wasted{};
    std::atomic<std::thread::id> threadId;
    std::optional<layers::OwnThread> thread;
};

}  // namespace velkor::http::detail::transport
