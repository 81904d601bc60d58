#include "framework/ServiceMessage.hpp"

#include <gtest/gtest.h>

#include <memory>
#include <stdexcept>
#include <string>
#include <typeinfo>
#include <utility>

#include "framework/RoutingErrors.hpp"
#include "tests/framework/service/Greeting.hpp"

namespace velkor {
namespace {

using velkor::testing::errorIn;
using velkor::testing::Greet;
using velkor::testing::Greeting;
using velkor::testing::greetingIn;
using velkor::testing::GreetingService;

class Dispatch : public ::testing::Test {
protected:
    Future<std::unique_ptr<Message>> dispatch(Greet& request, std::unique_ptr<Message>& self) {
        return request.dispatch(service, std::move(self), Address{"sender"}, nullptr);
    }

    std::shared_ptr<GreetingService> service = std::make_shared<GreetingService>();
};

TEST_F(Dispatch, GivesWhatTheHandlerGives) {
    auto* const request = new Greet("Ada");
    std::unique_ptr<Message> self(request);
    EXPECT_EQ(greetingIn(dispatch(*request, self)), "Hello Ada");
}

TEST_F(Dispatch, TakesTheMessageOutOfItsOwner) {
    auto* const request = new Greet("Ada");
    std::unique_ptr<Message> self(request);
    dispatch(*request, self);
    EXPECT_EQ(self, nullptr);
}

TEST_F(Dispatch, DestroysTheRequestThatTheHandlerLeft) {
    bool destroyed = false;
    auto* const request = new Greet("Ada");
    request->destroyed = &destroyed;
    std::unique_ptr<Message> self(request);
    dispatch(*request, self);
    EXPECT_TRUE(destroyed);
}

TEST_F(Dispatch, LeavesTheRequestToTheHandlerThatTookIt) {
    service->takes = true;
    auto* const request = new Greet("Ada");
    std::unique_ptr<Message> self(request);
    dispatch(*request, self);
    EXPECT_EQ(service->taken.get(), request);
}

TEST_F(Dispatch, PassesOnWhatTheHandlerThrows) {
    auto* const request = new Greet;
    std::unique_ptr<Message> self(request);
    EXPECT_THROW(dispatch(*request, self), std::out_of_range);
}

TEST_F(Dispatch, DestroysTheRequestWhenTheHandlerThrows) {
    bool destroyed = false;
    auto* const request = new Greet;
    request->destroyed = &destroyed;
    std::unique_ptr<Message> self(request);
    EXPECT_ANY_THROW(dispatch(*request, self));
    EXPECT_TRUE(destroyed);
}

TEST_F(Dispatch, OfAnotherClassNamesBothTypes) {
    Greet request("Ada");
    std::unique_ptr<Message> self = std::make_unique<Greeting>("other");
    EXPECT_EQ(errorIn<std::invalid_argument>(dispatch(request, self)),
              std::string("Unable to deliver to service. Incorrect message type. Expected: ") +
                  typeid(Greet).name() + " but found " + typeid(Greeting).name());
}

TEST_F(Dispatch, OfAnotherObjectOfTheSameClassIsAMismatch) {
    Greet request("Ada");
    std::unique_ptr<Message> self = std::make_unique<Greet>("Ada");
    EXPECT_EQ(errorIn<std::invalid_argument>(dispatch(request, self)),
              std::string("Unable to deliver to service. Incorrect message type. Expected: ") +
                  typeid(Greet).name() + " but found " + typeid(Greet).name());
}

TEST_F(Dispatch, OfAnotherObjectLeavesItAloneAndCallsNobody) {
    Greet request("Ada");
    std::unique_ptr<Message> self = std::make_unique<Greeting>("other");
    const Message* const owned = self.get();
    dispatch(request, self);
    EXPECT_EQ(self.get(), owned);
    EXPECT_EQ(service->handled, 0);
}

TEST_F(Dispatch, OfNoMessageThrows) {
    Greet request("Ada");
    std::unique_ptr<Message> self;
    EXPECT_THROW(dispatch(request, self), std::bad_typeid);
}

TEST(RoutingErrors, AreTheseTexts) {
    EXPECT_STREQ(routing_errors::notRunning, "Service exists but is not running.");
    EXPECT_STREQ(routing_errors::notForThisObject,
                 "Unable to deliver to service. Incorrect message type. Expected: ");
    EXPECT_STREQ(routing_errors::notForThisService, "Incorrect message type. Expected: ");
    EXPECT_STREQ(routing_errors::butFound, " but found ");
}

TEST(TypeName, IsThePlatformsName) {
    EXPECT_EQ(typeName(typeid(int)), typeid(int).name());
}

/// A type whose name begins with an asterisk: the platform drops a first one of its own.
struct Starred : std::type_info {
    Starred() : std::type_info("**x") {}
};

TEST(TypeName, DropsALeadingAsterisk) {
    ASSERT_STREQ(Starred().name(), "*x");
    EXPECT_EQ(typeName(Starred()), "x");
}

TEST(Message, IsConcreteAndPolymorphic) {
    const std::unique_ptr<Message> message = std::make_unique<Message>();
    const Message& object = *message;
    EXPECT_EQ(typeid(object), typeid(Message));
}

}  // namespace
}  // namespace velkor
