#include "host/console/LineHistory.hpp"

#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include <sys/stat.h>

#include "tests/support/TemporaryFile.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::host {
namespace {

using velkor::testing::TemporaryFile;
using Words = std::vector<std::string>;

std::string contentOf(const std::filesystem::path& path) {
    std::ifstream in(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(in), {}};
}

unsigned modeOf(const std::filesystem::path& path) {
    struct stat status {};
    return ::stat(path.c_str(), &status) == 0 ? status.st_mode & 07777U : 0;
}

TEST(LineHistory, OutlastsItsOwner) {
    const TemporaryFile folder("");
    const auto file = folder.parent() / "history";
    LineHistory(file).add("get a");
    LineHistory(file).add("get b");
    EXPECT_EQ(LineHistory(file).earlierLines(), (Words{"get a", "get b"}));
}

TEST(LineHistory, IsPrivateWithItsFolders) {
    const TemporaryFile folder("");
    const auto file = folder.parent() / "state" / "velkor" / "history";
    LineHistory(file).add("get a");
    EXPECT_EQ(modeOf(file), 0600U);
    EXPECT_EQ(modeOf(file.parent_path()), 0700U);
    EXPECT_EQ(modeOf(file.parent_path().parent_path()), 0700U);
}

TEST(LineHistory, BecomesPrivate) {
    const TemporaryFile file("get a\n");
    ::chmod(file.path().c_str(), 0644);
    const LineHistory history(file.path());
    EXPECT_EQ(modeOf(file.path()), 0600U);
}

TEST(LineHistory, FollowsNoLink) {
    const TemporaryFile file("kept\n");
    ::chmod(file.path().c_str(), 0644);
    const auto link = file.parent() / "link";
    std::filesystem::create_symlink(file.path(), link);
    EXPECT_EQ(
        velkor::testing::thrownText<std::runtime_error>([&] { const LineHistory history(link); }),
        "History can't be kept: " + link.string() + ": Too many levels of symbolic links");
    EXPECT_EQ(modeOf(file.path()), 0644U);
}

TEST(LineHistory, AddsNothingToAFileWhosePlaceALinkHasTaken) {
    const TemporaryFile file("kept\n");
    const auto path = file.parent() / "history";
    const LineHistory history(path);
    std::filesystem::remove(path);
    std::filesystem::create_symlink(file.path(), path);
    history.add("get a");
    EXPECT_EQ(contentOf(file.path()), "kept\n");
}

TEST(LineHistory, LeavesTheModeOfAFileThatHasAnotherName) {
    const TemporaryFile file("");
    ::chmod(file.path().c_str(), 0644);
    const auto other = file.parent() / "other";
    std::filesystem::create_hard_link(file.path(), other);
    const LineHistory history(other);
    EXPECT_EQ(modeOf(file.path()), 0644U);
}

TEST(LineHistory, TakesWhatTwoSessionsType) {
    const TemporaryFile file("");
    const LineHistory one(file.path());
    const LineHistory other(file.path());
    one.add("1");
    other.add("2");
    one.add("3");
    EXPECT_EQ(contentOf(file.path()), "1\n2\n3\n");
}

TEST(LineHistory, KeepsTheNewestLines) {
    std::string many;
    for (std::size_t i = 0; i < LineHistory::mostLines + 5; ++i) many += std::to_string(i) + '\n';
    const TemporaryFile file(many);
    const LineHistory history(file.path());
    EXPECT_EQ(history.earlierLines().size(), LineHistory::mostLines);
    EXPECT_EQ(history.earlierLines().front(), "5");
    EXPECT_EQ(contentOf(file.path()).rfind("5\n6\n", 0), 0U);
    EXPECT_EQ(modeOf(file.path()), 0600U);
}

TEST(LineHistory, PassesOverEmptyLines) {
    const TemporaryFile file("\nget a\n\n\nget b");
    EXPECT_EQ(LineHistory(file.path()).earlierLines(), (Words{"get a", "get b"}));
}

TEST(LineHistory, SaysWhyItCantBeKept) {
    const TemporaryFile file("");
    const std::string below = (file.path() / "history").string();
    EXPECT_EQ(
        velkor::testing::thrownText<std::runtime_error>([&] { const LineHistory history(below); }),
        "History can't be kept: " + below + ": Not a directory");
}

class UsualHistoryFileTest : public ::testing::Test {
protected:
    ~UsualHistoryFileTest() override {
        ::setenv("HOME", home.c_str(), 1);
        ::unsetenv("XDG_STATE_HOME");
    }

    const TemporaryFile folder{""};
    const std::string home = std::getenv("HOME") == nullptr ? "" : std::getenv("HOME");
};

TEST_F(UsualHistoryFileTest, IsInTheFolderOfStates) {
    ::setenv("XDG_STATE_HOME", "/states", 1);
    EXPECT_EQ(usualHistoryFile(), "/states/velkor/history");
}

TEST_F(UsualHistoryFileTest, IsInTheHomeFolderOtherwise) {
    ::setenv("HOME", folder.parent().c_str(), 1);
    const auto expected = folder.parent() / ".local/state/velkor/history";
    ::unsetenv("XDG_STATE_HOME");
    EXPECT_EQ(usualHistoryFile(), expected);
    ::setenv("XDG_STATE_HOME", "relative", 1);
    EXPECT_EQ(usualHistoryFile(), expected);
}

TEST_F(UsualHistoryFileTest, IsNowhereWithoutAHomeFolder) {
    ::setenv("HOME", "/no/home", 1);
    EXPECT_EQ(usualHistoryFile(), std::nullopt);
    ::unsetenv("HOME");
    EXPECT_EQ(usualHistoryFile(), std::nullopt);
}

}  // namespace
}  // namespace velkor::host
