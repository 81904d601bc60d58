// Futures and streams: what foreign code throws, and what memory alone can't show. Their shortages
// of memory, one by one, are in FutureWithoutMemory_test.cpp and
// CachedValuePublisherMemory_test.cpp.

#include <filesystem>
#include <fstream>
#include <iterator>
#include <stdexcept>

#include "framework/Future.hpp"
#include "framework/common/TextConversion.hpp"
#include "framework/common/WidePathInputFileStream.hpp"
#include "framework/reactive_streams/CachedValuePublisher.hpp"
#include "framework/reactive_streams/CallbackSubscriber.hpp"
#include "framework/reactive_streams/ConflatingPublisher.hpp"
#include "tests/failing/Failing.hpp"
#include "tests/failing/Foreign.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::testing {
namespace {

using common::TextConversion;
using reactive_streams::CachedValuePublisher;
using reactive_streams::Callbacks;
using reactive_streams::ConflatingPublisher;
using reactive_streams::Demand;
using reactive_streams::SubscriptionHandle;

// ---- Futures of a value whose moves and copies are foreign code

class Brittle {
public:
    explicit Brittle(int given) : number(given) {}
    Brittle(const Brittle& other) : number(other.number) { foreignCall(); }
    Brittle(Brittle&& other) : number(other.number) { foreignCall(); }  // NOLINT: it throws
    Brittle& operator=(const Brittle&) = delete;
    Brittle& operator=(Brittle&&) = delete;
    ~Brittle() = default;

    int number;
};

constexpr int answer = 42;

/// What is in a future: its number, or 0 where it failed as a trial does.
int numberIn(Future<Brittle>& future) {
    try {
        return future.get().number;
    } catch (const std::bad_alloc&) {
        return 0;
    } catch (const ForeignFailure&) {
        return 0;
    }
}

void makeAReadyFuture(Trial& trial) {
    Future<Brittle> future;
    if (trial.passes([&] { future = makeReadyFuture(Brittle(answer)); })) {
        EXPECT_EQ(numberIn(future), answer);
    } else {
        EXPECT_FALSE(future.valid());
    }
}

void setAValue(Trial& trial) {
    Promise<Brittle> promise;
    Future<Brittle> future = promise.getFuture();
    if (!trial.passes([&] { promise.setValue(Brittle(answer)); })) {
        promise.setValue(Brittle(answer));
    }
    EXPECT_EQ(numberIn(future), answer);
}

// The result is taken whatever becomes of it, and a second call says so.
void getAValue(Trial& trial) {
    Future<Brittle> future = makeReadyFuture(Brittle(answer));
    trial.passes([&] { EXPECT_EQ(future.get().number, answer); });
    EXPECT_THROW(future.get(), std::runtime_error);
}

Brittle addOne(Future<Brittle>&& result) {
    foreignCall();
    return Brittle(result.get().number + 1);
}

void attachToAReadyFuture(Trial& trial) {
    Future<Brittle> future = makeReadyFuture(Brittle(answer));
    Future<Brittle> next;
    if (!trial.passes([&] { next = future.then(addOne); })) {
        EXPECT_EQ(numberIn(future), answer);
        return;
    }
    EXPECT_EQ(numberIn(next), trial.hasStruck() ? 0 : answer + 1);
}

void attachToAPendingFuture(Trial& trial) {
    Promise<Brittle> promise;
    Future<Brittle> future = promise.getFuture();
    Future<Brittle> next;
    const auto attach = [&] { next = future.then(addOne); };
    if (!trial.passes(attach)) attach();
    promise.setValue(Brittle(answer));
    EXPECT_EQ(numberIn(next), answer + 1);
}

void runAChain(Trial& trial) {
    Promise<Brittle> promise;
    Future<Brittle> last = promise.getFuture().then(addOne).then(addOne).then(addOne);
    const auto resolve = [&] { promise.setValue(Brittle(answer)); };
    const bool passed = trial.passes(resolve);
    if (!passed) resolve();
    const bool failedInside = passed && trial.hasStruck();
    EXPECT_EQ(numberIn(last), failedInside ? 0 : answer + 3);
}

void failAChain(Trial& trial) {
    Promise<Brittle> promise;
    Future<Brittle> last = promise.getFuture().then(addOne).then(addOne);
    const auto error = std::make_exception_ptr(std::invalid_argument("reason"));
    EXPECT_TRUE(trial.passes([&] { promise.setException(error); }));
    EXPECT_ANY_THROW(last.get());
}

// Callables of futures are destroyed without memory, however long the chain.
void breakAChain(Trial& trial) {
    auto promise = std::make_unique<Promise<Brittle>>();
    Future<Brittle> last = promise->getFuture().then(addOne).then(addOne);
    EXPECT_TRUE(trial.passes([&] { promise.reset(); }));
    EXPECT_ANY_THROW(last.get());
}

void cancelAChain(Trial& trial) {
    Promise<Brittle> promise;
    Future<Brittle> first = promise.getFuture();
    Future<Brittle> last = first.then(addOne).then(addOne);
    EXPECT_TRUE(trial.passes([&] { first.cancel(); }));
    EXPECT_ANY_THROW(last.get());
}

// ---- Streams

struct KeyOfText {
    const std::string& operator()(const std::string& value) const noexcept { return value; }
};

/// A stream with a subscriber, a hook and a continuation of its end, each of which can fail.
template <class Stream>
class Streaming {
public:
    template <class... Arguments>
    explicit Streaming(Arguments... arguments)
        : stream(std::make_shared<Stream>(arguments..., [this] {
              ++endings;
              foreignCall();
          })) {}

