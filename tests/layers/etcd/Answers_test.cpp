// What is made of the answers of a server, right ones and others.

#include "layers/etcd/detail/Answers.hpp"

#include <gtest/gtest.h>

#include <random>
#include <string>
#include <vector>

#include "layers/etcd/detail/GatewayErrors.hpp"
#include "layers/etcd/detail/JsonReader.hpp"
#include "layers/etcd/detail/Requests.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::layers::etcd {
namespace {

using testing::thrownText;

TEST(EtcdAnswers, RangeHasAllEntries) {
    const auto answer = readRange(
        R"({"header":{"cluster_id":"7","member_id":"1","revision":"12","raft_term":"2"},"kvs":[)"
        R"({"key":"cC9h","create_revision":"3","mod_revision":"11","version":"2","value":"MQ=="},)"
        R"({"key":"cC9i","mod_revision":"4"}],"count":"2","new":[{"a":null}]})");
    EXPECT_EQ(answer.header.cluster, "7");
    EXPECT_EQ(answer.header.revision, 12);
    ASSERT_EQ(answer.entries.size(), 2U);
    EXPECT_EQ(answer.entries[0].key, "p/a");
    EXPECT_EQ(answer.entries[0].value, "1");
    EXPECT_EQ(answer.entries[0].modified, 11);
    EXPECT_EQ(answer.entries[1].value, "");
}

TEST(EtcdAnswers, TransactionHasItsRanges) {
    const auto answer = readTransaction(
        R"({"header":{"cluster_id":"7","revision":"5"},"succeeded":true,"responses":[{"response_put":{}},)"
        R"({"response_range":{"kvs":[{"key":"YQ=="}]}},{"response_range":{}}]})");
    EXPECT_TRUE(answer.succeeded);
    EXPECT_EQ(answer.header.revision, 5);
    ASSERT_EQ(answer.ranges.size(), 2U);
    EXPECT_EQ(answer.ranges[0].entries[0].key, "a");
}

TEST(EtcdAnswers, WatchTellsChangesAndRemovals) {
    const auto answer = readWatch(
        R"({"result":{"header":{"revision":"9"},"events":[{"kv":{"key":"YQ==","mod_revision":"8"}},)"
        R"({"type":"DELETE","kv":{"key":"Yg==","mod_revision":"9"}}]}})");
    ASSERT_EQ(answer.events.size(), 2U);
    EXPECT_FALSE(answer.events[0].isRemoval);
    EXPECT_TRUE(answer.events[1].isRemoval);
    EXPECT_EQ(answer.events[1].entry.modified, 9);
}

TEST(EtcdAnswers, WatchTellsACompaction) {
    const auto answer = readWatch(
        R"({"result":{"header":{},"canceled":true,"compact_revision":"40","cancel_reason":"c"}})");
    EXPECT_TRUE(answer.canceled);
    EXPECT_EQ(answer.compacted, 40);
    EXPECT_EQ(answer.reason, "c");
}

TEST(EtcdAnswers, WatchThrowsAnError) {
    EXPECT_EQ(thrownText<Refused>([] {
                  readWatch(R"({"error":{"grpc_code":14,"message":"etcdserver: no leader"}})");
              }),
              "etcdserver: no leader");
}

TEST(EtcdAnswers, ErrorOfAnyTextHasACode) {
    const auto error = readError(R"({"error":"x","message":"full","code":8})");
    EXPECT_EQ(error.code, 8);
    EXPECT_EQ(error.message, "full");
    EXPECT_EQ(readError("<html>").code, 2);
}

TEST(EtcdAnswers, OfNoSenseAreRefused) {
    for (const char* text :
         {"", "x", "[]", "{", R"({"kvs":[{"key":"?"}]})", R"({"header":{"revision":"x"}})",
          R"({"header":{"revision":"99999999999999999999"}})", R"({"kvs":{}})", "{} {}",
          R"({"kvs":[{"key":"YQ=="}})"}) {
        EXPECT_THROW(readRange(text), BadJson) << text;
    }
}

// Any server answers something.
TEST(EtcdAnswers, OfNoClusterAreRefused) {
    for (const char* text :
         {"{}", R"({"header":{"cluster_id":"7"}})", R"({"header":{"revision":"5"}})",
          R"({"header":{"cluster_id":"7","revision":"0"}})",
          R"({"header":{"cluster_id":"7","revision":"-5"}})",
          R"({"header":{"cluster_id":"7","revision":"9223372036854775807"}})"}) {
        EXPECT_EQ(thrownText<BadJson>([&] { readRange(text); }), "JSON answer is of no cluster")
            << text;
        EXPECT_EQ(thrownText<BadJson>([&] { readTransaction(text); }),
                  "JSON answer is of no cluster")
            << text;
    }
}

TEST(EtcdAnswers, OfWhatIsStillToComeAreRefused) {
    for (const char* revision : {"10", "0", "-1", "9223372036854775807"}) {
        const std::string entry =
            R"({"key":"YQ==","mod_revision":")" + std::string(revision) + "\"}";
        const std::string header = R"("header":{"cluster_id":"7","revision":"9"})";
        EXPECT_THROW(readRange("{" + header + R"(,"kvs":[)" + entry + "]}"), BadJson) << revision;
        EXPECT_THROW(readWatch(R"({"result":{)" + header + R"(,"events":[{"kv":)" + entry + "}]}}"),
                     BadJson)
            << revision;
    }
}

