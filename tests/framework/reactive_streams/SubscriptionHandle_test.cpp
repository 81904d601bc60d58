#include "framework/reactive_streams/SubscriptionHandle.hpp"

#include <gtest/gtest.h>

#include <cstdint>
#include <memory>
#include <stdexcept>
#include <type_traits>
#include <utility>

#include "framework/reactive_streams/CallbackSubscriber.hpp"
#include "tests/framework/reactive_streams/PublisherFixture.hpp"

namespace velkor::reactive_streams {
namespace {

class SubscriptionHandleTest : public PublisherFixture {
protected:
    SubscriptionHandle watch(Stream& stream) {
        return reactive_streams::subscribe(stream, {[](int) {}});
    }
};

TEST_F(SubscriptionHandleTest, IsMovedButNeverCopied) {
    EXPECT_FALSE(std::is_copy_constructible_v<SubscriptionHandle>);
    EXPECT_FALSE(std::is_copy_assignable_v<SubscriptionHandle>);
    EXPECT_TRUE(std::is_nothrow_move_constructible_v<SubscriptionHandle>);
    EXPECT_TRUE(std::is_nothrow_move_assignable_v<SubscriptionHandle>);
}

TEST_F(SubscriptionHandleTest, DestructionCancels) {
    { const SubscriptionHandle handle = watch(*publisher); }
    EXPECT_FALSE(publisher->getCompletionFuture().get());
    EXPECT_EQ(endings, 1);
}

TEST_F(SubscriptionHandleTest, CancelEndsTheStreamOnce) {
    {
        SubscriptionHandle handle = watch(*publisher);
        handle.cancel();
        handle.cancel();
    }
    EXPECT_EQ(endings, 1);
}

TEST_F(SubscriptionHandleTest, EmptyHandleCancelsNothing) {
    SubscriptionHandle handle;
    EXPECT_NO_THROW(handle.cancel());
}

TEST_F(SubscriptionHandleTest, MoveTakesTheSubscriptionAlong) {
    SubscriptionHandle first = watch(*publisher);
    {
        const SubscriptionHandle second(std::move(first));
        EXPECT_EQ(endings, 0);
    }
    EXPECT_EQ(endings, 1);
}

TEST_F(SubscriptionHandleTest, MoveAssignmentCancelsTheSubscriptionHeldBefore) {
    const auto other = std::make_shared<Stream>(1, [] {});
    SubscriptionHandle handle = watch(*publisher);
    handle = watch(*other);
    EXPECT_EQ(endings, 1);
}

TEST_F(SubscriptionHandleTest, MoveAssignmentToItselfChangesNothing) {
    SubscriptionHandle handle = watch(*publisher);
    SubscriptionHandle& same = handle;
    handle = std::move(same);
    EXPECT_EQ(endings, 0);
}

TEST_F(SubscriptionHandleTest, HandleKeepsNeitherPublisherNorSubscriberAlive) {
    const auto state = std::make_shared<int>();
    const SubscriptionHandle handle = reactive_streams::subscribe(*publisher, {[state](int) {}});
    const std::weak_ptr<Stream> observed = publisher;
    publisher.reset();
    EXPECT_TRUE(observed.expired());
    EXPECT_EQ(state.use_count(), 1);
}

TEST_F(SubscriptionHandleTest, CancelAfterThePublisherHasGoneDoesNothing) {
    SubscriptionHandle handle = watch(*publisher);
    publisher.reset();
    EXPECT_NO_THROW(handle.cancel());
}

TEST_F(SubscriptionHandleTest, CancelPassesOnWhatTheHookThrows) {
    whenDone = [] { throw std::runtime_error("hook"); };
    SubscriptionHandle handle = watch(*publisher);
    EXPECT_THROW(handle.cancel(), std::runtime_error);
}

TEST_F(SubscriptionHandleTest, DestructorDropsWhatTheHookThrows) {
    whenDone = [] { throw std::runtime_error("hook"); };
    EXPECT_NO_THROW({ const SubscriptionHandle handle = watch(*publisher); });
    EXPECT_EQ(endings, 1);
}

TEST_F(SubscriptionHandleTest, LinkThatWasCancelledRefusesALaterSubscription) {
    const auto link = std::make_shared<SubscriptionLink>();
    link->cancel();
    publisher->subscribe(std::make_shared<CallbackSubscriber<int>>(Callbacks<int>{[](int) {}},
                                                                   Demand::unbounded, link));
    EXPECT_FALSE(publisher->getCompletionFuture().get());
}

TEST_F(SubscriptionHandleTest, LinkThatWasCancelledIgnoresASubscriptionThatHasGone) {
    SubscriptionLink link;
    link.cancel();
    EXPECT_FALSE(link.open(std::weak_ptr<Subscription>()));
}

TEST_F(SubscriptionHandleTest, LinkPassesOneCancelOn) {
    struct CountingSubscription : Subscription {
        void request(std::uint64_t) override {}
        void cancel() override { ++cancels; }
        int cancels = 0;
    };
    const auto subscription = std::make_shared<CountingSubscription>();
    SubscriptionLink link;
    link.open(subscription);
    link.cancel();
    link.cancel();
    EXPECT_EQ(subscription->cancels, 1);
}

TEST_F(SubscriptionHandleTest, RequestThroughALinkWithoutSubscriptionDoesNothing) {
    SubscriptionLink link;
    EXPECT_NO_THROW(link.request(1));
}

TEST_F(SubscriptionHandleTest, HandleOfAnEndedStreamLetsTheSubscriptionGoWithoutACall) {
    SubscriptionHandle handle = watch(*publisher);
    publisher->complete();
    handle.cancel();
    EXPECT_TRUE(publisher->getCompletionFuture().get());
    EXPECT_EQ(endings, 1);
}

}  // namespace
}  // namespace velkor::reactive_streams
