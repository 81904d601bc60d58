#include <gtest/gtest.h>

#include <memory>
#include <random>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include "http/detail/routes/PlainGet.hpp"
#include "messages/MessageService.hpp"
#include "settings/Setting.hpp"
#include "tests/http/routes/LastingSource.hpp"
#include "tests/http/routes/ServiceTesting.hpp"
#include "tests/support/LogCapture.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::http::detail {
namespace {

using ::testing::Test;
using velkor::testing::LastingSource;
using velkor::testing::LogCapture;
using velkor::testing::problemIn;
using velkor::testing::TemporaryFile;

class MessagesTest : public velkor::testing::ServiceTest {};

TEST_F(MessagesTest, AnswerGet) {
    store->set("k", 5).get();
    const Response reply = message("ConfigurationGet", R"({"key":"k"})");
    EXPECT_EQ(reply.status, 200);
    EXPECT_EQ(reply.contentType, "application/json");
    EXPECT_EQ(reply.body, R"({"key":"k","source":"override","value":{"type":"int","value":5}})");
    EXPECT_EQ(headerOf(reply, "Message-Type"), "velkor/configuration/ConfigurationOptionResponse");
}

TEST_F(MessagesTest, AnswerGetOfAnUnknownKeyWithoutAnOption) {
    EXPECT_EQ(message("ConfigurationGet", R"({"key":"k"})").body, "{}");
    EXPECT_EQ(message("ConfigurationGet", R"({"key":"k","more":1})").body, "{}");
}

TEST_F(MessagesTest, AnswerSet) {
    store->set("k", 4).get();
    const Response reply =
        message("ConfigurationSet", R"({"key":"k","value":{"type":"int","value":5}})");
    EXPECT_EQ(reply.status, 200);
    EXPECT_EQ(reply.body, R"({"key":"k","source":"","value":{"type":"int","value":4}})");
    EXPECT_EQ(boost::get<int>(store->get("k").get()), 5);
}

TEST_F(MessagesTest, AnswerKeys) {
    store->set("b", 1).get();
    store->set("a", 1).get();
    const Response reply = message("ConfigurationKeys", "{}");
    EXPECT_EQ(reply.body, R"({"keys":["a","b"]})");
    EXPECT_EQ(headerOf(reply, "Message-Type"), "velkor/configuration/ConfigurationKeysResponse");
}

TEST_F(MessagesTest, AcknowledgeAFileBelowTheRoot) {
    const TemporaryFile file("a=1\n");
    options.propertyRoot = file.parent();
    const Response reply = message("AddPropertyFileSource",
                                   R"({"name":"n","path":")" + file.path().string() + R"("})");
    EXPECT_EQ(reply.status, 204);
    EXPECT_EQ(reply.body, "");
    EXPECT_TRUE(store->has("a").get());
}

TEST_F(MessagesTest, AreRefusedWithTheTextsOfTheSystem) {
    const TemporaryFile file("a=1\n");
    options.propertyRoot = file.parent();
    const std::string path = file.path().string();
    const struct {
        const char* type;
        std::string json;
        std::string problem;
    } cases[] = {
        {"ConfigurationGet", "[]", "400 /problems/bad-request JSON text is not an object"},
        {"Nobody", "{}",
         "404 /problems/not-found Unknown message type: velkor/configuration/Nobody"},
        {"ConfigurationKeysResponse", "{}",
         "404 /problems/not-found Unknown message type: "
         "velkor/configuration/ConfigurationKeysResponse"},
        {"ConfigurationSet", R"({"key":"k","source":"nowhere"})",
         "409 /problems/not-writable Source not found or not writable: k, nowhere"},
        {"AddPropertyFileSource", R"({"name":"override","path":")" + path + R"("})",
         "409 /problems/duplicate-source Source with the requested name already exists: override"},
        {"AddPropertyFileSource", R"({"name":"n","path":"/etc/hostname"})",
         "403 /problems/forbidden Property file not allowed: /etc/hostname"},
    };
    for (const auto& each : cases)
        EXPECT_EQ(problemIn(message(each.type, each.json)), each.problem);
    EXPECT_EQ(problemIn(message("ConfigurationSet", "{\"key\":")).substr(0, 44),
              "400 /problems/bad-request Invalid JSON text:");
    EXPECT_EQ(
        problemIn(message("AddPropertyFileSource", R"({"name":"n","path":")" + path + R"(2"})"))
            .substr(0, 80),
        ("422 /problems/file-not-opened Property file could not be opened: " + path).substr(0, 80));
}

TEST_F(MessagesTest, AddNoFileWithoutARoot) {
    EXPECT_EQ(problemIn(message("AddPropertyFileSource", R"({"name":"n","path":"/dev/null"})")),
              "403 /problems/forbidden Property file not allowed: /dev/null");
}

TEST_F(MessagesTest, SayWhatASourceThrows) {
    const auto source = std::make_shared<velkor::testing::HookedSource>();
    source->whenSet = [] { throw std::runtime_error("the disk is full"); };
    store->addSource("s", "", -1, false, source).get();
    EXPECT_EQ(problemIn(message("ConfigurationSet", R"({"key":"k"})")),
              "500 /problems/internal the disk is full");
    source->whenSet = [] { throw 5; };
    EXPECT_EQ(problemIn(message("ConfigurationSet", R"({"key":"k"})")),
              "500 /problems/internal Unknown error");
}

TEST_F(MessagesTest, MaskSecrets) {
    store->set("password", std::string("verysecret")).get();
    const settings::Setting<std::string> secret(store, "password", "d", settings::secret());
    const std::string masked = R"("value":{"type":"string","value":"•••"}})";
    for (const char* const json : {R"({"key":"password"})", R"({"key":"password","more":{}})",
                                   R"({"key":"p\u0061ssword"})"}) {
        EXPECT_EQ(message("ConfigurationGet", json).body,
                  R"({"key":"password","source":"override",)" + masked);
    }
    EXPECT_EQ(message("ConfigurationSet",
                      R"({"key":"password","value":{"type":"string","value":"other"}})")
                  .body,
              R"({"key":"password","source":"",)" + masked);
}

TEST_F(MessagesTest, AreRefusedBeyondTheLimits) {
    options.maxBodyBytes = 1000;
    options.maxJsonDepth = 5;
    options.maxJsonContainers = 10;
    EXPECT_EQ(problemIn(message("ConfigurationGet",
                                R"({"key":")" + std::string(1000, 'a') + R"(","b":1})")),
              "400 /problems/bad-request JSON text exceeds 1000 bytes");
    EXPECT_EQ(problemIn(message("ConfigurationGet", R"({"a":[[[[[]]]]]})")),
              "400 /problems/bad-request JSON text is nested more than 5 levels deep");
    EXPECT_EQ(problemIn(message("ConfigurationGet", R"({"a":[{},{},{},{},{},{},{},{},{}]})")),
              "400 /problems/bad-request JSON text holds more than 10 objects and arrays");
}

TEST_F(MessagesTest, SurviveHostileBodies) {
    std::string objects = "{\"a\":[{}";
    while (objects.size() < (std::size_t{1} << 20U) - 4) objects += ",{}";
    const std::vector<std::string> bodies{std::string(1 << 20, '{'),
                                          std::string(1 << 20, '['),
                                          objects + "]}",
                                          std::string(1 << 20, '"'),
                                          std::string(1 << 20, '\0'),
                                          "{\"key\":\"" + std::string(9, '\xFF'),
                                          "{\"key\":1e99999}",
                                          "{\"key\":\"\\ud800\"}",
                                          "{\"key\":\"a\"}x",
                                          "",
                                          "{\"a\":\"\\"};
    for (const auto& body : bodies) {
        for (const char* const type : {"ConfigurationGet", "ConfigurationSet"}) {
            const int status = message(type, body).status;
            EXPECT_TRUE(status == 400 || status == 200) << status << body.substr(0, 20);
        }
        EXPECT_EQ(send("PATCH", "/config", body).status, 400) << body.substr(0, 20);
    }
    EXPECT_EQ(problemIn(message("ConfigurationGet", objects + "]}")),
              "400 /problems/bad-request JSON text holds more than 65536 objects and arrays");
    EXPECT_EQ(get("/healthz").status, 200);
}

TEST_F(MessagesTest, AreAnsweredOnceWhatTheyWroteLasts) {
    const auto lasting = std::make_shared<LastingSource>();
    store->addSource("state", "", -1, false, lasting).get();
    auto answer =
        sendLater(request("POST", "/velkor/configuration/ConfigurationSet", R"({"key":"k"})"));
    lasting->awaitCommits(1);
    EXPECT_EQ(answer.wait_for(std::chrono::seconds(0)), std::future_status::timeout);
    EXPECT_EQ(get("/config").status, 200);  // the worker is free meanwhile
    lasting->commit();
    EXPECT_EQ(std::get<Response>(awaited(std::move(answer))).status, 200);
}

TEST_F(MessagesTest, SayThatWhatTheyWroteDoesNotLast) {
    const auto lasting = std::make_shared<LastingSource>();
    store->addSource("state", "", -1, false, lasting).get();
    auto answer =
        sendLater(request("POST", "/velkor/configuration/ConfigurationSet", R"({"key":"k"})"));
    lasting->awaitCommits(1);
    lasting->fail("no space left");
    EXPECT_EQ(problemIn(std::get<Response>(awaited(std::move(answer)))),
              "500 /problems/internal no space left");
}

TEST_F(MessagesTest, LeaveARecordOfEachWrite) {
    const LogCapture log("velkor::http");
    message("ConfigurationSet", R"({"key":"a b\n","value":{"type":"string","value":"thevalue"}})");
    message("ConfigurationSet", R"({"key":"k","source":"nowhere"})");
    message("ConfigurationGet", R"({"key":"k"})");
    EXPECT_EQ(log.messages(),
              (std::vector<std::string>{"write: POST /velkor/configuration/ConfigurationSet by "
                                        "anybody from 127.0.0.1:50312: a%20b%0A -> 200",
                                        "write: POST /velkor/configuration/ConfigurationSet by "
                                        "anybody from 127.0.0.1:50312: k -> 409"}));
}

TEST(PlainGet, IsTheUsualForm) {
    EXPECT_EQ(keyOfPlainGet(R"({"key":"a.b"})"), "a.b");
    EXPECT_EQ(keyOfPlainGet(" {\t\"key\"\r\n: \"a b\" } \n"), "a b");
    EXPECT_EQ(keyOfPlainGet(R"({"key":""})"), "");
}

TEST(PlainGet, IsNothingElse) {
    for (const char* const json :
         {"", "{}", R"({"key":"a\"b"})", R"({"key":"a","key":"b"})", R"({"key":"a"}})",
          R"({"key":"a")", R"({"key":"a)", R"({"key":5})", R"({"KEY":"a"})", R"({"key":"a"} x)",
          "{\"key\":\"\xC3\xA4\"}", "{\"key\":\"a\tb\"}", R"([{"key":"a"}])", R"({"key" "a"})",
          R"({key:"a"})", "{\"key\":\"\x7F\"}"}) {
        EXPECT_EQ(keyOfPlainGet(json), std::nullopt) << json;
    }
}

