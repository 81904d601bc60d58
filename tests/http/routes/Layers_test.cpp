#include "http/detail/routes/Layers.hpp"

#include <gtest/gtest.h>

#include <chrono>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "configuration/sources/JournaledSource.hpp"
#include "configuration/sources/MonitoredSource.hpp"
#include "http/detail/routes/Items.hpp"
#include "settings/Setting.hpp"
#include "tests/http/routes/ServiceTesting.hpp"
#include "tests/support/HookedSource.hpp"

namespace velkor::http::detail {
namespace {

using configuration::RecordedChange;
using configuration::SourceState;
using velkor::testing::HookedSource;
using velkor::testing::problemIn;
using Clock = std::chrono::system_clock;

Clock::time_point at(int milliseconds) {
    return Clock::time_point(std::chrono::milliseconds(milliseconds));
}

class WatchedSource final : public HookedSource, public configuration::MonitoredSource {
public:
    SourceState state() const override { return current; }

    SourceState current;
};

/// Gives the changes of what it is asked for, and notes that.
class RememberingSource final : public HookedSource, public configuration::JournaledSource {
public:
    std::vector<RecordedChange> changes(const std::string& keyOrPrefix,
                                        std::size_t limit) override {
        asked.push_back(keyOrPrefix + " " + std::to_string(limit));
        if (failure) throw std::runtime_error(*failure);
        return kept;
    }

    std::vector<RecordedChange> kept;
    std::vector<std::string> asked;
    std::optional<std::string> failure;
};

class LayersTest : public velkor::testing::ServiceTest {
protected:
    template <class Source>
    std::shared_ptr<Source> add(const std::string& name, const std::string& group = "") {
        auto source = std::make_shared<Source>();
        store->addSource(name, group, -1, true, source).get();
        return source;
    }
};

TEST_F(LayersTest, AreListedInTheirOrder) {
    add<RememberingSource>("journal", "g");
    EXPECT_EQ(get("/sources").body,
              R"({"mayWrite":true,"sources":[{"name":"journal","group":"g.","order":-1,)"
              R"("readOnly":true,"canForget":false,"journal":true},)"
              R"({"name":"override","group":"","order":0,"readOnly":false,"canForget":true,)"
              R"("journal":false},{"name":"default","group":"","order":2147483647,)"
              R"("readOnly":false,"canForget":true,"journal":false}]})");
}

TEST_F(LayersTest, SayHowTheyStand) {
    const auto source = add<WatchedSource>("w");
    const auto stateText = [&] {
        const std::string body = get("/sources").body;
        const auto begin = body.find("\"state\":");
        return body.substr(begin, body.find("},{\"name\":\"override\"") - begin);
    };
    EXPECT_EQ(stateText(), R"("state":{"well":true,"details":{}})");
    source->current = {false, at(1500), at(0), "gone\n", {{"end\"point", "a"}, {"revision", "7"}}};
    EXPECT_EQ(stateText(), R"("state":{"well":false,"since":"1970-01-01T00:00:01.500Z",)"
                           R"("updated":"1970-01-01T00:00:00.000Z","lastError":"gone\n",)"
                           R"("details":{"end\"point":"a","revision":"7"}})");
}

TEST_F(LayersTest, DecideWhetherTheServiceIsReady) {
    EXPECT_EQ(get("/readyz").body, "ready\n");
    const auto first = add<WatchedSource>("first");
    const auto second = add<WatchedSource>("second");
    EXPECT_EQ(get("/readyz").status, 200);
    first->current.isWell = second->current.isWell = false;
    const Response response = get("/readyz");
    EXPECT_EQ(response.status, 503);
    EXPECT_EQ(response.body, "not ready: second, first\n");
    EXPECT_EQ(get("/healthz").body, "alive\n");
}

TEST_F(LayersTest, AreNotListedWhenTheyGoMeanwhile) {
    add<WatchedSource>("first");
    add<WatchedSource>("second");
    std::vector<std::string> names;
    const ServerOptions none;
    const Access access(none);
    KeyList keys;
    const Context context{store, none, access, keys, nullptr, nullptr, nullptr, nullptr, {}};
    forEachSource(context, [&](const auto& layer, auto&) {
        names.push_back(layer.name);
        store->removeSource("first").get();
    });
    EXPECT_EQ(names, (std::vector<std::string>{"second", "override", "default"}));
}

