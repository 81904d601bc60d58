#include <gtest/gtest.h>

#include <set>
#include <string>
#include <utility>

#include "tests/configuration/StoreTesting.hpp"
#include "tests/support/Sanitizers.hpp"

namespace velkor::configuration {
namespace {

constexpr int keyCount = velkor::testing::isSanitized ? 50'000 : 1'000'000;

std::string keyOf(int number) {
    return "some.group.key" + std::to_string(number);
}

// All tests share the one large table: building it is most of the work.
class LargeStore : public ::testing::Test {
protected:
    static void SetUpTestSuite() {
        ValueMap values;
        for (int number = 0; number < keyCount; ++number) values.emplace(keyOf(number), number);
        store = std::make_shared<ConfigurationImpl>();
        store->addInMemorySource("large", "app", 5, false, std::move(values));
    }

    static void TearDownTestSuite() { store.reset(); }

    static std::shared_ptr<ConfigurationImpl> store;
};

std::shared_ptr<ConfigurationImpl> LargeStore::store;

TEST_F(LargeStore, ListsEveryKeyOnce) {
    const auto keys = store->keys().get();
    EXPECT_EQ(keys.size(), static_cast<std::size_t>(keyCount));
    EXPECT_EQ(*keys.begin(), "app." + keyOf(0));
}

TEST_F(LargeStore, FindsEveryValue) {
    for (int number = 0; number < keyCount; number += 37) {
        ASSERT_EQ(boost::get<int>(store->get("app." + keyOf(number)).get()), number);
    }
}

TEST_F(LargeStore, WritesGoIntoTheTable) {
    EXPECT_EQ(boost::get<int>(store->set("app." + keyOf(7), 8, "large").get()), 7);
    EXPECT_EQ(boost::get<int>(store->set("app." + keyOf(7), 7, "large").get()), 8);
}

TEST_F(LargeStore, MissingKeyIsMissing) {
    EXPECT_FALSE(store->has("app." + keyOf(keyCount)).get());
}

}  // namespace
}  // namespace velkor::configuration
