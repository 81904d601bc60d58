#include "layers/environment/EnvironmentNames.hpp"

#include <gtest/gtest.h>

#include <optional>
#include <ostream>
#include <set>
#include <stdexcept>
#include <string>
#include <vector>

#include "tests/support/Thrown.hpp"

namespace velkor::layers {
namespace {

using velkor::testing::thrownText;

// One with an upper-case letter, one with a dash, one whose name would otherwise stand for another
// key, and one that need not be listed.
const std::vector<std::string> listed{"mail.replyTo", "log-level", "a_.b", "plain.key"};

struct NamedKey {
    const char* test;
    std::string name;
    std::string key;

    friend std::ostream& operator<<(std::ostream& out, const NamedKey& it) {
        return out << it.name << " is " << it.key;
    }
};

class NamedKeyTest : public ::testing::TestWithParam<NamedKey> {
protected:
    const EnvironmentNames names{"VELKOR_", listed};
};

TEST_P(NamedKeyTest, IsReadFromItsName) {
    EXPECT_EQ(names.keyOf(GetParam().name), GetParam().key);
}

TEST_P(NamedKeyTest, GivesItsNameBack) {
    EXPECT_EQ(names.nameOf(GetParam().key), GetParam().name);
}

INSTANTIATE_TEST_SUITE_P(
    Keys, NamedKeyTest,
    ::testing::Values(
        NamedKey{"OneWord", "VELKOR_PORT", "port"}, NamedKey{"Digits", "VELKOR_0X9", "0x9"},
        NamedKey{"TwoUnderscoresAreAPoint", "VELKOR_SERVER__PORT", "server.port"},
        NamedKey{"OneUnderscoreIsItself", "VELKOR_MAX_SIZE", "max_size"},
        NamedKey{"Both", "VELKOR_SERVER__MAX_SIZE", "server.max_size"},
        NamedKey{"ThreeAreReadFromTheLeft", "VELKOR_A___B", "a_.b"},  // since it is listed
        NamedKey{"ThreeElsewhere", "VELKOR_A___C", "a._c"},
        NamedKey{"Four", "VELKOR_A____B", "a..b"}, NamedKey{"Five", "VELKOR_A_____B", "a.._b"},
        NamedKey{"PointAtTheEnd", "VELKOR_A__", "a."},
        NamedKey{"UnderscoreAtTheEnd", "VELKOR_A_", "a_"},
        NamedKey{"PointAndUnderscoreAtTheEnd", "VELKOR_A___", "a._"},
        NamedKey{"UnderscoreAtTheBeginning", "VELKOR__A", "_a"},
        NamedKey{"PointAtTheBeginning", "VELKOR___A", ".a"},
        NamedKey{"NothingButAnUnderscore", "VELKOR__", "_"},
        NamedKey{"NothingButAPoint", "VELKOR___", "."},
        NamedKey{"PrefixOnceMore", "VELKOR_VELKOR_A", "velkor_a"},
        NamedKey{"ListedWithUpperCase", "VELKOR_MAIL__REPLYTO", "mail.replyTo"},
        NamedKey{"ListedWithADash", "VELKOR_LOG_LEVEL", "log-level"},
        NamedKey{"ListedThoughItNeedNotBe", "VELKOR_PLAIN__KEY", "plain.key"}),
    [](const auto& tested) { return tested.param.test; });

class NoKeyTest : public ::testing::TestWithParam<std::string> {};

TEST_P(NoKeyTest, IsReadFromSuchAName) {
    EXPECT_EQ(EnvironmentNames("VELKOR_", listed).keyOf(GetParam()), std::nullopt);
}

INSTANTIATE_TEST_SUITE_P(Names, NoKeyTest,
                         ::testing::Values("", "VELKOR", "VELKOR_", "PORT", "OTHER_PORT",
                                           "velkor_PORT", "Velkor_PORT", "MY_VELKOR_PORT",
                                           "VELKOR_port", "VELKOR_Port", "VELKOR_PORt",
                                           "VELKOR_A-B", "VELKOR_A.B", "VELKOR_A B",
                                           "VELKOR_\xc3\x84", "VELKOR_LOG-LEVEL"));

class NamelessKeyTest : public ::testing::TestWithParam<std::string> {};

TEST_P(NamelessKeyTest, HasNoName) {
    EXPECT_EQ(EnvironmentNames("VELKOR_", listed).nameOf(GetParam()), std::nullopt);
}

INSTANTIATE_TEST_SUITE_P(Keys, NamelessKeyTest,
                         ::testing::Values("", "Port", "a-b", "a b", "a=b", "\xc3\xa4", "a__b",
                                           "a_.c", "_.", "__", "a.b_.c",
                                           // The names of these stand for listed keys.
                                           "mail.replyto", "log_level", "a._b"));

// All texts over `alphabet` of `length` bytes at most.
std::vector<std::string> allTexts(const std::string& alphabet, std::size_t length) {
    std::vector<std::string> texts{""};
    for (std::size_t first = 0, size = 1; size <= length; ++size) {
        const std::size_t end = texts.size();
        for (; first < end; ++first) {
            for (const char byte : alphabet) texts.push_back(texts[first] + byte);
        }
    }
    return texts;
}

TEST(EnvironmentNames, EveryNameThatStandsForAKeyIsTheNameOfThatKey) {
    const EnvironmentNames names("P_", {"a-b", "B.a", "__"});
    std::set<std::string> keys;
    std::size_t count = 0;
    for (const auto& rest : allTexts("AB0_", 6)) {
        const auto key = names.keyOf("P_" + rest);
        if (!key) continue;
        EXPECT_EQ(names.nameOf(*key), "P_" + rest);
        keys.insert(*key);
        ++count;
    }
    EXPECT_EQ(count, 4U + 16U + 64U + 256U + 1024U + 4096U);
    EXPECT_EQ(keys.size(), count) << "two names stand for one key";
}

TEST(EnvironmentNames, AKeyHasANameUnlessSomethingFollowsAnUnderscoreThatANameCantSay) {
    const EnvironmentNames names("P_");
    for (const auto& key : allTexts("aA_.-", 5)) {
        const bool canBeNamed = !key.empty() && key.find('A') == std::string::npos &&
                                key.find('-') == std::string::npos &&
                                key.find("__") == std::string::npos &&
                                key.find("_.") == std::string::npos;
        const auto name = names.nameOf(key);
        EXPECT_EQ(name.has_value(), canBeNamed) << key;
        EXPECT_TRUE(!name || names.keyOf(*name) == key) << key;
    }
}

TEST(EnvironmentNames, ThePrefixIsTakenAsItIs) {
    EXPECT_EQ(EnvironmentNames("app").keyOf("appPORT"), "port");
    EXPECT_EQ(EnvironmentNames("APP").keyOf("APP_PORT"), "_port");
    EXPECT_EQ(EnvironmentNames("").keyOf("HOME"), "home");
    EXPECT_EQ(EnvironmentNames("").nameOf("home"), "HOME");
}

TEST(EnvironmentNames, AKeyMayBeListedTwice) {
    EXPECT_EQ(EnvironmentNames("P_", {"aB", "aB"}).keyOf("P_AB"), "aB");
}

TEST(EnvironmentNames, TwoListedKeysOfOneNameAreRefused) {
    EXPECT_EQ(thrownText<std::invalid_argument>([] {
                  const EnvironmentNames names("P_", {"log-level", "x", "log_level"});
              }),
              "Environment variable P_LOG_LEVEL stands for two keys: log-level, log_level");
}

}  // namespace
}  // namespace velkor::layers
