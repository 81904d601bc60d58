#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <memory>
#include <stdexcept>
#include <string>
#include <type_traits>

#include "tests/configuration/StoreTesting.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::configuration {
namespace {

using testing::textOf;

// What a program naturally writes: literals for texts, paths for files.
class TextOverloads : public testing::StoreTest {
protected:
    Configuration& base() const { return *store; }
};

TEST_F(TextOverloads, LiteralIsNarrowText) {
    EXPECT_EQ(textOf(store->set("log.level", "debug").get()), "string debug");
    EXPECT_EQ(valueOf("log.level"), "string debug");
}

TEST_F(TextOverloads, LiteralByNameOfSourceIsNarrowText) {
    store->set("log.level", "debug", "default").get();
    EXPECT_EQ(valueOf("log.level"), "string debug");
    EXPECT_EQ(sourceOf("log.level"), "default");
}

TEST_F(TextOverloads, LiteralIsNarrowTextThroughTheInterfaceToo) {
    base().set("a", "x");
    base().set("b", "y", "default");
    EXPECT_EQ(valueOf("a"), "string x");
    EXPECT_EQ(valueOf("b"), "string y");
}

TEST_F(TextOverloads, PointersAndArraysOfCharactersAreNarrowText) {
    const char* constant = "constant";
    char array[] = "array";
    char* changeable = array;
    store->set("constant", constant);
    store->set("array", array);
    store->set("changeable", changeable);
    EXPECT_EQ(valueOf("constant"), "string constant");
    EXPECT_EQ(valueOf("array"), "string array");
    EXPECT_EQ(valueOf("changeable"), "string array");
}

TEST_F(TextOverloads, NullPointerToCharactersIsRefused) {
    const char* const nothing = nullptr;
    try {
        store->set("a", nothing);
        FAIL() << "not refused";
    } catch (const std::invalid_argument& error) {
        EXPECT_STREQ(error.what(), "A text must not be null.");
    }
    EXPECT_FALSE(store->has("a").get());
}

TEST_F(TextOverloads, OtherTypesStayWhatTheyWere) {
    store->set("zero", 0);
    store->set("bool", true);
    store->set("unsigned", 7U);
    store->set("double", 1.5);
    store->set("wide", std::u16string(u"w"));
    store->set("narrow", std::string("n"));
    store->set("named", 0, "default");
    EXPECT_EQ(valueOf("zero"), "int 0");
    EXPECT_EQ(valueOf("bool"), "bool true");
    EXPECT_EQ(valueOf("unsigned"), "uint 7");
    EXPECT_EQ(valueOf("double"), "double 1.5");
    EXPECT_EQ(valueOf("wide"), "ustring w");
    EXPECT_EQ(valueOf("narrow"), "string n");
    EXPECT_EQ(valueOf("named"), "int 0");
}

TEST_F(TextOverloads, PropertyFileIsFoundByAPath) {
    const testing::TemporaryFile file("k=v\n");
    const std::filesystem::path path = file.path();
    EXPECT_TRUE(store->addPropertyFileSource("path", "p", 1, true, path).get());
    EXPECT_TRUE(base().addPropertyFileSource("text", "t", 1, true, path.string()).get());
    EXPECT_TRUE(store->addPropertyFileSource("pointer", "c", 1, true, path.c_str()).get());
    EXPECT_TRUE(store->addPropertyFileSource("wide", "w", 1, true, path.u16string()).get());
    EXPECT_EQ(valueOf("p.k"), "string v");
    EXPECT_EQ(valueOf("t.k"), "string v");
    EXPECT_EQ(valueOf("c.k"), "string v");
    EXPECT_EQ(valueOf("w.k"), "string v");
}

TEST_F(TextOverloads, MissingFileIsNamedAsByTheInterface) {
    try {
        store->addPropertyFileSource("f", "", 1, true, std::filesystem::path("/nobody/here"));
        FAIL() << "not refused";
    } catch (const std::runtime_error& error) {
        EXPECT_STREQ(error.what(), "Property file could not be opened: /nobody/here");
    }
    EXPECT_THROW(store->addPropertyFileSource("f", "", 1, true, u"/nobody/here"),
                 std::runtime_error);
}

}  // namespace
}  // namespace velkor::configuration
