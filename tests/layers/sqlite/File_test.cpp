// Which files are opened, and how others are refused.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstdio>
#include <filesystem>
#include <fstream>
#include <memory>
#include <sstream>
#include <string>

#include <fcntl.h>
#include <signal.h>
#include <sys/fsuid.h>
#include <sys/wait.h>
#include <unistd.h>

#include "layers/sqlite/SqliteSource.hpp"
#include "tests/layers/sqlite/StateTesting.hpp"
#include "tests/layers/sqlite/TestDisk.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::testing {
namespace {

namespace fs = std::filesystem;

using ::testing::EndsWith;
using ::testing::HasSubstr;
using ::testing::StartsWith;

std::string refusalOf(const fs::path& path, const SqliteOptions& options = {}) {
    return thrownText<std::runtime_error>([&] { SqliteSource::open(path, options); });
}

std::string textOfRefusal(const fs::path& path, const std::string& cause) {
    return "State file could not be opened: " + path.string() + ": " + cause;
}

std::string contentOf(const fs::path& path) {
    std::ifstream file(path, std::ios::binary);
    std::ostringstream content;
    content << file.rdbuf();
    return content.str();
}

void write(const fs::path& path, const std::string& content) {
    std::ofstream(path, std::ios::binary) << content;
}

constexpr fs::perms readable =
    fs::perms::owner_read | fs::perms::group_read | fs::perms::others_read;
constexpr fs::perms searchable =
    fs::perms::owner_exec | fs::perms::group_exec | fs::perms::others_exec;

/// Files are used on this thread as by a user without any rights while it lives.
class WithoutRights {
public:
    WithoutRights() { ::setfsuid(65534); }
    ~WithoutRights() { ::setfsuid(::geteuid()); }

    WithoutRights(const WithoutRights&) = delete;
    WithoutRights& operator=(const WithoutRights&) = delete;
};

/// A process that holds a state file, until it is killed.
class Holder {
public:
    explicit Holder(const fs::path& file) {
        int ends[2];
        if (::pipe2(ends, O_CLOEXEC) != 0) throw std::runtime_error("no pipe");
        process = ::fork();
        if (process == 0) {
            ::dup2(ends[1], STDOUT_FILENO);
            ::execl(VELKOR_STATE_HOLDER, VELKOR_STATE_HOLDER, file.c_str(), nullptr);
            ::_exit(127);
        }
        ::close(ends[1]);
        char answer[16] = "";
        const auto size = ::read(ends[0], answer, sizeof answer - 1);
        ::close(ends[0]);
        if (size <= 0) throw std::runtime_error("the holder didn't begin");
    }

    ~Holder() { kill(); }

    Holder(const Holder&) = delete;
    Holder& operator=(const Holder&) = delete;

    void kill() {
        if (process <= 0) return;
        ::kill(process, SIGKILL);
        ::waitpid(process, nullptr, 0);
        process = -1;
    }