TEST(EtcdAnswers, ErrorIsNoLongerThanASentence) {
    const auto error = readError(R"({"message":")" + std::string(100'000, 'x') + R"(","code":8})");
    EXPECT_EQ(error.code, 8);
    EXPECT_EQ(error.message, "");
}

TEST(EtcdAnswers, OfAnyDepthAreRefused) {
    const std::string deep = R"({"new":)" + std::string(1'000'000, '[');
    EXPECT_EQ(thrownText<BadJson>([&] { readRange(deep); }), "JSON is nested too deep");
}

// Whatever comes, it is read or refused.
TEST(EtcdAnswers, OfDamagedTextDoNoHarm) {
    const std::string good =
        R"({"result":{"header":{"revision":"9"},"events":[{"kv":{"key":"YQ==","value":"Yg==")"
        R"(,"mod_revision":"8"}},{"type":"DELETE","kv":{"key":"Yg=="}}],"x":[1e5,null,"\u00e9"]}})";
    std::minstd_rand random(1);
    for (int round = 0; round < 20'000; ++round) {
        std::string text = good.substr(0, random() % 5 == 0 ? random() % good.size() : good.size());
        for (unsigned i = 0; i < 1 + random() % 4 && !text.empty(); ++i) {
            text[random() % text.size()] = static_cast<char>(random() % 256);
        }
        try {
            readWatch(text);
        } catch (const BadJson&) {
        } catch (const Refused&) {
        }
    }
}

TEST(EtcdRequests, EndOfAPrefixIsBehindAllItsKeys) {
    EXPECT_EQ(endOfPrefix("a/"), "a0");
    EXPECT_EQ(endOfPrefix("a\xFF\xFF"), "b");
    EXPECT_EQ(endOfPrefix(""), std::string(1, '\0'));
    EXPECT_EQ(endOfPrefix("\xFF"), std::string(1, '\0'));
}

TEST(EtcdRequests, AskForAllKeysWithoutAPrefix) {
    EXPECT_EQ(rangeRequest(""), R"({"key":"AA==","range_end":"AA=="})");
}

TEST(EtcdRequests, CompareWhatWasSeen) {
    EXPECT_EQ(transactionRequest({{"a", "1", {6, true}}}, true),
              R"({"compare":[{"key":"YQ==","target":"MOD","result":"LESS","mod_revision":"7"},)"
              R"({"key":"YQ==","target":"VERSION","result":"GREATER","version":"0"}],)"
              R"("success":[{"request_put":{"key":"YQ==","value":"MQ=="}}],)"
              R"("failure":[{"request_range":{"key":"YQ=="}}]})");
}

TEST(EtcdRequests, CompareTwiceWhereTheServerTakesIt) {
    const auto comparisonsOf = [](int keys) {
        std::vector<KeyChange> changes;
        for (int i = 0; i < keys; ++i) changes.push_back({std::to_string(i), "1", {6, true}});
        const std::string request = transactionRequest(changes, false);
        int count = 0;
        for (auto at = request.find("target"); at != std::string::npos;
             at = request.find("target", at + 1)) {
            ++count;
        }
        return count;
    };
    EXPECT_EQ(comparisonsOf(1), 2);
    EXPECT_EQ(comparisonsOf(64), 128);
    EXPECT_EQ(comparisonsOf(65), 65);
    EXPECT_EQ(comparisonsOf(128), 128);
}

TEST(EtcdRequests, CompareOnceWhatIsNotToBeThere) {
    EXPECT_EQ(transactionRequest({{"b", "1", {6, false}}, {"c", std::nullopt, {6, false}}}, true),
              R"({"compare":[{"key":"Yg==","target":"VERSION","result":"EQUAL","version":"0"},)"
              R"({"key":"Yw==","target":"VERSION","result":"EQUAL","version":"0"}],)"
              R"("success":[{"request_put":{"key":"Yg==","value":"MQ=="}},)"
              R"({"request_delete_range":{"key":"Yw=="}}],)"
              R"("failure":[{"request_range":{"key":"Yg=="}},{"request_range":{"key":"Yw=="}}]})");
}

}  // namespace
}  // namespace velkor::layers::etcd
