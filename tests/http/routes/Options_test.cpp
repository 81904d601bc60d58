#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "http/detail/routes/Target.hpp"
#include "settings/Setting.hpp"
#include "tests/http/routes/ServiceTesting.hpp"
#include "tests/support/HookedSource.hpp"

namespace velkor::http::detail {
namespace {

using velkor::testing::problemIn;

class OptionsTest : public velkor::testing::ServiceTest {
protected:
    void setAll(const std::vector<std::string>& keys) {
        for (const auto& key : keys) store->set(key, 1).get();
    }

    /// The keys of a page in quotes, and where the next one begins.
    std::string page(const std::string& query) {
        const std::string body = get("/config" + query).body;
        std::string keys;
        const std::string begin = "{\"key\":";
        for (auto at = body.find(begin); at != std::string::npos; at = body.find(begin, at + 1)) {
            const auto name = at + begin.size();
            keys += body.substr(name, body.find(',', name) - name) + " ";
        }
        const auto next = body.find("],\"next\":");
        return keys + (next == std::string::npos ? "end" : body.substr(next + 9));
    }
};

TEST_F(OptionsTest, AreNoneInAnEmptyStore) {
    EXPECT_EQ(get("/config").body, R"({"items":[]})");
}

TEST_F(OptionsTest, AreTheEffectiveOnes) {
    store->set("b", 1).get();
    store->set("a", std::string("low"), "default").get();
    store->set("b", 2, "default").get();
    EXPECT_EQ(get("/config").body,
              R"({"items":[{"key":"a","value":{"type":"string","value":"low"},"source":"default"},)"
              R"({"key":"b","value":{"type":"int","value":1},"source":"override"}]})");
}

TEST_F(OptionsTest, ComeWithWhatIsDeclaredOfThem) {
    store->set("port", 80).get();
    store->set("pin", 1234).get();
    const settings::Setting<int> port(store, "port", 1, settings::atLeast(1),
                                      settings::description("where to listen"));
    const settings::Setting<int> pin(store, "pin", 1, settings::secret());
    EXPECT_EQ(
        get("/config").body,
        R"({"items":[{"key":"pin","value":{"type":"int","value":"•••"},"source":"override",)"
        R"("secret":true},{"key":"port","value":{"type":"int","value":80},)"
        R"("source":"override","constraint":"at least 1","description":"where to listen"}]})");
    EXPECT_EQ(get("/config/port").body,
              R"({"key":"port","layers":[{"source":"override","value":{"type":"int","value":80}}],)"
              R"("constraint":"at least 1","description":"where to listen"})");
}

TEST_F(OptionsTest, ComeInPages) {
    setAll({"a", "b", "c", "d", "e"});
    EXPECT_EQ(page("?limit=2"), R"("a" "b" "b"})");
    EXPECT_EQ(page("?limit=2&cursor=b"), R"("c" "d" "d"})");
    EXPECT_EQ(page("?limit=2&cursor=d"), R"("e" end)");
    EXPECT_EQ(page("?limit=5"), R"("a" "b" "c" "d" "e" end)");
    EXPECT_EQ(page("?cursor=e"), "end");
}

TEST_F(OptionsTest, GoOnWhereTheCursorIsThoughItsKeyHasGone) {
    setAll({"a", "c"});
    EXPECT_EQ(page("?cursor=b"), R"("c" end)");
    EXPECT_EQ(page("?cursor=a%00"), R"("c" end)");
}

TEST_F(OptionsTest, AreThoseThatAPrefixBegins) {
    setAll({"a", "net", "net.a", "net.b", "network", "o"});
    EXPECT_EQ(page("?prefix=net."), R"("net.a" "net.b" end)");
    EXPECT_EQ(page("?prefix=net&limit=2"), R"("net" "net.a" "net.a"})");
    EXPECT_EQ(page("?prefix=net&cursor=net.b"), R"("network" end)");
    EXPECT_EQ(page("?prefix=net.&cursor=a"), R"("net.a" "net.b" end)");
    EXPECT_EQ(page("?prefix=net.&cursor=o"), "end");
}

// Bytes are compared as the store sorts them, and the cursor is exact whatever they are.
TEST_F(OptionsTest, KeepKeysOfAnyBytesApart) {
    const std::vector<std::string> keys{
        std::string("a\0b", 3), "a%b", "a\x7F", "a\xC3\xA4", "a\xFE", "a\xFF"};
    setAll(keys);
    std::string cursor;
    for (std::size_t i = 0; i < keys.size(); ++i) {
        const std::string shown = page("?limit=1" + cursor);
        const auto next = shown.find(" \"");
        if (next == std::string::npos) {
            EXPECT_EQ(i, keys.size() - 1);
            break;
        }
        const std::string text = shown.substr(next + 2, shown.size() - next - 4);
        EXPECT_EQ(percentDecoded(text), keys[i]);
        cursor = "&cursor=" + text;
    }
    EXPECT_NE(get("/config").body.find(R"("href":"/config/a%FF")"), std::string::npos);
    EXPECT_NE(get("/config/a%FF").body.find(R"("href":"/config/a%FF","layers":[{)"),
              std::string::npos);
}

TEST_F(OptionsTest, RefuseLimitsThatAreNone) {
    for (const char* const limit : {"0", "10001", "-1", "x", ""}) {
        EXPECT_EQ(problemIn(get("/config?limit=" + std::string(limit))),
                  R"(400 /problems/bad-request \"limit\" must be a number from 1 to 10000.)");
    }
}

TEST_F(OptionsTest, LeaveOutKeysThatGoMeanwhile) {
    const auto source = std::make_shared<velkor::testing::HookedSource>(
        velkor::testing::HookedSource::Table{{"a", 1}, {"b", 2}});
    store->addSource("s", "", -1, false, source).get();
    source->whenKeys = [&] { source->whenHas = [&] { source->values.erase("a"); }; };
    EXPECT_EQ(page(""), R"("b" end)");
}

TEST_F(OptionsTest, HaveLayers) {
    store->set("net/a b", 1).get();
    store->set("net/a b", 2, "default").get();
    const std::string expected =
        R"({"key":"net/a b","layers":[{"source":"override","value":{"type":"int","value":1}},)"
        R"({"source":"default","value":{"type":"int","value":2}}]})";
    EXPECT_EQ(get("/config/net/a%20b").body, expected);
    EXPECT_EQ(get("/config/net%2Fa%20b").body, expected);
}

TEST_F(OptionsTest, AreFoundByTheEmptyKeyToo) {
    EXPECT_EQ(get("/config/").status, 404);
    store->set("", 1).get();
    EXPECT_EQ(get("/config/").body,
              R"({"key":"","layers":[{"source":"override","value":{"type":"int","value":1}}]})");
}

TEST_F(OptionsTest, MaskSecretsInAllLayers) {
    store->set("pin", 1234).get();
    store->set("pin", std::string("default"), "default").get();
    const settings::Setting<int> pin(store, "pin", 1, settings::secret());
    EXPECT_EQ(
        get("/config/pin").body,
        R"({"key":"pin","layers":[{"source":"override","value":{"type":"int","value":"•••"}},)"
        R"({"source":"default","value":{"type":"string","value":"•••"}}],"secret":true})");
}

TEST_F(OptionsTest, AreMissingWhereThereAreNone) {
    EXPECT_EQ(problemIn(get("/config/no%20such")),
              "404 /problems/not-found No option with the specified key was found: no such");
}

TEST_F(OptionsTest, SayWhatASourceThrows) {
    const auto source = std::make_shared<velkor::testing::HookedSource>();
    store->addSource("s", "", -1, false, source).get();
    source->whenKeys = [] { throw std::runtime_error("not reachable"); };
    EXPECT_EQ(problemIn(get("/config")), "500 /problems/internal not reachable");
    source->whenHas = source->whenKeys;
    EXPECT_EQ(problemIn(get("/config/a")), "500 /problems/internal not reachable");
}

}  // namespace
}  // namespace velkor::http::detail
