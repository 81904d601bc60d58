// Operations on a publisher, with a subscriber, a hook and a continuation that throw, call back and
// give things up, and on a model of it. Both have to leave the same trace.

#include <cstdint>
#include <exception>
#include <functional>
#include <limits>
#include <memory>
#include <optional>
#include <stdexcept>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "framework/reactive_streams/CachedValuePublisher.hpp"
#include "fuzz/Choices.hpp"
#include "fuzz/Finding.hpp"
#include "fuzz/Performer.hpp"
#include "fuzz/Targets.hpp"
#include "fuzz/models/ModelStream.hpp"

namespace velkor::fuzz {
namespace {

using Value = std::string;
using RealStream = reactive_streams::CachedValuePublisher<Value, std::function<void()>>;
using Model = models::ModelStream<Value>;

struct Step;

/// What a callback does beside being noted.
struct Manner {
    bool throws = false;
    std::shared_ptr<const Step> reaction{};
};

/// One thing that is done to a stream: publish, subscribe, request, cancel, complete, fail,
/// (a)waits the end, gives the stream up ("D"), or says how a callback behaves from now on ("m").
struct Step {
    char operation = 'p';
    Value value{};
    std::uint64_t demand = 0;
    std::size_t callback = 0;
    Manner manner{};
};

constexpr std::size_t callbacks = 6;
const std::vector<std::uint64_t> demands{0, 1, 2, 3, std::numeric_limits<std::uint64_t>::max()};

Step readStep(Choices& choices, int depth = 2) {
    Step step;
    step.operation = choices.oneOf("prpsxcfaDm");
    if (step.operation == 'p') step.value = std::to_string(choices.below(10));
    if (step.operation == 'r') step.demand = choices.oneOf(demands);
    if (step.operation != 'm') return step;
    step.callback = choices.below(callbacks);
    step.manner.throws = choices.isOdd();
    if (depth > 0 && choices.isOdd()) {
        step.manner.reaction = std::make_shared<const Step>(readStep(choices, depth - 1));
    }
    return step;
}

/// A stream, real or model, with all that it calls.
template <class Stream>
class System final : public Performer<Step> {
public:
    explicit System(std::uint64_t capacity)
        : stream(std::make_shared<Stream>(capacity, [this] { call(5, "done"); })) {}

    void end() { stream.reset(); }

private:
    class Subscriber final : public reactive_streams::Subscriber<Value> {
    public:
        explicit Subscriber(System& itsSystem) : system(itsSystem) {}

        void onSubscribe(std::weak_ptr<reactive_streams::Subscription> opened) override {
            system.subscription = std::move(opened);
            system.call(0, "subscribed");
        }
        using reactive_streams::Subscriber<Value>::onNext;
        void onNext(Value&& value) override { system.call(1, "gets " + value); }
        void onComplete() override { system.call(2, "completed"); }
        void onError(const std::exception_ptr& error) override {
            system.call(3, "failed " + textOf(error));
        }

    private:
        System& system;
    };

    static std::string textOf(const std::exception_ptr& error) {
        try {
            std::rethrow_exception(error);
        } catch (const std::exception& thrown) {
            return thrown.what();
        }
    }

    // What a callback refers to may be gone behind its reaction.
    void call(std::size_t callback, const std::string& event) {
        note(event);
        const Manner manner = manners[callback];
        if (manner.reaction && reactionsLeft > 0) {
            --reactionsLeft;
            perform(*manner.reaction);
        }
        if (manner.throws) throw std::runtime_error("thrown by the one who is " + event);
    }

    std::string carryOut(const Step& step) override {
        if (step.operation == 'm') {
            manners[step.callback] = step.manner;
            return "";
        }
        if (step.operation == 'r' || step.operation == 'x') return onSubscription(step);
        if (stream == nullptr) return "no stream";
        switch (step.operation) {
            case 'p':
                stream->publish(step.value);
                return "";
            case 's':
                stream->subscribe(std::make_shared<Subscriber>(*this));
                return "";
            case 'c':
                stream->complete();
                return "";
            case 'f':
                stream->fail(std::make_exception_ptr(std::runtime_error("failure")));
                return "";
            case 'a':
                return awaitEnd();
            default:
                stream.reset();
                return "";
        }
    }

    std::string onSubscription(const Step& step) {
        const auto opened = subscription.lock();
        if (opened == nullptr) return "no subscription";
        if (step.operation == 'r') {
            opened->request(step.demand);
        } else {
            opened->cancel();
        }
        return "";
    }

    std::string awaitEnd() {
        auto future = stream->getCompletionFuture();
        future.then([this](auto&& ended) {
            std::string outcome;
            try {
                outcome = ended.get() ? "completed" : "cancelled";
            } catch (const std::exception& error) {
                outcome = error.what();
            }
            call(4, "told of the end: " + outcome);
            return 0;
        });
        return "";
    }

    int reactionsLeft = 12;
    std::vector<Manner> manners = std::vector<Manner>(callbacks);
    std::weak_ptr<reactive_streams::Subscription> subscription{};
    std::shared_ptr<Stream> stream;
};

const Target target("publisher", [](std::string_view input) {
    constexpr int mostSteps = 30;
    Choices choices(input);
    const std::uint64_t capacity = 1 + choices.below(3);
    System<Model> model(capacity);
    System<RealStream> real(capacity);
    expectSameTraces(choices, mostSteps, model, real, [](Choices& next) { return readStep(next); });
});

}  // namespace
}  // namespace velkor::fuzz
