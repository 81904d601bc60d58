// Every allocation of an operation fails in turn: the stream stays usable, ends when it is told to,
// and tells everybody so.

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <utility>

#include "framework/reactive_streams/CallbackSubscriber.hpp"
#include "tests/framework/reactive_streams/EndTesting.hpp"
#include "tests/support/ScarceMemory.hpp"

namespace velkor::reactive_streams {
namespace {

using velkor::testing::failEachAllocation;
using velkor::testing::ScarceMemory;

/// Counts signals and keeps nothing, so that it needs no memory of its own.
class Counting final : public Subscriber<std::string> {
public:
    using Subscriber<std::string>::onNext;
    explicit Counting(std::uint64_t initialDemand) : demand(initialDemand) {}
    void onSubscribe(std::weak_ptr<Subscription> opened) override {
        subscription = std::move(opened);
        if (demand > 0) subscription.lock()->request(demand);
    }
    void onNext(std::string&& value) override {
        ++values;
        last = value.back();
    }
    void onComplete() override { ++completions; }
    void onError(const std::exception_ptr&) override { ++errors; }

    std::weak_ptr<Subscription> subscription;
    std::uint64_t demand;
    int values = 0;
    int completions = 0;
    int errors = 0;
    char last = ' ';
};

/// A stream of long texts, each of which takes memory to copy, with all that hears of it.
struct Scene {
    explicit Scene(std::uint64_t demand) : subscriber(std::make_shared<Counting>(demand)) {}

    void subscribe() { publisher->subscribe(subscriber); }

    /// Whether the completion future has its result.
    static bool isSettled(Future<bool>& future) {
        bool settled = false;
        future.then([&](Future<bool>&&) { return settled = true; });
        return settled;
    }

