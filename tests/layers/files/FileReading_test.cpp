#include "layers/files/detail/FileReading.hpp"

#include <gmock/gmock.h>
#include <sys/stat.h>

#include <filesystem>
#include <string>

#include "tests/layers/files/FileFolder.hpp"
#include "tests/layers/files/SystemHooks.hpp"
#include "tests/support/BoundedWait.hpp"

namespace velkor::layers::detail {
namespace {

namespace fs = std::filesystem;

using testing::FileFolder;
using testing::SystemHooks;

constexpr std::uintmax_t enough = 1000;

class FileReadingTest : public ::testing::Test {
protected:
    std::string problemAt(const fs::path& given) {
        std::string problem;
        // What would wait must not hang the test.
        if (!testing::completes([&] { problem = readFile(given, enough).problem; })) std::abort();
        return problem;
    }

    FileFolder folder;
    const fs::path path = folder / "file";
};

TEST_F(FileReadingTest, GivesTheTextWithTheIdentityOfTheFile) {
    FileFolder::write(path, "text");

    const auto reading = readFile(path, enough);

    EXPECT_EQ(reading.text, "text");
    EXPECT_EQ(reading.problem, "");
    EXPECT_FALSE(reading.torn);
    EXPECT_TRUE(reading.identity == identityOf(path));
}

TEST_F(FileReadingTest, ReadsAFileOfManyBlocks) {
    const std::string text(1'000'000, 'x');
    FileFolder::write(path, text);

    EXPECT_EQ(readFile(path, text.size()).text, text);
}

TEST_F(FileReadingTest, SaysThatAFileIsNotThere) {
    const auto reading = readFile(path, enough);

    EXPECT_EQ(reading.problem, "Property file could not be opened: " + path.string() +
                                   ": No such file or directory");
    EXPECT_FALSE(reading.identity.has_value());
}

TEST_F(FileReadingTest, SaysThatAFolderIsNone) {
    fs::create_directories(path);

    EXPECT_EQ(problemAt(path),
              "Property file could not be opened: " + path.string() + ": Is a directory");
}

TEST_F(FileReadingTest, DoesNotWaitForTheWriterOfAPipe) {
    ASSERT_EQ(::mkfifo(path.c_str(), 0600), 0);

    EXPECT_EQ(problemAt(path),
              "Property file could not be opened: " + path.string() + ": Not a regular file");
}

TEST_F(FileReadingTest, ReadsNoDevice) {
    EXPECT_EQ(problemAt("/dev/zero"),
              "Property file could not be opened: /dev/zero: Not a regular file");
}

TEST_F(FileReadingTest, RefusesAPathThatTheSystemWouldCutOff) {
    FileFolder::write(path, "text");

    EXPECT_EQ(problemAt(path.string() + std::string("\0more", 5)),
              "Property file could not be opened: " + path.string() + std::string("\0more", 5) +
                  ": Invalid argument");
}

TEST_F(FileReadingTest, ReadsAFileOfTheLargestSizeAndNoneBeyond) {
    FileFolder::write(path, "12345");

    EXPECT_EQ(readFile(path, 5).text, "12345");
    EXPECT_EQ(readFile(path, 4).problem, "Property file is larger than 4 bytes: " + path.string());
}

TEST_F(FileReadingTest, LimitsAFileThatDoesNotSayItsSize) {
    EXPECT_EQ(readFile("/proc/self/status", 10).problem,
              "Property file is larger than 10 bytes: /proc/self/status");
}

TEST_F(FileReadingTest, NoticesThatTheFileIsWrittenMeanwhile) {
    FileFolder::write(path, "text");
    int asked = 0;
    SystemHooks::beforeStatus = [&] {
        if (++asked == 2) FileFolder::write(path, "other text");
    };

    const bool torn = readFile(path, enough).torn;

    SystemHooks::beforeStatus = {};
    EXPECT_TRUE(torn);
}

TEST_F(FileReadingTest, NoticesThatTheFileIsReplacedMeanwhile) {
    FileFolder::write(path, "text");
    int asked = 0;
    SystemHooks::beforeStatus = [&] {
        if (++asked == 2) FileFolder::replace(path, "text");
    };

    const bool torn = readFile(path, enough).torn;

    SystemHooks::beforeStatus = {};
    EXPECT_TRUE(torn);
}

TEST_F(FileReadingTest, TellsStatesOfAFileApart) {
    FileFolder::write(path, "text");
    const auto before = identityOf(path);
    ASSERT_TRUE(before == identityOf(path));

    FileFolder::replace(path, "text");
    const auto replaced = identityOf(path);
    EXPECT_TRUE(replaced != before);

    FileFolder::write(path, "longer text");
    EXPECT_TRUE(identityOf(path) != replaced);
}

}  // namespace
}  // namespace velkor::layers::detail
