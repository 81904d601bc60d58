#pragma once

#include <deque>
#include <functional>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <utility>

#include "http/detail/Exchange.hpp"
#include "tests/support/BoundedWait.hpp"

namespace velkor::http::detail::transport {

/// What a test does with an event stream from outside, whatever becomes of the stream.
class FeedControl {
public:
    /// Adds an event, and says so.
    void push(std::string event) {
        change([&] { events.push_back(std::move(event)); });
    }

    /// Adds an event, and has no memory to say so.
    void pushUntold(std::string event) {
        const std::lock_guard<std::mutex> lock(mutex);
        events.push_back(std::move(event));
    }

    /// Ends the stream behind the events that there are.
    void finish() {
        change([&] { isOver = true; });
    }

    /// Open once the stream's connection gave it up.
    velkor::testing::Latch ended;
    /// Open once the stream was started.
    velkor::testing::Latch started;

    /// What the transport gave to say that there is an event; callable at any time.
    std::function<void()> ready() {
        const std::lock_guard<std::mutex> lock(mutex);
        return onReady;
    }

    /// How many events were taken.
    std::size_t taken() {
        const std::lock_guard<std::mutex> lock(mutex);
        return takenEvents;
    }

private:
    friend class ControlledFeed;

    template <class Change>
    void change(Change&& make) {
        std::function<void()> tell;
        {
            const std::lock_guard<std::mutex> lock(mutex);
            make();
            tell = onReady;
        }
        if (tell) tell();
    }

    std::mutex mutex;
    std::deque<std::string> events;
    std::size_t takenEvents = 0;
    bool isOver = false;
    std::function<void()> onReady;
};

class ControlledFeed final : public EventFeed {
public:
    explicit ControlledFeed(std::shared_ptr<FeedControl> controlling)
        : control(std::move(controlling)) {}
    ~ControlledFeed() override { control->ended.countDown(); }

    void start(std::function<void()> onReady) override {
        {
            const std::lock_guard<std::mutex> lock(control->mutex);
            control->onReady = std::move(onReady);
        }
        control->started.countDown();
    }

    std::optional<std::string> next() override {
        const std::lock_guard<std::mutex> lock(control->mutex);
        if (control->events.empty()) return std::nullopt;
        ++control->takenEvents;
        std::string event = std::move(control->events.front());
        control->events.pop_front();
        return event;
    }

    bool isOver() const override {
        const std::lock_guard<std::mutex> lock(control->mutex);
        return control->events.empty() && control->isOver;
    }

private:
    const std::shared_ptr<FeedControl> control;
};

/// Answers as a test says; without a word, by what it was asked: "METHOD TARGET BODY".
class ScriptedHandler final : public Handler {
public:
    using Reply = std::function<void(Answer&&)>;
    using Script = std::function<void(Request&&, Reply)>;

    ScriptedHandler() = default;
    explicit ScriptedHandler(Script told) : script(std::move(told)) {}

    void handle(Request&& request, Reply answer) override {
        if (script) return script(std::move(request), std::move(answer));
        answer(echo(request));
    }

    /// What there is against a request whose target is "/forbidden".
    std::optional<Response> objection(const Request& head) override {
        if (head.target != "/forbidden") return std::nullopt;
        Response response = text("not even its body");
        response.status = 403;
        return response;
    }

    Response refusal(int status) const override {
        Response response;
        response.status = status;
        response.contentType = "text/plain";
        response.body = "refused with " + std::to_string(status);
        return response;
    }

    void stop() noexcept override { stopped.countDown(); }

    static Response echo(const Request& request) {
        return text(request.method + " " + request.target + " " + request.body);
    }

    static Response text(std::string body) {
        Response response;
        response.contentType = "text/plain";
        response.body = std::move(body);
        return response;
    }

    velkor::testing::Latch stopped;

private:
    const Script script;
};

}  // namespace velkor::http::detail::transport