    int endings = 0;
    std::shared_ptr<Counting> subscriber;
    std::shared_ptr<StreamOf<std::string>> publisher =
        std::make_shared<StreamOf<std::string>>(2, [this] { ++endings; });
};

std::string text(char last) {
    return std::string(100, 'x') + last;
}

TEST(CachedValuePublisherMemory, MakingOneFailsCleanly) {
    failEachAllocation([](ScarceMemory& memory) {
        std::shared_ptr<StreamOf<int>> publisher;
        const bool passed =
            memory.allows([&] { publisher = std::make_shared<StreamOf<int>>(1, [] {}); });
        EXPECT_EQ(publisher != nullptr, passed);
    });
}

TEST(CachedValuePublisherMemory, FutureOfAnOpenStreamCanBeAskedForAgain) {
    failEachAllocation([](ScarceMemory& memory) {
        Scene scene(0);
        Future<bool> future;
        const auto ask = [&] { future = scene.publisher->getCompletionFuture(); };
        if (!memory.allows(ask)) ask();
        scene.publisher->complete();
        ASSERT_TRUE(future.get());
    });
}

TEST(CachedValuePublisherMemory, FutureOfAnEndedStreamCanBeAskedForAgain) {
    failEachAllocation([](ScarceMemory& memory) {
        Scene scene(0);
        scene.publisher->complete();
        Future<bool> future;
        const auto ask = [&] { future = scene.publisher->getCompletionFuture(); };
        if (!memory.allows(ask)) ask();
        ASSERT_TRUE(Scene::isSettled(future));
    });
}

TEST(CachedValuePublisherMemory, FutureOfAFailedStreamCanBeAskedForAgain) {
    failEachAllocation([](ScarceMemory& memory) {
        Scene scene(0);
        scene.publisher->fail(broken());
        Future<bool> future;
        const auto ask = [&] { future = scene.publisher->getCompletionFuture(); };
        if (!memory.allows(ask)) ask();
        ASSERT_TRUE(Scene::isSettled(future));
    });
}

TEST(CachedValuePublisherMemory, CompletionTellsEverybody) {
    failEachAllocation([](ScarceMemory& memory) {
        Scene scene(0);
        scene.subscribe();
        Future<bool> future = scene.publisher->getCompletionFuture();
        EXPECT_TRUE(memory.allows([&] { scene.publisher->complete(); }));
        EXPECT_EQ(scene.subscriber->completions, 1);
        EXPECT_EQ(scene.endings, 1);
        ASSERT_TRUE(Scene::isSettled(future));
    });
}

TEST(CachedValuePublisherMemory, FailureTellsEverybody) {
    failEachAllocation([](ScarceMemory& memory) {
        Scene scene(0);
        scene.subscribe();
        Future<bool> future = scene.publisher->getCompletionFuture();
        std::exception_ptr error = broken();
        EXPECT_TRUE(memory.allows([&] { scene.publisher->fail(error); }));
        EXPECT_EQ(scene.subscriber->errors, 1);
        EXPECT_EQ(scene.endings, 1);
        ASSERT_TRUE(Scene::isSettled(future));
    });
}

TEST(CachedValuePublisherMemory, CancelTellsTheFutureAndTheHook) {
    failEachAllocation([](ScarceMemory& memory) {
        Scene scene(0);
        scene.subscribe();
        scene.publisher->publish(text('1'));
        Future<bool> future = scene.publisher->getCompletionFuture();
        const auto subscription = scene.subscriber->subscription.lock();
        EXPECT_TRUE(memory.allows([&] { subscription->cancel(); }));
        EXPECT_EQ(scene.endings, 1);
        ASSERT_TRUE(Scene::isSettled(future));
    });
}

TEST(CachedValuePublisherMemory, DestructorTellsEverybody) {
    failEachAllocation([](ScarceMemory& memory) {
        Scene scene(0);
        scene.subscribe();
        scene.publisher->publish(text('1'));
        Future<bool> future = scene.publisher->getCompletionFuture();
        EXPECT_TRUE(memory.allows([&] { scene.publisher.reset(); }));
        EXPECT_EQ(scene.subscriber->completions, 1);
        EXPECT_EQ(scene.endings, 1);
        ASSERT_TRUE(Scene::isSettled(future));
    });
}

TEST(CachedValuePublisherMemory, DrainedStreamTellsEverybody) {
    failEachAllocation([](ScarceMemory& memory) {
        Scene scene(0);
        scene.subscribe();
        scene.publisher->publish(text('1'));
        scene.publisher->complete();
        Future<bool> future = scene.publisher->getCompletionFuture();
        const auto subscription = scene.subscriber->subscription.lock();
        EXPECT_TRUE(memory.allows([&] { subscription->request(1); }));
        EXPECT_EQ(scene.subscriber->values, 1);
        EXPECT_EQ(scene.subscriber->completions, 1);
        EXPECT_EQ(scene.endings, 1);
        ASSERT_TRUE(Scene::isSettled(future));
    });
}

TEST(CachedValuePublisherMemory, RefusedSubscriptionLeavesThePublisherFree) {
    failEachAllocation([](ScarceMemory& memory) {
        Scene scene(1);
        scene.publisher->publish(text('1'));
        if (!memory.allows([&] { scene.subscribe(); })) scene.subscribe();
        EXPECT_EQ(scene.subscriber->values, 1);
    });
}

TEST(CachedValuePublisherMemory, RefusedValueLeavesTheKeptOnesAlone) {
    failEachAllocation([](ScarceMemory& memory) {
        Scene scene(0);
        scene.subscribe();
        scene.publisher->publish(text('1'));
        scene.publisher->publish(text('2'));
        const std::string value = text('3');
        const bool kept = memory.allows([&] { scene.publisher->publish(value); });
        scene.subscriber->subscription.lock()->request(3);
        EXPECT_EQ(scene.subscriber->values, 2);
        EXPECT_EQ(scene.subscriber->last, kept ? '3' : '2');
    });
}

TEST(CachedValuePublisherMemory, RefusedDeliveryLeavesTheDemandAlone) {
    failEachAllocation([](ScarceMemory& memory) {
        Scene scene(1);
        scene.subscribe();
        const std::string value = text('1');
        if (!memory.allows([&] { scene.publisher->publish(value); })) {
            scene.publisher->publish(value);
        }
        EXPECT_EQ(scene.subscriber->values, 1);
    });
}

TEST(CachedValuePublisherMemory, RefusedFirstValueCanBeKeptAgain) {
    failEachAllocation([](ScarceMemory& memory) {
        Scene scene(1);
        const std::string value = text('1');
        const auto keep = [&] { scene.publisher->publishFirst(value); };
        if (!memory.allows(keep)) keep();
        scene.subscribe();
        EXPECT_EQ(scene.subscriber->values, 1);
    });
}

TEST(CachedValuePublisherMemory, RefusedCallbacksLeaveThePublisherFree) {
    failEachAllocation([](ScarceMemory& memory) {
        Scene scene(0);
        scene.publisher->publish(text('1'));
        int values = 0;
        const auto open = [&] {
            return reactive_streams::subscribe<std::string>(
                *scene.publisher, {[&](const std::string&) { ++values; }});
        };
        SubscriptionHandle watch;
        if (!memory.allows([&] { watch = open(); })) watch = open();
        EXPECT_EQ(values, 1);
    });
}

TEST(CachedValuePublisherMemory, DestroyedHandleCancels) {
    failEachAllocation([](ScarceMemory& memory) {
        Scene scene(0);
        SubscriptionHandle watch =
            reactive_streams::subscribe<std::string>(*scene.publisher, {[](const std::string&) {}});
        Future<bool> future = scene.publisher->getCompletionFuture();
        EXPECT_TRUE(memory.allows([&] { watch = SubscriptionHandle(); }));
        EXPECT_EQ(scene.endings, 1);
        ASSERT_TRUE(Scene::isSettled(future));
    });
}

TEST(CachedValuePublisherMemory, EndTakesNoMemoryForTheFuture) {
    Scene scene(0);
    const Future<bool> future = scene.publisher->getCompletionFuture();
    EXPECT_EQ(velkor::testing::countAllocations([&] { scene.publisher->complete(); }), 0U);
}

}  // namespace
}  // namespace velkor::reactive_streams