/// Both ways to the answer, of which the one is short.
class PlainGetTest : public MessagesTest {};

TEST_F(PlainGetTest, IsAnsweredAsAnyOtherRequest) {
    store->set("a", 1).get();
    store->set("ab", std::string("t\"\xC3\xA4")).get();
    store->set("", 0.5).get();
    const messages::MessageService reference(store);
    const auto dispatcher = reference.dispatcherFor(messages::allRequestTypes());
    std::mt19937 random(11);
    const std::vector<std::string> pieces{"{", "}",  "\"key\"", ":", "\"a\"", "\"ab\"", "\"\"",
                                          " ", "\n", "\"",      "a", ",",     "\\",     "\"b/ ~\""};
    const auto compare = [&](const std::string& json) {
        const auto result = dispatcher->dispatch({"velkor/configuration/ConfigurationGet", json});
        const auto* const reply = std::get_if<messages::JsonMessage>(&result);
        const Response response = message("ConfigurationGet", json);
        ASSERT_EQ(response.status == 200, reply != nullptr) << json;
        if (reply != nullptr) {
            ASSERT_EQ(response.body, reply->json) << json;
        }
    };
    for (int i = 0; i < 3000; ++i) {
        std::string json;
        for (auto length = random() % 7; length > 0; --length) {
            json += pieces[random() % pieces.size()];
        }
        compare(json);
        compare("{\"key\":" + json);
        compare("{\"key\":\"" + json + "\"}");
    }
}

}  // namespace
}  // namespace velkor::http::detail
