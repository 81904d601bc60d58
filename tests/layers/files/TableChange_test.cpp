#include "layers/detail/TableChange.hpp"

#include <gmock/gmock.h>

#include <string>
#include <utility>

#include "tests/support/ValueText.hpp"

namespace velkor::layers::detail {
namespace {

using configuration::ConfigurationValue;
using configuration::ValueMap;
using configuration::ValueTable;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
using ::testing::UnorderedElementsAre;

ValueMap mapOf(std::initializer_list<std::pair<std::string, std::string>> entries) {
    ValueMap values;
    for (const auto& [key, text] : entries) values.emplace(key, text);
    return values;
}

const std::string& textAt(const ValueTable& table, const std::string& key) {
    return boost::get<std::string>(*table.find(key));
}

TEST(TableChange, GivesTheKeysWhoseValuesDiffer) {
    ValueTable table(mapOf({{"same", "1"}, {"other", "1"}, {"gone", "1"}}));
    TableChange change(table, 3, mapOf({{"same", "1"}, {"other", "2"}, {"new", "3"}}));

    EXPECT_FALSE(change.isEmpty());
    EXPECT_THAT(change.applyTo(table), UnorderedElementsAre("other", "new", "gone"));
    EXPECT_EQ(textAt(table, "same"), "1");
    EXPECT_EQ(textAt(table, "other"), "2");
    EXPECT_EQ(textAt(table, "new"), "3");
    EXPECT_THAT(table.keys(), ElementsAre("new", "other", "same"));
    EXPECT_EQ(change.sizeAfter(), 3U);
}

TEST(TableChange, IsEmptyWhenNothingDiffers) {
    const ValueTable table(mapOf({{"a", "1"}, {"b", "2"}}));

    EXPECT_TRUE(TableChange(table, 2, mapOf({{"b", "2"}, {"a", "1"}})).isEmpty());
}

TEST(TableChange, TakesEverythingAwayForAnEmptyTable) {
    ValueTable table(mapOf({{"a", "1"}, {"b", "2"}}));
    TableChange change(table, 2, {});

    EXPECT_THAT(change.applyTo(table), ElementsAre("a", "b"));
    EXPECT_THAT(table.keys(), IsEmpty());
}

TEST(TableChange, LeavesAValueThatIsTheSameWhereItIs) {
    const std::string text(100, 'x');
    ValueTable table(mapOf({{"same", text}, {"other", "1"}}));
    const char* const before = textAt(table, "same").data();

    TableChange change(table, 2, mapOf({{"same", text}, {"other", "2"}}));
    change.applyTo(table);

    EXPECT_EQ(textAt(table, "same").data(), before);
}

TEST(TableChange, MovesANewValueWithoutCopyingIt) {
    ValueTable table(mapOf({{"a", "1"}}));
    ValueMap after = mapOf({{"a", std::string(100, 'x')}, {"b", std::string(100, 'y')}});
    const char* const replacing = boost::get<std::string>(after.at("a")).data();
    const char* const added = boost::get<std::string>(after.at("b")).data();

    TableChange change(table, 1, std::move(after));
    change.applyTo(table);

    EXPECT_EQ(textAt(table, "a").data(), replacing);
    EXPECT_EQ(textAt(table, "b").data(), added);
}

}  // namespace
}  // namespace velkor::layers::detail
