#include "configuration/Option.hpp"

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <utility>

#include "tests/configuration/StoreTesting.hpp"

namespace velkor::configuration {
namespace {

using testing::textOf;

TEST(OptionTest, HoldsItsThreeFields) {
    const Option option("key", "source", ConfigurationValue(5));
    EXPECT_EQ(option.key, "key");
    EXPECT_EQ(option.source, "source");
    EXPECT_EQ(textOf(option.value), "int 5");
}

TEST(OptionTest, IsMadeOnTheHeapFromItsFields) {
    const auto option = std::make_unique<Option>("key", "source", ConfigurationValue(5));
    EXPECT_EQ(option->source, "source");
}

TEST(OptionTest, CopyIsIndependent) {
    Option option("key", "source", ConfigurationValue(std::string("text")));
    const Option copy(option);
    option.key = "other";
    option.value = 1;
    EXPECT_EQ(copy.key, "key");
    EXPECT_EQ(textOf(copy.value), "string text");
}

TEST(OptionTest, MoveTakesTheContents) {
    Option option(std::string(100, 'k'), std::string(100, 's'),
                  ConfigurationValue(std::string(100, 'v')));
    const char* key = option.key.data();
    const char* value = boost::get<std::string>(option.value).data();
    const Option moved(std::move(option));
    EXPECT_EQ(moved.key.data(), key);
    EXPECT_EQ(boost::get<std::string>(moved.value).data(), value);
}

using OptionFromStore = testing::StoreTest;

TEST_F(OptionFromStore, NamesTheDefaultSource) {
    store->set("a", 1, "default");
    EXPECT_EQ(sourceOf("a"), "default");
}

TEST_F(OptionFromStore, NamesTheSourceAndNotItsGroup) {
    add("ports", "net", 5, {{"port", 80}});
    const Option option = store->getOption("net.port").get();
    EXPECT_EQ(option.key, "net.port");
    EXPECT_EQ(option.source, "ports");
    EXPECT_EQ(textOf(option.value), "int 80");
}

TEST_F(OptionFromStore, StaysIntactAfterItsSourceIsRemoved) {
    add("extra", "", 5, {{"a", std::string("text")}});
    const Option option = store->getOption("a").get();
    store->removeSource("extra");
    EXPECT_EQ(option.source, "extra");
    EXPECT_EQ(textOf(option.value), "string text");
}

TEST_F(OptionFromStore, StaysIntactAfterTheStoreIsDestroyed) {
    store->set("a", std::string("text"));
    const Option option = store->getOption("a").get();
    store.reset();
    EXPECT_EQ(textOf(option.value), "string text");
}

}  // namespace
}  // namespace velkor::configuration
