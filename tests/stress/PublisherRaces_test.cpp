#include <gtest/gtest.h>

#include <atomic>
#include <functional>
#include <limits>
#include <memory>
#include <stdexcept>

#include "framework/reactive_streams/CachedValuePublisher.hpp"
#include "framework/reactive_streams/CallbackSubscriber.hpp"
#include "tests/stress/CountingSubscriber.hpp"
#include "tests/stress/Race.hpp"

namespace velkor::reactive_streams {
namespace {

using velkor::testing::race;

constexpr auto allValues = std::numeric_limits<std::uint64_t>::max();

/// Two threads on one stream of numbers.
class PublisherRaces : public ::testing::Test {
protected:
    using Stream = CachedValuePublisher<int, std::function<void()>>;
    using Counter = velkor::testing::CountingSubscriber<int>;

    void open() {
        endings = 0;
        publisher = std::make_shared<Stream>(1, [this] { ++endings; });
        completed = publisher->getCompletionFuture();
    }

    void openSubscribed(std::uint64_t demand) {
        open();
        subscriber = std::make_shared<Counter>(demand);
        publisher->subscribe(subscriber);
    }

    std::atomic<int> endings{0};
    std::shared_ptr<Stream> publisher;
    std::shared_ptr<Counter> subscriber;
    Future<bool> completed;
};

TEST_F(PublisherRaces, CancelAgainstPublish) {
    race([this] { openSubscribed(allValues); },
         [this] {
             for (int value = 1; value <= 3; ++value) publisher->publish(value);
         },
         [this] { subscriber->subscription->cancel(); },
         [this] {
             const int received = subscriber->received;
             publisher->publish(4);
             ASSERT_EQ(subscriber->received, received);
             ASSERT_EQ(endings, 1);
             ASSERT_FALSE(completed.get());
             ASSERT_EQ(subscriber.use_count(), 1);
         });
}

TEST_F(PublisherRaces, CancelAgainstADrain) {
    race(
        [this] {
            openSubscribed(0);
            publisher->publish(1);
        },
        [this] { subscriber->subscription->request(1); },
        [this] { subscriber->subscription->cancel(); },
        [this] {
            ASSERT_LE(subscriber->received, 1);
            ASSERT_EQ(endings, 1);
            ASSERT_EQ(subscriber.use_count(), 1);
        });
}

TEST_F(PublisherRaces, RequestAgainstPublishLosesNoValue) {
    race([this] { openSubscribed(0); }, [this] { subscriber->subscription->request(1); },
         [this] { publisher->publish(1); }, [this] { ASSERT_EQ(subscriber->received, 1); });
}

TEST_F(PublisherRaces, SubscribeAgainstPublishLosesNoValue) {
    race(
        [this] {
            open();
            subscriber = std::make_shared<Counter>(allValues);
        },
        [this] { publisher->subscribe(subscriber); }, [this] { publisher->publish(1); },
        [this] { ASSERT_EQ(subscriber->received, 1); });
}

TEST_F(PublisherRaces, TwoPublishersKeepToTheDemand) {
    race([this] { openSubscribed(3); },
         [this] {
             for (int value = 1; value <= 3; ++value) publisher->publish(value);
         },
         [this] {
             for (int value = 4; value <= 6; ++value) publisher->publish(value);
         },
         [this] { ASSERT_EQ(subscriber->received, 3); });
}

TEST_F(PublisherRaces, RequestAgainstDestruction) {
    race(
        [this] {
            openSubscribed(0);
            publisher->publish(1);
        },
        [this] { subscriber->subscription->request(1); }, [this] { publisher.reset(); },
        [this] {
            ASSERT_LE(subscriber->received, 1);
            ASSERT_EQ(subscriber->completions, 1);
            ASSERT_EQ(endings, 1);
            ASSERT_TRUE(completed.get());
        });
}

TEST_F(PublisherRaces, CancelAgainstDestruction) {
    race([this] { openSubscribed(0); }, [this] { subscriber->subscription->cancel(); },
         [this] { publisher.reset(); },
         [this] {
             ASSERT_EQ(endings, 1);
             ASSERT_EQ(completed.get(), subscriber->completions == 1);
         });
}

TEST_F(PublisherRaces, CancelAgainstComplete) {
    race([this] { openSubscribed(0); }, [this] { subscriber->subscription->cancel(); },
         [this] { publisher->complete(); },
         [this] {
             ASSERT_EQ(endings, 1);
             ASSERT_EQ(completed.get(), subscriber->completions == 1);
         });
}

TEST_F(PublisherRaces, CompleteAgainstFail) {
    race([this] { openSubscribed(0); }, [this] { publisher->complete(); },
         [this] { publisher->fail(std::make_exception_ptr(std::runtime_error("broken"))); },
         [this] {
             ASSERT_EQ(endings, 1);
             ASSERT_EQ(subscriber->completions + subscriber->errors, 1);
         });
}

TEST_F(PublisherRaces, CompletionAgainstTheRequestThatDrains) {
    race(
        [this] {
            openSubscribed(0);
            publisher->publish(1);
        },
        [this] { subscriber->subscription->request(1); }, [this] { publisher->complete(); },
        [this] {
            ASSERT_EQ(subscriber->received, 1);
            ASSERT_EQ(subscriber->completions, 1);
            ASSERT_EQ(endings, 1);
        });
}

TEST_F(PublisherRaces, FutureAskedForAgainstTheEnd) {
    Future<bool> late;
    race([this] { publisher = std::make_shared<Stream>(1, [] {}); },
         [&] { late = publisher->getCompletionFuture(); }, [this] { publisher->complete(); },
         [&] { ASSERT_TRUE(late.get()); });
}

TEST_F(PublisherRaces, HandleDestructionAgainstPublish) {
    std::atomic<int> values{0};
    SubscriptionHandle watch;
    race(
        [&] {
            open();
            watch = reactive_streams::subscribe(*publisher, {[&](int) { ++values; }},
                                                Demand::oneAtATime);
        },
        [&] { watch = SubscriptionHandle(); }, [this] { publisher->publish(1); },
        [&] {
            const int received = values;
            publisher->publish(2);
            ASSERT_EQ(values, received);
            ASSERT_EQ(endings, 1);
        });
}

TEST_F(PublisherRaces, HandleDestructionAgainstPublisherDestruction) {
    SubscriptionHandle watch;
    race(
        [&] {
            open();
            watch = reactive_streams::subscribe(*publisher, {[](int) {}});
        },
        [&] { watch = SubscriptionHandle(); }, [this] { publisher.reset(); },
        [this] { ASSERT_EQ(endings, 1); });
}

}  // namespace
}  // namespace velkor::reactive_streams
