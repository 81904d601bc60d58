#include "settings/Describe.hpp"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <atomic>
#include <memory>
#include <optional>
#include <string>
#include <thread>
#include <vector>

#include "settings/Bound.hpp"
#include "settings/Secrets.hpp"
#include "settings/Setting.hpp"
#include "tests/configuration/StoreTesting.hpp"
#include "tests/support/BoundedWait.hpp"

namespace velkor::settings::testing {
namespace {

using ::testing::ElementsAre;
using ::testing::Optional;
using ::testing::UnorderedElementsAre;

struct Server {
    int port = 0;
    std::string host{};
};

class DescribeTest : public velkor::testing::StoreTest {
protected:
    std::vector<std::string> keys() const {
        std::vector<std::string> all;
        for (const Description& setting : describe(store)) all.push_back(setting.key);
        return all;
    }

    std::optional<std::string> meantBy(const std::string& key) const {
        store->set(key, 1);
        for (const UndeclaredKey& undeclared : undeclaredKeys(store)) {
            if (undeclared.key == key) return undeclared.meant;
        }
        return "declared";
    }
};

TEST_F(DescribeTest, ListsNothingWhereNothingIsDeclared) {
    EXPECT_TRUE(describe(store).empty());
}

TEST_F(DescribeTest, ListsSettingsAndFieldsByKey) {
    const Setting<int> limit(store, "limit", 1);
    const Bound<Server> server(store, "server",
                               fields(&Server::port, "port", 1, &Server::host, "host", "h"));
    const Setting<bool> debug(store, "debug", false);
    EXPECT_THAT(keys(), ElementsAre("debug", "limit", "server.host", "server.port"));
}

TEST_F(DescribeTest, ListsNoSettingThatIsGone) {
    const Setting<int> limit(store, "limit", 1);
    { const Setting<bool> debug(store, "debug", false); }
    EXPECT_THAT(keys(), ElementsAre("limit"));
}

TEST_F(DescribeTest, ListsNoSettingOfAnotherStore) {
    const auto other = std::make_shared<configuration::ConfigurationImpl>();
    const Setting<int> limit(other, "limit", 1);
    EXPECT_TRUE(describe(store).empty());
}

TEST_F(DescribeTest, TellsAllThatIsDeclared) {
    store->set("limit", 7);
    const Setting<int> limit(store, "limit", 1, needsRestart(), atLeast(1),
                             description("how many"));
    const Description setting = describe(store).front();
    EXPECT_EQ(setting.type, "int");
    EXPECT_THAT(setting.defaultText, Optional(std::string("1")));
    EXPECT_THAT(setting.value, Optional(std::string("7")));
    EXPECT_EQ(setting.source, "override");
    EXPECT_EQ(setting.constraint, "at least 1");
    EXPECT_EQ(setting.description, "how many");
    EXPECT_TRUE(setting.needsRestart);
    EXPECT_FALSE(setting.secret);
    EXPECT_EQ(setting.error, std::nullopt);
}

TEST_F(DescribeTest, TellsOfOneKeyAlone) {
    const Setting<int> limit(store, "limit", 1, description("how many"));
    const Bound<Server> server(store, "server",
                               fields(&Server::port, "port", 1, &Server::host, "host", "h"));
    ASSERT_EQ(describe(store, "limit").size(), 1U);
    EXPECT_EQ(describe(store, "limit").front().description, "how many");
    ASSERT_EQ(describe(store, "server.host").size(), 1U);
    EXPECT_EQ(describe(store, "server.host").front().key, "server.host");
    EXPECT_TRUE(describe(store, "server").empty());
}

TEST_F(DescribeTest, HidesTheSecretsOfOneKeyAsOfAll) {
    store->set("password", std::string("verysecret"));
    const Setting<int> open(store, "password", 1, orDefault());
    const Setting<std::string> hidden(store, "password", "verysecret", secret());
    const auto all = describe(store, "password");
    ASSERT_EQ(all.size(), 2U);
    for (const Description& setting : all) {
        EXPECT_TRUE(setting.secret);
        EXPECT_EQ(setting.error.value_or("•••"), "•••");
    }
}

TEST_F(DescribeTest, HidesSecrets) {
    const Setting<std::string> password(store, "password", "verysecret", secret());
    const Description setting = describe(store).front();
    EXPECT_TRUE(setting.secret);
    EXPECT_THAT(setting.defaultText, Optional(std::string("•••")));
    EXPECT_THAT(setting.value, Optional(std::string("•••")));
}

TEST_F(DescribeTest, HidesWhatAnyOfItsSettingsDeclaresSecret) {
    const Setting<std::string> open(store, "password", "verysecret");
    const Setting<std::string> hidden(store, "password", "verysecret", secret());
    for (const Description& setting : describe(store)) {
        EXPECT_TRUE(setting.secret);
        EXPECT_THAT(setting.defaultText, Optional(std::string("•••")));
        EXPECT_THAT(setting.value, Optional(std::string("•••")));
    }
}

TEST_F(DescribeTest, HidesErrorsThatRepeatWhatAnotherSettingDeclaresSecret) {
    const Setting<int> open(store, "pin", 1);
    const Setting<std::string> hidden(store, "pin", "1", secret());
    store->set("pin", "verysecret");
    std::vector<std::optional<std::string>> errors;
    for (const Description& setting : describe(store)) errors.push_back(setting.error);
    EXPECT_THAT(errors, UnorderedElementsAre(Optional(std::string("•••")), std::nullopt));
}

TEST_F(DescribeTest, ShowsErrorsOfASecretThatSaysSoItself) {
    const Setting<int> pin(store, "pin", 1, secret());
    store->set("pin", "verysecret");
    EXPECT_THAT(describe(store).front().error,
                Optional(std::string("pin: ••• from source \"override\" is no int: not a whole "
                                     "number in plain digits")));
}

TEST_F(DescribeTest, TellsOfErrors) {
    const Setting<int> limit(store, "limit", 1);
    store->set("limit", "many");
    EXPECT_EQ(describe(store).front().error, limit.status().error);
}

TEST_F(DescribeTest, WaitsForNoCallback) {
    Setting<int> limit(store, "limit", 1, secret());
    bool listed = false;
    const auto handle = limit.onChange([&](int, int) {
        listed = velkor::testing::completes([this] {
            describe(store);
            secretKeys(store);
        });
    });
    store->set("limit", 2);
    EXPECT_TRUE(listed);
}

TEST_F(DescribeTest, ListsWhileSettingsComeAndGo) {
    const Setting<int> limit(store, "limit", 1);
    std::atomic<bool> ended{false};
    std::thread other([&] {
        for (int i = 0; i < 300; ++i) {
            const Setting<std::string> password(store, "password", "verysecret", secret());
        }
        ended = true;
    });
    while (!ended) {
        for (const Description& setting : describe(store)) {
            EXPECT_NE(setting.value, std::optional<std::string>("verysecret"));
        }
        EXPECT_EQ(secretKeys(store).count("limit"), 0U);
    }
    other.join();
    EXPECT_THAT(keys(), ElementsAre("limit"));
}

TEST_F(DescribeTest, ListsKeysThatNobodyDeclared) {
    const Setting<int> port(store, "server.port", 1);
    store->set("server.port", 1);
    store->set("colour", 1);
    const auto undeclared = undeclaredKeys(store);
    ASSERT_EQ(undeclared.size(), 1U);
    EXPECT_EQ(undeclared[0].key, "colour");
    EXPECT_EQ(undeclared[0].meant, std::nullopt);
}

TEST_F(DescribeTest, RecognisesNearMisses) {
    const Setting<int> timeout(store, "server.idleTimeout", 1);
    const Setting<int> port(store, "port", 1);
    const std::optional<std::string> wanted("server.idleTimeout");
    for (const std::string key :
         {"server.idle-timeout", "SERVER_IDLE_TIMEOUT", "server.idelTimeout", "server.idleTimeuot",
          "sever.idleTimeout", "server.idleTimeouts", "srver.idleTimeoutt"}) {
        EXPECT_EQ(meantBy(key), wanted) << key;
    }
    EXPECT_EQ(meantBy("prt"), std::optional<std::string>("port"));
}

TEST_F(DescribeTest, TakesNothingElseForANearMiss) {
    const Setting<int> timeout(store, "server.idleTimeout", 1);
    const Setting<int> port(store, "port", 1);
    for (const std::string key : {"server.timeout", "server.idleTime", "pot2", "host"}) {
        EXPECT_EQ(meantBy(key), std::nullopt) << key;
    }
}

TEST_F(DescribeTest, PrefersTheNearest) {
    const Setting<int> first(store, "worker.count", 1);
    const Setting<int> second(store, "worker.count22", 1);
    EXPECT_EQ(meantBy("worker.count222"), std::optional<std::string>("worker.count22"));
}

}  // namespace
}  // namespace velkor::settings::testing
