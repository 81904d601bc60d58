#include "layers/files/detail/PathChain.hpp"

#include <gmock/gmock.h>

#include <filesystem>
#include <string>
#include <vector>

#include "tests/layers/files/FileFolder.hpp"

namespace velkor::layers::detail {
namespace {

namespace fs = std::filesystem;

using ::testing::ElementsAre;
using testing::FileFolder;
using ::testing::IsEmpty;

class PathChainTest : public ::testing::Test {
protected:
    // The names that the way leads over below the folder, "." standing for the folder itself.
    std::vector<std::string> namesOf(const fs::path& path) const {
        const auto root = fs::canonical(folder / ".").string();
        std::vector<std::string> names;
        const PathChain way(path);
        for (const auto& step : way.steps()) {
            if (step.folder.compare(0, root.size(), root) != 0) continue;
            names.push_back("." + step.folder.substr(root.size()) + "/" + step.name);
        }
        return names;
    }

    std::string targetOf(const fs::path& path) const { return PathChain(path).file(); }

    fs::path real(const std::string& name) const { return fs::canonical(folder / ".") / name; }

    FileFolder folder;
};

TEST_F(PathChainTest, LeadsOverEveryFolderFromTheRoot) {
    FileFolder::write(folder / "file", "");
    const auto path = real("file");

    const PathChain way(path);

    std::vector<std::string> folders;
    for (const auto& step : way.steps()) folders.push_back(fs::path(step.folder) / step.name);
    std::vector<std::string> expected;
    for (auto place = path; place != "/"; place = place.parent_path()) {
        expected.insert(expected.begin(), place);
    }
    EXPECT_EQ(folders, expected);
    EXPECT_EQ(way.file(), path);
}

TEST_F(PathChainTest, LeadsOverALinkToItsTarget) {
    fs::create_directories(folder / "a");
    fs::create_directories(folder / "b");
    FileFolder::write(folder / "b" / "target", "");
    fs::create_symlink("../b/target", folder / "a" / "link");

    EXPECT_THAT(namesOf(folder / "a" / "link"),
                ElementsAre("./a", "./a/link", "./b", "./b/target"));
    EXPECT_EQ(targetOf(folder / "a" / "link"), real("b/target"));
}

TEST_F(PathChainTest, LeadsOverLinksOfFolders) {
    fs::create_directories(folder / "1");
    FileFolder::write(folder / "1" / "file", "");
    fs::create_symlink("1", folder / "data");
    fs::create_symlink("data/file", folder / "file");

    EXPECT_THAT(namesOf(folder / "file"), ElementsAre("./file", "./data", "./1", "./1/file"));
}

TEST_F(PathChainTest, BeginsAtTheRootAgainForAnAbsoluteLink) {
    FileFolder::write(folder / "target", "");
    fs::create_symlink(real("target"), folder / "link");

    EXPECT_THAT(namesOf(real("link")), ElementsAre("./link", "./target"));
}

TEST_F(PathChainTest, TakesTheFolderAboveTheOneThatALinkLeadsTo) {
    fs::create_directories(folder / "a" / "b");
    FileFolder::write(folder / "a" / "file", "");
    fs::create_symlink("a/b", folder / "link");

    EXPECT_THAT(namesOf(folder / "link/.././file"),
                ElementsAre("./link", "./a", "./a/b", "./a/file"));
}

TEST_F(PathChainTest, EndsAtTheFirstNameThatIsNotThere) {
    fs::create_directories(folder / "a");

    EXPECT_THAT(namesOf(folder / "a" / "b" / "c" / "file"), ElementsAre("./a", "./a/b"));
    EXPECT_THAT(targetOf(folder / "a" / "b" / "c" / "file"), IsEmpty());
}

TEST_F(PathChainTest, EndsAtALinkThatLeadsNowhere) {
    fs::create_symlink("a/b", folder / "link");

    EXPECT_THAT(namesOf(folder / "link"), ElementsAre("./link", "./a"));
}

TEST_F(PathChainTest, EndsAtAFileThatStandsInTheWay) {
    FileFolder::write(folder / "a", "");

    EXPECT_THAT(namesOf(folder / "a" / "file"), ElementsAre("./a"));
    EXPECT_THAT(targetOf(folder / "a" / "file"), IsEmpty());
}

TEST_F(PathChainTest, EndsForLinksThatLeadToEachOther) {
    fs::create_symlink("b", folder / "a");
    fs::create_symlink("a", folder / "b");

    EXPECT_THAT(targetOf(folder / "a"), IsEmpty());
}

TEST_F(PathChainTest, IsTheSameAsLongAsNothingChanges) {
    FileFolder::write(folder / "file", "");
    const PathChain before(folder / "file");

    FileFolder::write(folder / "file", "more");

    EXPECT_TRUE(PathChain(folder / "file") == before);
}

TEST_F(PathChainTest, IsAnotherWhenTheFileIsReplaced) {
    FileFolder::write(folder / "file", "");
    const PathChain before(folder / "file");

    FileFolder::replace(folder / "file", "");

    EXPECT_TRUE(PathChain(folder / "file") != before);
}

TEST_F(PathChainTest, IsAnotherWhenAFolderIsReplacedByOneWithTheSameFile) {
    fs::create_directories(folder / "a");
    fs::create_directories(folder / "b");
    FileFolder::write(folder / "a" / "file", "");
    fs::create_hard_link(folder / "a" / "file", folder / "b" / "file");
    const PathChain before(folder / "a" / "file");

    fs::rename(folder / "a", folder / "c");
    fs::rename(folder / "b", folder / "a");

    EXPECT_TRUE(PathChain(folder / "a" / "file") != before);
}

}  // namespace
}  // namespace velkor::layers::detail