TEST_F(LayersTest, ListWhatIsDeclared) {
    store->set("limit", std::string("x")).get();
    store->set("pin", 1234).get();
    const settings::Setting<int> limit(store, "limit", 7, settings::atLeast(1),
                                       settings::orDefault(), settings::needsRestart(),
                                       settings::description("how many"));
    const settings::Setting<int> pin(store, "pin", 1, settings::secret());
    const std::string body = get("/settings").body;
    EXPECT_EQ(body.substr(0, body.find(",\"error\"")),
              R"({"settings":[{"key":"limit","type":"int","default":"7","value":"7","source":"",)"
              R"("constraint":"at least 1","description":"how many","secret":false,)"
              R"("needsRestart":true)");
    EXPECT_EQ(body.substr(body.find("{\"key\":\"pin\"")),
              R"({"key":"pin","type":"int","default":"•••","value":"•••","source":"override",)"
              R"("constraint":"","description":"","secret":true,"needsRestart":false}]})");
}

TEST_F(LayersTest, KeepNoHistoryOfThemselves) {
    EXPECT_EQ(get("/history").body, R"({"kept":false,"changes":[]})");
}

TEST_F(LayersTest, TellTheirHistoryTogether) {
    const auto first = add<RememberingSource>("first", "a");
    const auto second = add<RememberingSource>("second");
    first->kept = {{3, at(3000), "ann", "set", "k", 1, 2},
                   {1, at(1000), "bob", "unset", "k", 5, {}}};
    second->kept = {{9, at(2000), "\xFF", "other", "x", {}, std::string("v")}};
    EXPECT_EQ(get("/history").body,
              R"({"kept":true,"changes":[{"source":"first","number":3,)"
              R"("when":"1970-01-01T00:00:03.000Z","author":"ann","action":"set","key":"a.k",)"
              R"("before":{"type":"int","value":1},"after":{"type":"int","value":2}},)"
              R"({"source":"second","number":9,"when":"1970-01-01T00:00:02.000Z","author":")"
              "\xEF\xBF\xBD"
              R"(","action":"other","key":"x","after":{"type":"string","value":"v"}},)"
              R"({"source":"first","number":1,"when":"1970-01-01T00:00:01.000Z","author":"bob",)"
              R"("action":"unset","key":"a.k","before":{"type":"int","value":5}}]})");
}

TEST_F(LayersTest, CutTheirHistory) {
    const auto source = add<RememberingSource>("s");
    source->kept = {
        {3, at(3), "a", "set", "k"}, {2, at(2), "a", "set", "k"}, {1, at(1), "a", "set", "k"}};
    const std::string body = get("/history?limit=2").body;
    EXPECT_NE(body.find("\"number\":2"), std::string::npos);
    EXPECT_EQ(body.find("\"number\":1"), std::string::npos);
    EXPECT_EQ(source->asked, (std::vector<std::string>{" 2"}));
    EXPECT_EQ(get("/history?limit=0").status, 400);
    EXPECT_EQ(get("/history?limit=10001").status, 400);
}

TEST_F(LayersTest, AreAskedForTheHistoryOfTheirOwnKeys) {
    const auto grouped = add<RememberingSource>("grouped", "net.a");
    const std::vector<std::pair<std::string, std::vector<std::string>>> cases{
        {"net.a.port", {"port 100"}},
        {"net.a.b.", {"b. 100"}},
        {"net.a.", {" 100"}},
        {"net.", {" 100"}},
        {"", {" 100"}},
        {"net.a", {}},
        {"net", {}},
        {"net.b.", {}},
        {"port", {}},
        {"net.ab.c", {}}};
    for (const auto& [key, asked] : cases) {
        grouped->asked.clear();
        EXPECT_EQ(get("/history?key=" + key).status, 200);
        EXPECT_EQ(grouped->asked, asked) << key;
    }
}

TEST_F(LayersTest, MaskSecretsInTheirHistory) {
    const auto grouped = add<RememberingSource>("grouped", "net");
    grouped->kept = {{1, at(0), "ann", "set", "pin", 1, 2}, {2, at(0), "ann", "set", "x", 1, 2}};
    const settings::Setting<int> pin(store, "net.pin", 1, settings::secret());
    const settings::Setting<int> other(store, "x", 1, settings::secret());
    const std::string body = get("/history").body;
    EXPECT_NE(body.find(R"("key":"net.pin","before":{"type":"int","value":"•••"},)"
                        R"("after":{"type":"int","value":"•••"})"),
              std::string::npos);
    EXPECT_NE(body.find(R"("key":"net.x","before":{"type":"int","value":1})"), std::string::npos);
}

TEST_F(LayersTest, SayWhyTheirHistoryCanNotBeRead) {
    add<RememberingSource>("s")->failure = "no such disk";
    EXPECT_EQ(problemIn(get("/history")), "500 /problems/internal no such disk");
}

TEST(UtcText, IsOfAnyTime) {
    using std::chrono::hours;
    EXPECT_EQ(utcText(at(-1)), "1969-12-31T23:59:59.999Z");
    EXPECT_EQ(utcText(Clock::time_point(hours(24 * 20000)) + std::chrono::microseconds(1999)),
              "2024-10-04T00:00:00.001Z");
}

}  // namespace
}  // namespace velkor::http::detail
