#include <gtest/gtest.h>

#include <string>

#include "tests/http/routes/ServiceTesting.hpp"

namespace velkor::http::detail {
namespace {

using velkor::testing::problemIn;

class MessagesTest : public velkor::testing::ServiceTest {};

TEST_F(MessagesTest, AnswersGet) {
    store->set("k", 5).get();
    const Response reply = message("ConfigurationGet", R"({"key":"k"})");
    EXPECT_EQ(reply.status, 200);
    EXPECT_EQ(reply.contentType, "application/json");
    EXPECT_EQ(reply.body, R"({"key":"k","source":"override","value":{"type":"int","value":5}})");
    EXPECT_EQ(headerOf(reply, "Message-Type"), "velkor/configuration/ConfigurationOptionResponse");
}

TEST_F(MessagesTest, AnswersSet) {
    const Response reply =
        message("ConfigurationSet", R"({"key":"k","value":{"type":"int","value":5}})");
    EXPECT_EQ(reply.status, 200);
    EXPECT_EQ(boost::get<int>(store->get("k").get()), 5);
}

TEST_F(MessagesTest, SaysThatTheTypeIsUnknown) {
    EXPECT_EQ(problemIn(message("Nobody", "{}")),
              "404 /problems/not-found Unknown message type: velkor/configuration/Nobody");
}

}  // namespace
}  // namespace velkor::http::detail
