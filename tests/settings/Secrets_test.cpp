#include "settings/Secrets.hpp"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "settings/Bound.hpp"
#include "settings/Setting.hpp"
#include "tests/configuration/StoreTesting.hpp"
#include "tests/support/LogCapture.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::settings::testing {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;
using velkor::testing::LogCapture;
using velkor::testing::thrownText;

struct Account {
    std::string user{};
    std::string password{};
};

struct Numbers {
    int pin = 0;
    int age = 0;
};

class SecretsTest : public velkor::testing::StoreTest {};

TEST_F(SecretsTest, AreNoneWhereNothingIsDeclared) {
    EXPECT_THAT(secretKeys(store), IsEmpty());
}

TEST_F(SecretsTest, AreTheKeysOfSettingsThatSaySo) {
    const Setting<std::string> token(store, "token", "t", secret());
    const Setting<int> port(store, "port", 1);
    const Setting<int> pin(store, "pin", 1, secret());
    EXPECT_THAT(secretKeys(store), ElementsAre("pin", "token"));
}

TEST_F(SecretsTest, AreTheKeysOfFieldsThatSaySo) {
    const Bound<Account> account(
        store, "account",
        fields(&Account::user, "user", "u", &Account::password, "password", "p", secret()));
    EXPECT_THAT(secretKeys(store), ElementsAre("account.password"));
}

TEST_F(SecretsTest, StaySecretBesideASettingThatDoesNotSaySo) {
    const Setting<std::string> first(store, "token", "t");
    const Setting<std::string> second(store, "token", "t", secret());
    const Setting<std::string> third(store, "token", "t");
    EXPECT_THAT(secretKeys(store), ElementsAre("token"));
}

TEST_F(SecretsTest, EndWithTheirSetting) {
    const Setting<int> port(store, "port", 1);
    { const Setting<std::string> token(store, "token", "t", secret()); }
    EXPECT_THAT(secretKeys(store), IsEmpty());
}

TEST_F(SecretsTest, AreNoneOfAnotherStore) {
    const auto other = std::make_shared<configuration::ConfigurationImpl>();
    const Setting<std::string> token(other, "token", "t", secret());
    EXPECT_THAT(secretKeys(store), IsEmpty());
}

TEST_F(SecretsTest, AreHiddenInRecords) {
    const Setting<int> pin(store, "pin", 1, secret(), between(0, 9999));
    const LogCapture log("velkor::settings");
    store->set("pin", "verysecret");
    store->set("pin", 47110);
    std::vector<std::string> messages;
    for (const auto& record : log.records()) messages.push_back(record.message);
    EXPECT_THAT(messages,
                ElementsAre("pin: ••• from source \"override\" is no int: not a whole number in "
                            "plain digits; the last good value stays",
                            "pin: ••• from source \"override\" is no int: not between 0 and "
                            "9999; the last good value stays"));
}

TEST_F(SecretsTest, AreHiddenInWhatAStructIsRefusedWith) {
    store->set("account.pin", 47110);
    store->set("account.age", 300);
    EXPECT_EQ(thrownText<SettingError>([this] {
                  const Bound<Numbers> account(
                      store, "account",
                      fields(&Numbers::pin, "pin", 1, secret(), between(0, 9999), &Numbers::age,
                             "age", 1, between(0, 200)));
              }),
              "account.pin: ••• from source \"override\" is no int: not between 0 and 9999; "
              "account.age: 300 from source \"override\" is no int: not between 0 and 200");
}

TEST_F(SecretsTest, AreToldOneByOneAsAllTogether) {
    const Bound<Account> account(
        store, "account",
        fields(&Account::user, "user", "u", &Account::password, "password", "p", secret()));
    EXPECT_TRUE(isSecret(store, "account.password"));
    EXPECT_FALSE(isSecret(store, "account.user"));
    EXPECT_FALSE(isSecret(store, "account"));
}

TEST_F(SecretsTest, AreToldOneByOneBesideASettingThatDoesNotSaySo) {
    const Setting<std::string> first(store, "token", "t");
    EXPECT_FALSE(isSecret(store, "token"));
    const Setting<std::string> second(store, "token", "t", secret());
    EXPECT_TRUE(isSecret(store, "token"));
}

TEST_F(SecretsTest, AreNotToldWhereNothingIsDeclared) {
    EXPECT_FALSE(isSecret(store, "token"));
}

TEST(Masked, IsTheTextOfWhatIsNoSecret) {
    EXPECT_EQ(masked(false, "a"), "a");
}

TEST(Masked, SaysNothingOfASecret) {
    EXPECT_EQ(masked(true, "a"), masked(true, "another"));
    EXPECT_EQ(masked(true, "a"), "•••");
}

}  // namespace
}  // namespace velkor::settings::testing
