#include "framework/ServiceProvider.hpp"

#include <gtest/gtest.h>

#include <memory>
#include <stdexcept>
#include <string>
#include <thread>
#include <typeinfo>
#include <utility>

#include "framework/DeferredService.hpp"
#include "tests/framework/service/Greeting.hpp"

namespace velkor {
namespace {

using velkor::testing::errorIn;
using velkor::testing::Greet;
using velkor::testing::Greeting;
using velkor::testing::greetingIn;
using velkor::testing::GreetingService;
using velkor::testing::Ignored;

class Delivery : public ::testing::Test {
protected:
    Delivery() { service->setRunning(true); }

    Future<std::unique_ptr<Message>> deliver(std::unique_ptr<Message>& message) {
        return service->deliver(std::move(message), Address{"sender"},
                                std::shared_ptr<Context>(context));
    }

    std::shared_ptr<Context> context = std::make_shared<Context>();
    std::shared_ptr<GreetingService> service = std::make_shared<GreetingService>();
};

TEST_F(Delivery, GivesTheReplyOfTheHandler) {
    std::unique_ptr<Message> message = std::make_unique<Greet>("Ada");
    EXPECT_EQ(greetingIn(deliver(message)), "Hello Ada");
}

TEST_F(Delivery, CarriesAddressAndContextAlong) {
    std::unique_ptr<Message> message = std::make_unique<Greet>("Ada");
    deliver(message);
    EXPECT_EQ(service->sender, "sender");
    EXPECT_EQ(service->context, context);
}

TEST_F(Delivery, PassesOnWhatTheHandlerThrows) {
    std::unique_ptr<Message> message = std::make_unique<Greet>();
    EXPECT_THROW(deliver(message), std::out_of_range);
}

TEST_F(Delivery, ToAServiceThatDoesNotRunFailsTheFuture) {
    service->setRunning(false);
    std::unique_ptr<Message> message = std::make_unique<Greet>("Ada");
    EXPECT_EQ(errorIn<std::runtime_error>(deliver(message)), "Service exists but is not running.");
}

TEST_F(Delivery, ToAServiceThatDoesNotRunLeavesTheMessage) {
    service->setRunning(false);
    std::unique_ptr<Message> message = std::make_unique<Greet>("Ada");
    const Message* const owned = message.get();
    deliver(message);
    EXPECT_EQ(message.get(), owned);
    EXPECT_EQ(service->handled, 0);
}

TEST_F(Delivery, LooksAtTheRunningFlagBeforeTheMessage) {
    service->setRunning(false);
    std::unique_ptr<Message> none;
    EXPECT_EQ(errorIn<std::runtime_error>(deliver(none)), "Service exists but is not running.");
}

TEST_F(Delivery, OfNoMessageThrows) {
    std::unique_ptr<Message> none;
    EXPECT_THROW(deliver(none), std::bad_typeid);
}

std::string mismatch(const std::type_info& found) {
    return std::string("Incorrect message type. Expected: ") +
           typeid(ServiceMessage<GreetingService>).name() + " but found " + found.name();
}

TEST_F(Delivery, OfAMessageForNobodyNamesBothTypes) {
    std::unique_ptr<Message> message = std::make_unique<Greeting>("no request");
    EXPECT_EQ(errorIn<std::invalid_argument>(deliver(message)), mismatch(typeid(Greeting)));
}

TEST_F(Delivery, OfAPlainMessageNamesBothTypes) {
    std::unique_ptr<Message> message = std::make_unique<Message>();
    EXPECT_EQ(errorIn<std::invalid_argument>(deliver(message)), mismatch(typeid(Message)));
}

TEST_F(Delivery, OfAMessageForAnotherServiceNamesBothTypes) {
    std::unique_ptr<Message> message = std::make_unique<Ignored>();
    EXPECT_EQ(errorIn<std::invalid_argument>(deliver(message)), mismatch(typeid(Ignored)));
}

TEST_F(Delivery, OfTheWrongMessageLeavesIt) {
    std::unique_ptr<Message> message = std::make_unique<Message>();
    const Message* const owned = message.get();
    deliver(message);
    EXPECT_EQ(message.get(), owned);
}

TEST(DeliveryWithoutSharedOwner, Throws) {
    GreetingService service;
    service.setRunning(true);
    std::unique_ptr<Message> message = std::make_unique<Greet>("Ada");
    EXPECT_THROW(service.deliver(std::move(message), Address(), nullptr), std::bad_weak_ptr);
    EXPECT_NE(message, nullptr);
}

TEST(DeliveryWithoutSharedOwner, OfTheWrongMessageFailsTheFuture) {
    GreetingService service;
    service.setRunning(true);
    EXPECT_EQ(errorIn<std::invalid_argument>(
                  service.deliver(std::make_unique<Message>(), Address(), nullptr)),
              mismatch(typeid(Message)));
}

TEST_F(Delivery, LeavesNoReferenceToTheServiceInTheReply) {
    std::unique_ptr<Message> message = std::make_unique<Greet>("Ada");
    const std::weak_ptr<GreetingService> observer = service;
    Future<std::unique_ptr<Message>> reply = deliver(message);
    service.reset();
    EXPECT_TRUE(observer.expired());
    EXPECT_EQ(greetingIn(std::move(reply)), "Hello Ada");
}

TEST(Lifecycle, DoesNotRunAtFirst) {
    EXPECT_FALSE(Lifecycle().isRunning());
}

TEST(Lifecycle, RunsAsLongAsItIsTold) {
    Lifecycle lifecycle;
    lifecycle.setRunning(true);
    EXPECT_TRUE(lifecycle.isRunning());
    lifecycle.setRunning(false);
    EXPECT_FALSE(lifecycle.isRunning());
}

TEST_F(Delivery, MayMeetAFlagThatAnotherThreadSwitches) {
    std::thread host([&] {
        for (int i = 0; i < 1000; ++i) service->setRunning(i % 2 == 0);
    });
    for (int i = 0; i < 1000; ++i) {
        std::unique_ptr<Message> message = std::make_unique<Greet>("Ada");
        const int before = service->handled;
        deliver(message);
        EXPECT_EQ(message == nullptr, service->handled == before + 1);
    }
    host.join();
}

TEST_F(Delivery, StartAndStopDoNothing) {
    service->onStart();
    service->onStop();
    EXPECT_TRUE(service->isRunning());
}

TEST(DeferredServiceBase, HasAVirtualDestructor) {
    struct Noting : DeferredService {
        explicit Noting(bool& flag) : destroyed(flag) {}
        ~Noting() override { destroyed = true; }
        bool& destroyed;
    };
    bool destroyed = false;
    { const std::unique_ptr<DeferredService> service = std::make_unique<Noting>(destroyed); }
    EXPECT_TRUE(destroyed);
}

}  // namespace
}  // namespace velkor