    std::string id() const { return std::to_string(process); }

private:
    pid_t process = -1;
};

TEST(StateFile, IsMadeWhereThereIsNone) {
    const StateFolder folder;
    SqliteSource::open(folder.file());
    EXPECT_TRUE(fs::exists(folder.file()));
}

TEST(StateFile, LeavesNothingElseBehind) {
    const StateFolder folder;
    SqliteSource::open(folder.file())->set("a", 1);
    int count = 0;
    for (const auto& entry : fs::directory_iterator(folder.path())) {
        EXPECT_EQ(entry.path(), folder.file());
        ++count;
    }
    EXPECT_EQ(count, 1);
}

TEST(StateFile, MayBeEmpty) {
    const StateFolder folder;
    write(folder.file(), "");
    EXPECT_TRUE(SqliteSource::open(folder.file())->keys().empty());
}

TEST(StateFile, MayBeReadByOthersMeanwhile) {
    const StateFolder folder;
    const auto source = SqliteSource::open(folder.file());
    source->set("server.port", 8080);
    source->committed().get();
    const std::string command = "sqlite3 '" + folder.file().string() +
                                "' \"SELECT CAST(value AS TEXT) FROM entries"
                                " WHERE key = CAST('server.port' AS BLOB)\"";
    FILE* const reader = ::popen(command.c_str(), "r");
    ASSERT_NE(reader, nullptr);
    char line[64] = "";
    EXPECT_NE(std::fgets(line, sizeof line, reader), nullptr);
    EXPECT_EQ(::pclose(reader), 0);
    EXPECT_STREQ(line, "int:8080\n");
    source->set("server.port", 8081);
    EXPECT_TRUE(source->committed().get());
}

TEST(StateFile, IsWrittenByOneSourceOfAProcess) {
    const StateFolder folder;
    const auto source = SqliteSource::open(folder.file(), by("alice"));
    EXPECT_EQ(refusalOf(folder.file()),
              textOfRefusal(folder.file(),
                            "process " + std::to_string(::getpid()) + " (alice) writes it"));
    source->set("a", 1);
    EXPECT_TRUE(source->committed().get());
}

TEST(StateFile, IsOneFileByAllItsPaths) {
    const StateFolder folder;
    const auto source = SqliteSource::open(folder.file());
    const fs::path link = folder.path() / "link";
    fs::create_symlink(folder.file(), link);
    EXPECT_THAT(refusalOf(link), StartsWith(textOfRefusal(folder.file(), "process ")));
    EXPECT_THAT(refusalOf(fs::relative(folder.file())),
                StartsWith(textOfRefusal(folder.file(), "process ")));
}

TEST(StateFile, IsOneFileByALinkToNothing) {
    const StateFolder folder;
    const fs::path link = folder.path() / "link";
    fs::create_symlink("state.db", link);
    const auto source = SqliteSource::open(link);
    EXPECT_TRUE(fs::exists(folder.file()));
    EXPECT_THAT(refusalOf(link), StartsWith(textOfRefusal(folder.file(), "process ")));
}

TEST(StateFile, ThatIsALinkToItselfIsRefused) {
    const StateFolder folder;
    fs::create_symlink("state.db", folder.file());
    EXPECT_EQ(refusalOf(folder.file()),
              textOfRefusal(folder.file(), "Too many levels of symbolic links"));
}

TEST(StateFile, HasNoZeroInItsPath) {
    const StateFolder folder;
    const fs::path path = folder.file().string() + std::string("\0", 1);
    EXPECT_EQ(refusalOf(path), textOfRefusal(path, "it is no file").c_str());
    EXPECT_FALSE(fs::exists(folder.file()));
}

TEST(StateFile, IsWaitedForWhileAnotherProgramWritesIt) {
    const StateFolder folder;
    const auto source = SqliteSource::open(folder.file());
    OtherProgram other(folder.file());
    other.run("BEGIN IMMEDIATE");
    source->set("a", 1);
    auto committed = source->committed();
    other.run("ROLLBACK");
    EXPECT_TRUE(committed.get());
}

TEST(StateFile, IsWrittenByOneProcess) {
    const StateFolder folder;
    const Holder holder(folder.file());
    EXPECT_EQ(refusalOf(folder.file()),
              textOfRefusal(folder.file(), "process " + holder.id() + " (holder) writes it"));
}

TEST(StateFile, OfAKilledProcessHasWhatWasCommittedAndCanBeWritten) {
    const StateFolder folder;
    Holder(folder.file()).kill();
    const auto source = SqliteSource::open(folder.file());
    EXPECT_EQ(textOf(source->get("held")), "int 1");
    source->set("a", 1);
    EXPECT_TRUE(source->committed().get());
}

TEST(StateFile, OfAProcessThatEndsHasAllThatWasWritten) {
    for (int round = 0; round < 20; ++round) {
        const StateFolder folder;
        const std::string command = VELKOR_STATE_WRITER " '" + folder.file().string() + "'";
        ASSERT_EQ(std::system(command.c_str()), 0);
        EXPECT_TRUE(SqliteSource::open(folder.file())->has("written"));
    }
}

TEST(StateFile, IsWrittenAgainWhenItsWriterHasGone) {
    const StateFolder folder;
    SqliteSource::open(folder.file());
    EXPECT_NO_THROW(SqliteSource::open(folder.file()));
}

TEST(StateFile, ThatIsAFolderIsRefused) {
    const StateFolder folder;
    EXPECT_EQ(refusalOf(folder.path()), textOfRefusal(folder.path(), "it is a folder"));
}

TEST(StateFile, ThatIsNoFileIsRefused) {
    EXPECT_EQ(refusalOf("/dev/null"), textOfRefusal("/dev/null", "it is no file"));
}

TEST(StateFile, InNoFolderIsRefused) {
    const StateFolder folder;
    const fs::path path = folder.path() / "missing" / "state.db";
    EXPECT_EQ(refusalOf(path), textOfRefusal(path, "its lock can't be taken: " + path.string() +
                                                       ".lock: No such file or directory"));
}

TEST(StateFile, ThatIsNoDatabaseIsRefusedAndStays) {
    const StateFolder folder;
    const std::string content(5000, 'x');
    write(folder.file(), content);
    EXPECT_EQ(refusalOf(folder.file()), textOfRefusal(folder.file(), "file is not a database"));
    EXPECT_EQ(contentOf(folder.file()), content);
}

TEST(StateFile, OfAnotherProgramIsRefusedAndStays) {
    const StateFolder folder;
    OtherProgram(folder.file()).run("CREATE TABLE theirs (x)");
    const std::string content = contentOf(folder.file());
    EXPECT_EQ(refusalOf(folder.file()),
              textOfRefusal(folder.file(), "it is a database of another program"));
    EXPECT_EQ(contentOf(folder.file()), content);
}

TEST(StateFile, OfANewerSchemaIsRefusedAndStays) {
    const StateFolder folder;
    SqliteSource::open(folder.file())->set("a", 1);
    OtherProgram(folder.file()).run("PRAGMA user_version = 99");
    const std::string content = contentOf(folder.file());
    EXPECT_EQ(refusalOf(folder.file()),
              textOfRefusal(folder.file(),
                            "its schema 99 is newer than 1, the newest that is known here"));
    EXPECT_EQ(contentOf(folder.file()), content);
}

TEST(StateFile, KeepsWhatANewerMinorVersionHasAdded) {
    const StateFolder folder;
    SqliteSource::open(folder.file())->set("a", 1);
    OtherProgram(folder.file())
        .run(
            "CREATE TABLE more (x); INSERT INTO more VALUES (5);"
            "ALTER TABLE entries ADD COLUMN note; UPDATE entries SET note = 'n';"
            "INSERT INTO journal VALUES (2, 0, 'them', 'merged', 'a', NULL, NULL)");
    {
        const auto source = SqliteSource::open(folder.file(), by("alice"));
        source->set("a", 2);
        source->committed().get();
        EXPECT_EQ(historyOf(*source).at(1), "2 them other a: none -> none");
    }
    EXPECT_EQ(OtherProgram(folder.file()).run("SELECT x, note FROM more, entries"), "5 n ");
}

TEST(StateFile, ThatIsDamagedIsRefused) {
    const StateFolder folder;
    {
        const auto source = SqliteSource::open(folder.file());
        for (int i = 0; i < 1000; ++i) source->set(std::to_string(i), std::string(100, 'x'));
    }
    std::string content = contentOf(folder.file());
    content.replace(3 * 4096, 4096, std::string(4096, '\xA5'));
    write(folder.file(), content);
    EXPECT_THAT(refusalOf(folder.file()),
                StartsWith(textOfRefusal(folder.file(), "it is damaged: ")));
    EXPECT_EQ(contentOf(folder.file()), content);
}

TEST(StateFile, ThatIsCutIsRefused) {
    const StateFolder folder;
    {
        const auto source = SqliteSource::open(folder.file());
        for (int i = 0; i < 1000; ++i) source->set(std::to_string(i), std::string(100, 'x'));
    }
    fs::resize_file(folder.file(), 5 * 4096);
    EXPECT_THAT(refusalOf(folder.file()), StartsWith(textOfRefusal(folder.file(), "")));
}

TEST(StateFile, ThatIsReadOnlyIsRefused) {
    const StateFolder folder;
    SqliteSource::open(folder.file());
    fs::permissions(folder.path(), fs::perms::all);
    fs::permissions(folder.file(), readable);
    const WithoutRights user;
    EXPECT_EQ(refusalOf(folder.file()), textOfRefusal(folder.file(), "it is read-only"));
}

TEST(StateFile, InAReadOnlyFolderIsRefused) {
    const StateFolder folder;
    fs::permissions(folder.path(), readable | searchable);
    const WithoutRights user;
    EXPECT_EQ(refusalOf(folder.file()),
              textOfRefusal(folder.file(), "its lock can't be taken: " + folder.file().string() +
                                               ".lock: Permission denied"));
}

TEST(StateFile, InAFolderThatCanNotBeEnteredIsRefused) {
    const StateFolder folder;
    const WithoutRights user;
    EXPECT_EQ(refusalOf(folder.file()), textOfRefusal(folder.file(), "Permission denied"));
}

TEST(StateFile, OnAFullDiskIsRefused) {
    const StateFolder folder;
    TestDisk disk;
    SqliteOptions options;
    options.vfs = TestDisk::name();
    disk.answerWrites(SQLITE_FULL);
    EXPECT_EQ(refusalOf(folder.file(), options),
              textOfRefusal(folder.file(), "database or disk is full"));
    disk.answerWrites(SQLITE_OK);
    EXPECT_NO_THROW(SqliteSource::open(folder.file(), options));
}

TEST(StateFile, OfAnUnknownVfsIsRefused) {
    const StateFolder folder;
    SqliteOptions options;
    options.vfs = "nonsense";
    EXPECT_EQ(refusalOf(folder.file(), options),
              textOfRefusal(folder.file(), "no such vfs: nonsense"));
}

TEST(StateFile, ThatIsRefusedIsFreeForOthers) {
    const StateFolder folder;
    write(folder.file(), std::string(5000, 'x'));
    refusalOf(folder.file());
    fs::remove(folder.file());
    EXPECT_NO_THROW(SqliteSource::open(folder.file()));
}

}  // namespace
}  // namespace velkor::testing
