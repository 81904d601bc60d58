#include "settings/Secrets.hpp"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <memory>
#include <string>

#include "settings/Bound.hpp"
#include "settings/Setting.hpp"
#include "tests/configuration/StoreTesting.hpp"

namespace velkor::settings::testing {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

struct Account {
    std::string user{};
    std::string password{};
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

TEST(Masked, IsTheTextOfWhatIsNoSecret) {
    EXPECT_EQ(masked(false, "a"), "a");
}

TEST(Masked, SaysNothingOfASecret) {
    EXPECT_EQ(masked(true, "a"), masked(true, "another"));
    EXPECT_EQ(masked(true, "a"), "•••");
}

}  // namespace
}  // namespace velkor::settings::testing
