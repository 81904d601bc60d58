#include <gtest/gtest.h>

#include <csignal>
#include <filesystem>
#include <regex>
#include <string>
#include <vector>

#include <sys/resource.h>

#include "tests/host/ChildProcess.hpp"
#include "tests/host/TerminalSession.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::host {
namespace {

using velkor::testing::TemporaryFile;

// While it lives, no file of this process and its children grows beyond a size.
class FileSizeLimit {
public:
    explicit FileSizeLimit(rlim_t bytes) : action(std::signal(SIGXFSZ, SIG_IGN)) {
        ::getrlimit(RLIMIT_FSIZE, &before);
        rlimit limited = before;
        limited.rlim_cur = bytes;
        ::setrlimit(RLIMIT_FSIZE, &limited);
    }
    ~FileSizeLimit() {
        ::setrlimit(RLIMIT_FSIZE, &before);
        std::signal(SIGXFSZ, action);
    }

    FileSizeLimit(const FileSizeLimit&) = delete;
    FileSizeLimit& operator=(const FileSizeLimit&) = delete;

private:
    rlimit before{};
    void (*action)(int);
};

class StateTest : public ::testing::Test {
protected:
    ChildResult run(const std::vector<std::string>& lines) const {
        std::vector<std::string> arguments{file.path().string(), "--state", state};
        for (const auto& line : lines) {
            arguments.emplace_back("-c");
            arguments.push_back(line);
        }
        return runProgram(arguments);
    }

    const TemporaryFile file{"port=8080\nhost=a\n", "site.properties"};
    const std::string state = (file.parent() / "state.db").string();
};

TEST_F(StateTest, OutlastsTheSessionAndTellsWhoSetItWhen) {
    EXPECT_EQ(runProgram({"--state", state}, "set port 1\nquit\n").exitCode, 0);
    const auto result = run({"get port", "history port"});
    EXPECT_EQ(result.err, "");
    const std::regex expected(
        "1\n"
        "CHANGE  TIME +WHO +KEY +ACTION  BEFORE  AFTER\n"
        R"(1 +\d{4}-\d\d-\d\dT\d\d:\d\d:\d\dZ  \S+ +port  set     -       1)"
        "\n");
    EXPECT_TRUE(std::regex_match(result.out, expected)) << result.out;
}

TEST_F(StateTest, StandsInFrontOfTheFilesInThePlaceOfOverride) {
    EXPECT_EQ(run({"set port 1", "sources", "explain port"}).out,
              "NAME     GROUP  ORDER       ACCESS\n"
              "state    -      0           writable\n"
              "site     -      1000        read-only\n"
              "default  -      2147483647  writable\n"
              "effective   state  1\n"
              "overridden  site   '8080'\n");
}

TEST_F(StateTest, ForgetsWhatIsUnset) {
    EXPECT_EQ(run({"set port 1", "unset port"}).out, "port = '8080' (site)\n");
    EXPECT_EQ(run({"get port"}).out, "'8080'\n");
}

TEST_F(StateTest, TakesChangesBack) {
    run({"set port 1", "set port 2", "set host b"});
    EXPECT_EQ(run({"undo 2", "get port"}).exitCode, 0);
    EXPECT_EQ(run({"get port", "get host"}).out, "1\n'b'\n");
    run({"undo"});
    EXPECT_EQ(run({"get port"}).out, "2\n");
}

TEST_F(StateTest, ShowsTheNewestChangesOfAPrefix) {
    const std::string history =
        run({"set a.b 1", "set a.c 2", "set d 3", "history a. --limit 1"}).out;
    EXPECT_NE(history.find("a.c"), std::string::npos);
    EXPECT_EQ(history.find("a.b"), std::string::npos);
    EXPECT_EQ(history.find("d "), std::string::npos);
}

TEST_F(StateTest, KeepsWhatAMessageSets) {
    const std::string set =
        R"(send ConfigurationSet {"key":"port","value":{"type":"uint","value":7}})";
    EXPECT_EQ(run({set}).exitCode, 0);
    EXPECT_EQ(run({"get port"}).out, "7\n");
}

TEST_F(StateTest, SaysWhenAChangeCantBeTakenBack) {
    const auto result = run({"undo 5", "undo"});
    EXPECT_EQ(result.err,
              "velkor-config: undo: No such change in the journal: 5\n"
              "velkor-config: undo: There is no change in the journal.\n");
    EXPECT_EQ(result.exitCode, 1);
}

TEST_F(StateTest, EndsAValueInTime) {
    TerminalSession terminal({"--state", state, file.path().string()});
    EXPECT_TRUE(terminal.shows("velkor> "));
    terminal.type("watch port\n");
    EXPECT_TRUE(terminal.shows("port = '8080'\r\n"));
    terminal.type("put port 1 --for 100ms\n");
    EXPECT_TRUE(terminal.shows("port = 1\r\n"));
    EXPECT_TRUE(terminal.shows("port = '8080'\r\n"));
    EXPECT_TRUE(terminal.showsAfterPressing("history\n", "expired"));
}

class RefusedWriteTest : public StateTest, public ::testing::WithParamInterface<std::string> {};

// The text of a value that the disk has no room for.
const std::string large(100'000, 'x');

TEST_P(RefusedWriteTest, IsReportedAndNotAnswered) {
    EXPECT_EQ(run({"set small 1"}).exitCode, 0);
    const FileSizeLimit limit(50'000);
    const auto result = run({GetParam(), "get small", "get port"});
    EXPECT_EQ(result.err.find("velkor-config: "), 0U);
    EXPECT_NE(result.err.find("State file could not be written: " + state + ": "),
              std::string::npos)
        << result.err;
    EXPECT_EQ(result.out, "1\n'8080'\n");
    EXPECT_EQ(result.exitCode, 1);
}

INSTANTIATE_TEST_SUITE_P(
    Commands, RefusedWriteTest,
    ::testing::Values("set port " + large, "put port " + large, "put port " + large + " --for 1h",
                      R"(send ConfigurationSet {"key":"port","value":{"type":"string","value":")" +
                          large + "\"}}"),
    [](const auto& tested) { return "Number" + std::to_string(tested.index); });

TEST_F(StateTest, ThatCantBeOpenedEndsTheProgramBeforeAnythingIsSet) {
    const auto result = runProgram({"--state", "/no/state.db", "-c", "set a 1", "-c", "get a"});
    EXPECT_EQ(result.out, "");
    EXPECT_EQ(result.err.find("velkor-config: State file could not be opened: /no/state.db"), 0U);
    EXPECT_EQ(result.exitCode, 3);
}

TEST_F(StateTest, IsOfOneSessionAtATime) {
    TerminalSession first({"--state", state});
    EXPECT_TRUE(first.shows("velkor> "));
    const auto second = run({"set a 1"});
    EXPECT_EQ(second.err.find("velkor-config: State file could not be opened: " + state), 0U);
    EXPECT_EQ(second.exitCode, 3);
}

}  // namespace
}  // namespace velkor::host
