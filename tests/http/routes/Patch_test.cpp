#include <gtest/gtest.h>

#include <future>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "http/detail/routes/ChangeRequest.hpp"
#include "http/detail/routes/Problem.hpp"
#include "settings/Setting.hpp"
#include "tests/http/routes/LastingSource.hpp"
#include "tests/http/routes/ServiceTesting.hpp"
#include "tests/support/LogCapture.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::http::detail {
namespace {

using configuration::ConfigurationValue;
using velkor::testing::LastingSource;
using velkor::testing::LogCapture;
using velkor::testing::problemIn;
using velkor::testing::thrownText;

class PatchTest : public velkor::testing::ServiceTest {
protected:
    Response patch(const std::string& changes, const std::string& query = "") {
        return send("PATCH", "/config" + query, R"({"changes":[)" + changes + "]}");
    }

    static std::string set(const std::string& key, int value) {
        return R"({"key":")" + key + R"(","value":{"type":"int","value":)" + std::to_string(value) +
               "}}";
    }
};

TEST_F(PatchTest, MakesAllChanges) {
    store->set("a", 1).get();
    store->set("gone", std::string("old")).get();
    EXPECT_EQ(patch(set("a", 2) + "," + set("b", 3) + R"(,{"key":"gone","unset":true})" +
                    R"(,{"key":"c","value":{"type":"bool","value":true},"source":"default"})")
                  .body,
              R"({"dryRun":false,"changes":[)"
              R"({"key":"a","source":"override","before":{"type":"int","value":1}},)"
              R"({"key":"b","source":"override"},)"
              R"({"key":"gone","source":"override","before":{"type":"string","value":"old"}},)"
              R"({"key":"c","source":"default"}]})");
    EXPECT_EQ(boost::get<int>(store->get("a").get()), 2);
    EXPECT_EQ(boost::get<int>(store->get("b").get()), 3);
    EXPECT_FALSE(store->has("gone").get());
    EXPECT_EQ(store->getOption("c").get().source, "default");
}

TEST_F(PatchTest, MakesNoneWhereOneIsRefused) {
    EXPECT_EQ(
        problemIn(patch(
            set("a", 2) +
            R"(,{"key":"b","unset":true,"source":"x"},{"key":"c","unset":true,"source":"y"})")),
        "409 /problems/not-writable Changes refused: Source not found or not writable: b, x; "
        "Source not found or not writable: c, y");
    EXPECT_FALSE(store->has("a").get());
}

TEST_F(PatchTest, ChangesNothingInADryRun) {
    store->set("a", 1).get();
    for (const char* const query : {"?dry-run", "?dry-run=", "?dry-run=true"}) {
        EXPECT_EQ(patch(set("a", 2), query).body,
                  R"({"dryRun":true,"changes":[{"key":"a","source":"override",)"
                  R"("before":{"type":"int","value":1}}]})");
    }
    EXPECT_EQ(boost::get<int>(store->get("a").get()), 1);
    EXPECT_EQ(patch(R"({"key":"a","unset":true,"source":"x"})", "?dry-run").status, 409);
}

TEST_F(PatchTest, ChangesWhereADryRunIsDenied) {
    EXPECT_EQ(patch(set("a", 2), "?dry-run=false").status, 200);
    EXPECT_TRUE(store->has("a").get());
    EXPECT_EQ(problemIn(patch(set("b", 2), "?dry-run=1")),
              R"(400 /problems/bad-request \"dry-run\" must be true or false.)");
    EXPECT_FALSE(store->has("b").get());
}

TEST_F(PatchTest, MasksSecrets) {
    store->set("pin", 1234).get();
    const settings::Setting<int> secret(store, "pin", 1, settings::secret());
    for (const char* const query : {"", "?dry-run"}) {
        EXPECT_NE(patch(set("pin", 5), query).body.find(R"("before":{"type":"int","value":"•••"})"),
                  std::string::npos);
    }
}

TEST_F(PatchTest, RefusesBodiesThatAreNoUtf8) {
    EXPECT_EQ(patch("{\"key\":\"a\xC3(\",\"value\":{\"type\":\"int\",\"value\":1}}").status, 400);
    EXPECT_TRUE(store->keys().get().empty());
}

TEST_F(PatchTest, WaitsForTheLayersThatItWroteAndNotForTheWorker) {
    const auto written = std::make_shared<LastingSource>();
    const auto other = std::make_shared<LastingSource>();
    store->addSource("written", "w", -1, false, written).get();
    store->addSource("other", "o", -1, false, other).get();
    auto answer = sendLater(
        request("PATCH", "/config", R"({"changes":[)" + set("w.a", 1) + "," + set("b", 2) + "]}"));
    written->awaitCommits(1);
    EXPECT_EQ(get("/config").status, 200);
    EXPECT_EQ(answer.wait_for(std::chrono::seconds(0)), std::future_status::timeout);
    written->commit();
    EXPECT_EQ(std::get<Response>(awaited(std::move(answer))).status, 200);
}

TEST_F(PatchTest, GroupsWritersThatWaitForTheSameLayer) {
    const auto lasting = std::make_shared<LastingSource>();
    store->addSource("state", "", -1, false, lasting).get();
    std::vector<std::future<Answer>> answers;
    for (int i = 0; i < 10; ++i) {
        answers.push_back(sendLater(request(
            "PATCH", "/config", R"({"changes":[)" + set("k" + std::to_string(i), i) + "]}")));
    }
    lasting->awaitCommits(10);
    lasting->commit();
    for (auto& answer : answers) {
        EXPECT_EQ(std::get<Response>(awaited(std::move(answer))).status, 200);
    }
}

TEST_F(PatchTest, SaysThatWhatItWroteDoesNotLast) {
    const LogCapture log("velkor::http");
    const auto good = std::make_shared<LastingSource>();
    const auto bad = std::make_shared<LastingSource>();
    store->addSource("good", "g", -1, false, good).get();
    store->addSource("bad", "b", -1, false, bad).get();
    auto answer = sendLater(request(
        "PATCH", "/config", R"({"changes":[)" + set("g.a", 1) + "," + set("b.a", 2) + "]}"));
    good->awaitCommits(1);
    bad->awaitCommits(1);
    bad->fail("no space left");
    good->commit();
    EXPECT_EQ(problemIn(std::get<Response>(awaited(std::move(answer)))),
              "500 /problems/internal no space left");
    EXPECT_EQ(log.messages(),
              (std::vector<std::string>{
                  "write: PATCH /config by anybody from 127.0.0.1:50312: g.a, b.a -> 500"}));
}

TEST_F(PatchTest, SaysThatALayerWentBeforeItAnswered) {
    const auto lasting = std::make_shared<LastingSource>();
    store->addSource("state", "", -1, false, lasting).get();
    auto answer = sendLater(request("PATCH", "/config", R"({"changes":[)" + set("a", 1) + "]}"));
    lasting->awaitCommits(1);
    lasting->abandon();
    EXPECT_EQ(problemIn(std::get<Response>(awaited(std::move(answer)))),
              "500 /problems/internal Promise destroyed before it provided a value.");
}

TEST_F(PatchTest, LetsTheServiceGoWhileALayerCommits) {
    const auto lasting = std::make_shared<LastingSource>();
    store->addSource("state", "", -1, false, lasting).get();
    auto answer = sendLater(request("PATCH", "/config", R"({"changes":[)" + set("a", 1) + "]}"));
    lasting->awaitCommits(1);
    handler->stop();
    handler.reset();
    store.reset();
    lasting->commit();
    EXPECT_EQ(std::get<Response>(awaited(std::move(answer))).status, 200);
}

TEST_F(PatchTest, LeavesARecordOfKeysAndNoValues) {
    const LogCapture log("velkor::http");
    patch(set("a", 77) + "," + set("b", 77));
    patch(set("a", 77), "?dry-run");
    patch(R"({"key":"c","unset":true,"source":"x"})");
    patch("{}");
    patch(R"({"key":"d","unset":true,"source":"x"})", "?dry-run");
    EXPECT_EQ(log.messages(),
              (std::vector<std::string>{
                  "write: PATCH /config by anybody from 127.0.0.1:50312: a, b -> 200",
                  "write: PATCH /config by anybody from 127.0.0.1:50312: c -> 409",
                  "write: PATCH /config by anybody from 127.0.0.1:50312 -> 400",
                  "write: PATCH /config by anybody from 127.0.0.1:50312 -> 409"}));
    EXPECT_EQ(log.records().front().severity, common::warning);
}

TEST_F(PatchTest, RefusesAKeyThatIsGivenTwice) {
    EXPECT_EQ(problemIn(patch(set("a", 1) + "," + set("b", 1) + "," + set("a", 2))),
              "400 /problems/bad-request A key is given twice: a");
    EXPECT_FALSE(store->has("a").get());
}

TEST_F(PatchTest, RefusesTheMaskOfASecret) {
    const auto setMask = [&](const std::string& key, const std::string& type) {
        return problemIn(
            patch(R"({"key":")" + key + R"(","value":{"type":")" + type + R"(","value":"•••"}})"));
    };
    const settings::Setting<std::string> secret(store, "password", "d", settings::secret());
    for (const char* const type : {"string", "ustring"}) {
        EXPECT_EQ(setMask("password", type),
                  "400 /problems/bad-request The value is what is shown in the place of a secret: "
                  "password");
        EXPECT_EQ(setMask("other", type).substr(0, 3), "200");
    }
    EXPECT_FALSE(store->has("password").get());
}

TEST_F(PatchTest, CutsLongRecords) {
    const LogCapture log("velkor::http");
    std::string changes = set("k0", 0);
    for (int i = 1; i < 1000; ++i) changes += "," + set("k" + std::to_string(i), i);
    patch(changes + "," + set(std::string(5000, 'k'), 1));
    ASSERT_EQ(log.messages().size(), 1U);
    EXPECT_LT(log.messages().front().size(), 1500U);
    EXPECT_NE(log.messages().front().find(" more -> 200"), std::string::npos);
}

// ---- What a body must be

ConfigurationValue parsedValue(const std::string& value) {
    return *parsedChanges(R"({"changes":[{"key":"k","value":)" + value + "}]}", {}).at(0).value;
}

std::string refusalOf(const std::string& body) {
    return thrownText<Problem>([&] { parsedChanges(body, {}); });
}

std::string refusalOfChange(const std::string& change) {
    return refusalOf(R"({"changes":[)" + change + "]}");
}

std::string refusalOfValue(const std::string& value) {
    return refusalOfChange(R"({"key":"k","value":)" + value + "}");
}

TEST(ChangeRequest, ReadsEachKindOfValue) {
    const std::vector<std::pair<std::string, ConfigurationValue>> cases{
        {R"({"type":"bool","value":true})", true},
        {R"({"value":-2147483648,"type":"int"})", std::numeric_limits<int>::min()},
        {R"({"type":"uint","value":4294967295})", 4294967295U},
        {R"({"type":"double","value":0.5})", 0.5},
        {R"({"type":"double","value":3})", 3.0},
        {R"({"type":"ustring","value":"a•"})", std::u16string(u"a•")},
        {R"({"type":"string","value":"text"})", std::string("text")},
        {R"({"type":"boolArray","value":[true,false]})", std::vector<bool>{true, false}},
        {R"({"type":"intArray","value":[]})", std::vector<int>{}},
        {R"({"type":"uintArray","value":[0,1]})", std::vector<unsigned>{0, 1}},
        {R"({"type":"doubleArray","value":[1,2.5]})", std::vector<double>{1, 2.5}},
        {R"({"type":"stringArray","value":["a",""]})", std::vector<std::string>{"a", ""}},
        {R"({"type":"ustringArray","value":["a"]})", std::vector<std::u16string>{u"a"}}};
    for (const auto& [json, value] : cases) EXPECT_TRUE(parsedValue(json) == value) << json;
}

TEST(ChangeRequest, RefusesValuesThatAreNotOfTheirType) {
    const std::vector<std::pair<std::string, std::string>> cases{{"bool", R"("true")"},
                                                                 {"bool", "1"},
                                                                 {"bool", "null"},
                                                                 {"int", "2147483648"},
                                                                 {"int", "-2147483649"},
                                                                 {"int", "1.0"},
                                                                 {"int", "1.5"},
                                                                 {"int", R"("1")"},
                                                                 {"int", "true"},
                                                                 {"int", "null"},
                                                                 {"int", "[1]"},
                                                                 {"int", "{}"},
                                                                 {"uint", "-1"},
                                                                 {"uint", "4294967296"},
                                                                 {"double", R"("0.5")"},
                                                                 {"double", "null"},
                                                                 {"double", "true"},
                                                                 {"double", R"("inf")"},
                                                                 {"string", "5"},
                                                                 {"string", "null"},
                                                                 {"string", "{}"},
                                                                 {"ustring", "5"},
                                                                 {"ustring", "[]"},
                                                                 {"intArray", "1"},
                                                                 {"intArray", R"([1,"2"])"},
                                                                 {"intArray", "[null]"},
                                                                 {"stringArray", R"(["a",1])"},
                                                                 {"boolArray", "[1]"},
                                                                 {"doubleArray", "[null]"},
                                                                 {"ustringArray", "{}"}};
    for (const auto& [type, value] : cases) {
        EXPECT_EQ(refusalOfValue(R"({"type":")" + type + R"(","value":)" + value + "}"),
                  R"(changes[0].value: "value" is not of the type ")" + type + R"(")")
            << value;
    }
}

TEST(ChangeRequest, RefusesWhatIsNoValue) {
    const std::vector<std::pair<std::string, std::string>> cases{
        {"5", R"(is no object of "type" and "value")"},
        {"null", R"(is no object of "type" and "value")"},
        {R"({"value":5})", R"("type" is missing or no text)"},
        {R"({"type":5,"value":5})", R"("type" is missing or no text)"},
        {R"({"type":"int"})", R"("value" is missing)"},
        {R"({"type":"Int","value":5})", R"(unknown type "Int")"},
        {R"({"type":"","value":5})", R"(unknown type "")"},
        {R"({"type":"int","value":5,"more":1})", R"(unknown member "more")"}};
    for (const auto& [value, text] : cases) {
        EXPECT_EQ(refusalOfValue(value), "changes[0].value: " + text);
    }
}

TEST(ChangeRequest, RefusesWhatIsNoChange) {
    const std::vector<std::pair<std::string, std::string>> cases{
        {"5", "changes[0]: is no object"},
        {"{}", "changes[0].key: is missing or no text"},
        {R"({"key":5,"unset":true})", "changes[0].key: is missing or no text"},
        {R"({"key":"k"})", R"(changes[0]: needs one of "value" and "unset")"},
        {R"({"key":"k","unset":true,"value":{"type":"int","value":1}})",
         R"(changes[0]: needs one of "value" and "unset")"},
        {R"({"key":"k","unset":false})", "changes[0].unset: is not true"},
        {R"({"key":"k","unset":1})", "changes[0].unset: is not true"},
        {R"({"key":"k","unset":true,"source":5})", "changes[0].source: is no text"},
        {R"({"key":"k","unset":true,"source":null})", "changes[0].source: is no text"},
        {R"({"key":"k","unset":true,"sorce":"s"})", R"(changes[0]: unknown member "sorce")"},
        {R"({"key":"k","unset":true},[])", "changes[1]: is no object"}};
    for (const auto& [change, text] : cases) EXPECT_EQ(refusalOfChange(change), text);
}

TEST(ChangeRequest, RefusesBodiesWithoutChanges) {
    const std::string missing = "changes: is missing or no list of changes";
    EXPECT_EQ(refusalOf("{}"), missing);
    EXPECT_EQ(refusalOf(R"({"changes":{}})"), missing);
    EXPECT_EQ(refusalOf(R"({"changes":[]})"), missing);
    EXPECT_EQ(refusalOf(R"({"changes":[],"dryRun":true})"), R"(The body: unknown member "dryRun")");
}

}  // namespace
}  // namespace velkor::http::detail