    void subscribe() { stream->subscribe(subscriber); }

    void followEnd() {
        followed = stream->getCompletionFuture().then([](Future<bool>&& result) {
            foreignCall();
            return result.get();
        });
    }

    /// All were told of the end, once: no lock is held, and nothing is delivered any more.
    void expectEnd(int completions, int errors) {
        EXPECT_EQ(endings, 1);
        EXPECT_EQ(subscriber->completions, completions);
        EXPECT_EQ(subscriber->errors, errors);
        onAnotherThread([this] { stream->complete(); });
        EXPECT_EQ(endings, 1);
    }

    std::shared_ptr<ForeignSubscriber<std::string>> subscriber =
        std::make_shared<ForeignSubscriber<std::string>>();
    std::shared_ptr<Stream> stream;
    Future<bool> followed;
    int endings = 0;
};

using Hook = std::function<void()>;
using Cached = CachedValuePublisher<std::string, Hook>;
using Conflating = ConflatingPublisher<std::string, KeyOfText, Hook>;

constexpr std::uint64_t capacity = 4;

// A value that did not arrive because its delivery failed is not delivered again.
void publishAValue(Trial& trial) {
    Streaming<Cached> scene(capacity);
    scene.subscribe();
    const std::string value = longText("value");
    trial.passes([&] { scene.stream->publish(value); });
    const int before = scene.subscriber->values;
    scene.stream->publish(value);
    EXPECT_EQ(scene.subscriber->values, before + 1);
}

void publishAFirstValue(Trial& trial) {
    Streaming<Cached> scene(capacity);
    const std::string value = longText("value");
    const auto keep = [&] { scene.stream->publishFirst(value); };
    if (!trial.passes(keep)) keep();
    scene.subscribe();
    EXPECT_EQ(scene.subscriber->values, 1);
}

// A throwing `onNext` ends the draining; what is left comes with the next request or value.
void requestWhatIsKept(Trial& trial) {
    Streaming<Cached> scene(capacity);
    scene.subscriber = std::make_shared<ForeignSubscriber<std::string>>(0);
    scene.subscribe();
    for (int i = 0; i < 3; ++i) scene.stream->publish(longText("value"));
    trial.passes([&] { scene.subscriber->subscription.lock()->request(everything); });
    scene.subscriber->subscription.lock()->request(1);
    EXPECT_EQ(scene.subscriber->values, 3);
    scene.stream->publish(longText("value"));
    EXPECT_EQ(scene.subscriber->values, 4);
}

template <class Scene>
void fill(Scene& scene) {
    if constexpr (std::is_same_v<Scene, Streaming<Cached>>) {
        scene.stream->publish(longText("value"));
    } else {
        scene.stream->keep({longText("value")});
        scene.stream->deliver();
    }
}

template <class Scene>
void trySubscribe(Trial& trial, Scene&& scene) {
    fill(scene);
    const bool passed = trial.passes([&] { scene.subscribe(); });
    // What the subscriber itself has thrown does not undo the subscription.
    if (!passed && scene.subscriber->subscription.expired()) scene.subscribe();
    fill(scene);
    EXPECT_GE(scene.subscriber->values, 1);
}

template <class Scene>
void tryCompletionFuture(Trial& trial, Scene&& scene) {
    const auto follow = [&] { scene.followEnd(); };
    scene.subscribe();
    if (!trial.passes(follow) && !scene.followed.valid()) {
        // The continuation could not be attached; the stream ends all the same.
        scene.stream->complete();
        return scene.expectEnd(1, 0);
    }
    scene.stream->complete();
    scene.expectEnd(1, 0);
}

template <class Scene>
void tryComplete(Trial& trial, Scene&& scene) {
    scene.subscribe();
    scene.followEnd();
    trial.passes([&] { scene.stream->complete(); });
    scene.expectEnd(1, 0);
    EXPECT_NO_THROW(trial.hasStruck() ? true : scene.followed.get());
}

template <class Scene>
void tryFail(Trial& trial, Scene&& scene) {
    scene.subscribe();
    scene.followEnd();
    const auto error = std::make_exception_ptr(std::runtime_error("reason"));
    trial.passes([&] { scene.stream->fail(error); });
    scene.expectEnd(0, 1);
    EXPECT_ANY_THROW(scene.followed.get());
}

template <class Scene>
void tryCancel(Trial& trial, Scene&& scene) {
    scene.subscribe();
    scene.followEnd();
    trial.passes([&] { scene.subscriber->subscription.lock()->cancel(); });
    scene.expectEnd(0, 0);
}

template <class Scene>
void tryDestroy(Trial& trial, Scene&& scene) {
    scene.subscribe();
    scene.followEnd();
    EXPECT_TRUE(trial.passes([&] { scene.stream.reset(); }));
    EXPECT_EQ(scene.endings, 1);
    EXPECT_EQ(scene.subscriber->completions, 1);
}

template <void (*run)(Trial&, Streaming<Cached>&&)>
void cached(Trial& trial) {
    run(trial, Streaming<Cached>(capacity));
}

void conflatingKeep(Trial& trial) {
    Streaming<Conflating> scene;
    scene.subscribe();
    std::list<std::string> value{longText("value")};
    const bool kept = trial.passes([&] { scene.stream->keep(std::move(value)); });
    scene.stream->deliver();
    EXPECT_EQ(scene.subscriber->values, kept ? 1 : 0);
    scene.stream->keep({longText("other")});
    scene.stream->deliver();
    EXPECT_EQ(scene.subscriber->values, kept ? 2 : 1);
}

void conflatingKeepOfAKnownKey(Trial& trial) {
    Streaming<Conflating> scene;
    scene.subscriber = std::make_shared<ForeignSubscriber<std::string>>(0);
    scene.subscribe();
    scene.stream->keep({longText("value")});
    std::list<std::string> value{longText("value")};
    trial.passes([&] { scene.stream->keep(std::move(value)); });
    scene.subscriber->subscription.lock()->request(everything);
    EXPECT_EQ(scene.subscriber->values, 1);
}

void conflatingDeliver(Trial& trial) {
    Streaming<Conflating> scene;
    scene.subscribe();
    for (const char* name : {"a", "b", "c"}) scene.stream->keep({longText(name)});
    trial.passes([&] { scene.stream->deliver(); });
    while (scene.subscriber->values < 3) scene.stream->deliver();
    EXPECT_EQ(scene.subscriber->values, 3);
}

void makeAConflatingStream(Trial& trial) {
    std::shared_ptr<Conflating> stream;
    const bool made = trial.passes([&] { stream = std::make_shared<Conflating>([] {}); });
    EXPECT_EQ(stream != nullptr, made);
}

template <void (*run)(Trial&, Streaming<Conflating>&&)>
void conflating(Trial& trial) {
    run(trial, Streaming<Conflating>());
}

// ---- Callbacks

template <Demand demand>
void subscribeCallbacks(Trial& trial) {
    Streaming<Cached> scene(capacity);
    fill(scene);
    int values = 0;
    SubscriptionHandle watch;
    const bool passed = trial.passes([&] {
        Callbacks<std::string> callbacks;
        callbacks.onValue = [&](const std::string&) {
            ++values;
            foreignCall();
        };
        callbacks.onComplete = foreignCall;
        watch =
            reactive_streams::subscribe<std::string>(*scene.stream, std::move(callbacks), demand);
    });
    if (passed) {
        fill(scene);
        EXPECT_EQ(values, 2);
        scene.stream->complete();
        EXPECT_EQ(scene.endings, 1);
        return;
    }
    // Nobody has the handle: the stream has been cancelled, or has no subscriber yet.
    const int before = values;
    fill(scene);
    EXPECT_EQ(values, before);
    scene.stream.reset();
    EXPECT_EQ(scene.endings, 1);
}

template <Demand demand>
void tellCallbacks(Trial& trial) {
    Streaming<Cached> scene(capacity);
    int values = 0;
    int ends = 0;
    Callbacks<std::string> callbacks;
    callbacks.onValue = [&](const std::string&) {
        ++values;
        foreignCall();
    };
    callbacks.onComplete = [&] {
        ++ends;
        foreignCall();
    };
    const SubscriptionHandle watch =
        reactive_streams::subscribe<std::string>(*scene.stream, std::move(callbacks), demand);
    trial.passes([&] { scene.stream->publish(longText("value")); });
    const int before = values;
    fill(scene);
    EXPECT_EQ(values, before + 1);
    scene.stream->complete();
    EXPECT_EQ(ends, 1);
}

void cancelAHandle(Trial& trial) {
    Streaming<Cached> scene(capacity);
    SubscriptionHandle watch =
        reactive_streams::subscribe<std::string>(*scene.stream, {[](const std::string&) {}});
    scene.followEnd();
    trial.passes([&] { watch.cancel(); });
    EXPECT_EQ(scene.endings, 1);
    onAnotherThread([&] { scene.stream->complete(); });
    EXPECT_EQ(scene.endings, 1);
}

void destroyAHandle(Trial& trial) {
    Streaming<Cached> scene(capacity);
    SubscriptionHandle watch =
        reactive_streams::subscribe<std::string>(*scene.stream, {[](const std::string&) {}});
    scene.followEnd();
    EXPECT_TRUE(trial.passes([&] { watch = SubscriptionHandle(); }));
    EXPECT_EQ(scene.endings, 1);
}

// ---- Texts and files

const std::u16string wide(100, u'\u00e4');

void convertToUtf8(Trial& trial) {
    std::string text;
    if (trial.passes([&] { text = TextConversion("UTF-8").fromUtf16(wide); })) {
        EXPECT_EQ(text.size(), 2 * wide.size());
    }
}

void convertToUtf16(Trial& trial) {
    const std::string narrow = TextConversion("UTF-8").fromUtf16(wide);
    std::u16string text;
    if (trial.passes([&] { text = TextConversion("UTF-8").toUtf16(narrow); })) {
        EXPECT_EQ(text, wide);
    }
}

// A file that can't be opened for want of memory must not look like one that isn't there.
void openAFile(Trial& trial) {
    static const TemporaryFile file("content");
    const std::u16string path = TextConversion("UTF-8").toUtf16(file.path().string());
    bool isOpen = false;
    if (trial.passes([&] {
            common::WidePathInputFileStream stream(path);
            isOpen = static_cast<bool>(stream);
        })) {
        EXPECT_TRUE(isOpen);
    }
}

constexpr Row futures[] = {
    {"MakeAReadyFuture", makeAReadyFuture},
    {"SetAValue", setAValue},
    {"GetAValue", getAValue},
    {"AttachToAReadyFuture", attachToAReadyFuture},
    {"AttachToAPendingFuture", attachToAPendingFuture},
    {"RunAChain", runAChain},
    {"FailAChain", failAChain},
    {"BreakAChain", breakAChain},
    {"CancelAChain", cancelAChain},
};
VELKOR_FAILING_ROWS(FailingFutures, futures);

constexpr Row streams[] = {
    {"Publish", publishAValue},
    {"PublishFirst", publishAFirstValue},
    {"Request", requestWhatIsKept},
    {"Subscribe", cached<trySubscribe<Streaming<Cached>>>},
    {"GetCompletionFuture", cached<tryCompletionFuture<Streaming<Cached>>>},
    {"Complete", cached<tryComplete<Streaming<Cached>>>},
    {"Fail", cached<tryFail<Streaming<Cached>>>},
    {"Cancel", cached<tryCancel<Streaming<Cached>>>},
    {"Destroy", cached<tryDestroy<Streaming<Cached>>>},
    {"MakeConflating", makeAConflatingStream},
    {"KeepConflating", conflatingKeep},
    {"ReplaceConflating", conflatingKeepOfAKnownKey},
    {"DeliverConflating", conflatingDeliver},
    {"SubscribeConflating", conflating<trySubscribe<Streaming<Conflating>>>},
    {"GetCompletionFutureConflating", conflating<tryCompletionFuture<Streaming<Conflating>>>},
    {"CompleteConflating", conflating<tryComplete<Streaming<Conflating>>>},
    {"FailConflating", conflating<tryFail<Streaming<Conflating>>>},
    {"CancelConflating", conflating<tryCancel<Streaming<Conflating>>>},
    {"DestroyConflating", conflating<tryDestroy<Streaming<Conflating>>>},
    {"SubscribeCallbacks", subscribeCallbacks<Demand::unbounded>},
    {"SubscribeCallbacksOneAtATime", subscribeCallbacks<Demand::oneAtATime>},
    {"TellCallbacks", tellCallbacks<Demand::unbounded>},
    {"TellCallbacksOneAtATime", tellCallbacks<Demand::oneAtATime>},
    {"CancelAHandle", cancelAHandle},
    {"DestroyAHandle", destroyAHandle},
};
VELKOR_FAILING_ROWS(FailingStreams, streams);

constexpr Row texts[] = {
    {"ConvertToUtf8", convertToUtf8},
    {"ConvertToUtf16", convertToUtf16},
    {"OpenAFile", openAFile},
};
VELKOR_FAILING_ROWS(FailingTexts, texts);

}  // namespace
}  // namespace velkor::testing
