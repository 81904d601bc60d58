#include "host/console/ArgumentWords.hpp"

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <memory>
#include <string>
#include <vector>

#include "tests/support/TemporaryFile.hpp"

namespace velkor::host {
namespace {

using Words = std::vector<std::string>;

class ArgumentWordsTest : public ::testing::Test {
protected:
    Words of(const char* name, const std::string& typed = "") const {
        return ArgumentWords(store, watches, sources).of(name, typed);
    }

    std::shared_ptr<SessionStore> store = std::make_shared<SessionStore>(SourceLimits{});
    std::shared_ptr<Watches> watches =
        std::make_shared<Watches>(store, [](const auto&, const auto&) {});
    std::shared_ptr<SessionSources> sources =
        std::make_shared<SessionSources>(store, SourceLimits{});
};

TEST_F(ArgumentWordsTest, KeysAreThoseOfTheStore) {
    store->set("b", 1);
    store->set("a", 1, "default");
    EXPECT_EQ(of("KEY"), (Words{"a", "b"}));
}

TEST_F(ArgumentWordsTest, WatchedKeysAreThoseThatAreWatched) {
    store->set("b", 1);
    watches->add("a");
    EXPECT_EQ(of("WATCHED-KEY"), Words{"a"});
}

TEST_F(ArgumentWordsTest, SourcesAndTypesHaveNames) {
    EXPECT_EQ(of("SOURCE"), (Words{"override", "default"}));
    EXPECT_EQ(of("T").size(), 12U);
}

TEST_F(ArgumentWordsTest, FilesAreThoseOfTheFolderThatIsTyped) {
    const velkor::testing::TemporaryFile file("");
    const std::string folder = file.parent().string() + '/';
    std::filesystem::create_directory(folder + "folder");
    std::ofstream(folder + ".hidden").put('\n');
    EXPECT_EQ(of("FILE", folder + "x"), (Words{folder + "file.properties", folder + "folder/"}));
    EXPECT_EQ(of("FILE", folder + ".").size(), 3U);
    EXPECT_EQ(of("FILE", "/no/folder/"), Words{});
}

TEST_F(ArgumentWordsTest, AlternativesAreWords) {
    EXPECT_EQ(of("properties|json"), (Words{"properties", "json"}));
}

TEST_F(ArgumentWordsTest, OtherNamesSayNothing) {
    EXPECT_EQ(of("VALUE"), Words{});
    EXPECT_EQ(of(""), Words{});
}

}  // namespace
}  // namespace velkor::host
