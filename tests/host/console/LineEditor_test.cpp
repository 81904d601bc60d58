#include <gtest/gtest.h>

#include <string>

#include "tests/host/TerminalSession.hpp"
#include "tests/support/Sanitizers.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::host {
namespace {

constexpr const char* prompt = "velkor> ";
constexpr const char* controlC = "\x03";
constexpr const char* controlD = "\x04";
constexpr const char* arrowUp = "\x1b[A";
constexpr const char* backspace = "\x7f";

class LineEditorTest : public ::testing::Test {
protected:
    LineEditorTest() { EXPECT_TRUE(terminal.shows(prompt)); }

    void enter(const std::string& line) { terminal.type(line + "\n"); }

    const velkor::testing::TemporaryFile file{
        "server.port=8080\nserver.host=a\na\\ key=b\nescape=\\u001b[31m\n"};
    TerminalSession terminal{{file.path().string()}};
};

TEST_F(LineEditorTest, ShowsAnswersBetweenTheLines) {
    enter("get server.port");
    EXPECT_TRUE(terminal.shows("\r\n'8080'\r\nvelkor> "));
}

TEST_F(LineEditorTest, EscapesControlCharactersOfValues) {
    enter("get escape");
    EXPECT_TRUE(terminal.shows("'\\x1b[31m'\r\n"));
    EXPECT_EQ(terminal.everything().find('\x1b'), std::string::npos);
}

TEST_F(LineEditorTest, LetsALineBeEdited) {
    enter(std::string("get server.porx") + backspace + 't');
    EXPECT_TRUE(terminal.shows("'8080'\r\n"));
}

TEST_F(LineEditorTest, RemembersEarlierLines) {
    enter("get server.port");
    EXPECT_TRUE(terminal.shows("'8080'\r\nvelkor> "));
    enter(arrowUp);
    EXPECT_TRUE(terminal.shows("'8080'\r\nvelkor> "));
}

TEST_F(LineEditorTest, CompletesACommand) {
    enter("expl\tserver.port");
    EXPECT_TRUE(terminal.shows("effective  file  '8080'\r\n"));
}

TEST_F(LineEditorTest, CompletesAKey) {
    enter("get server.p\t");
    EXPECT_TRUE(terminal.shows("'8080'\r\n"));
}

TEST_F(LineEditorTest, CompletesAKeyThatNeedsQuotes) {
    enter("get a\t");
    EXPECT_TRUE(terminal.shows("'b'\r\n"));
}

TEST_F(LineEditorTest, CompletesOptionsAndTheirValues) {
    enter("put x 1 --t\tstringA\t");
    EXPECT_TRUE(terminal.shows(prompt));
    enter("get x");
    EXPECT_TRUE(terminal.shows("\r\n['1']\r\n"));
}

TEST_F(LineEditorTest, CompletesASource) {
    enter("unload f\t");
    EXPECT_TRUE(terminal.shows(prompt));
    enter("get server.port");
    EXPECT_TRUE(terminal.shows("No configuration option"));
}

TEST_F(LineEditorTest, CompletesAFolderAndTheFileInIt) {
    const std::string folder = file.parent().string();
    enter("load " + folder.substr(0, folder.size() - 1) + "\tf\t--name again");
    EXPECT_TRUE(terminal.shows("Loaded as again.\r\n"));
}

TEST_F(LineEditorTest, CompletesAWatchedKey) {
    enter("watch server.port");
    EXPECT_TRUE(terminal.shows("'8080'\r\nvelkor> "));
    enter("unwatch s\t");
    EXPECT_TRUE(terminal.shows(prompt));
    enter("unwatch server.port");
    EXPECT_TRUE(terminal.shows("Not watched: server.port"));
}

TEST_F(LineEditorTest, ListsWhatMayFollow) {
    terminal.type("get server.\t");
    EXPECT_TRUE(terminal.shows("server.host\r\nserver.port\r\n"));
    enter("host");
    EXPECT_TRUE(terminal.shows("'a'\r\n"));
}

TEST_F(LineEditorTest, TakesCharactersBeyondAscii) {
    enter("set \u00e9 '\u20ac'");
    EXPECT_TRUE(terminal.shows(prompt));
    enter("get \u00e9");
    EXPECT_TRUE(terminal.shows("\r\n'\u20ac'\r\n"));
}

TEST_F(LineEditorTest, ControlCDropsTheLine) {
    terminal.type("set server.port 1");
    EXPECT_TRUE(terminal.shows("server.port 1"));
    terminal.type(controlC);
    EXPECT_TRUE(terminal.shows("^C\r\nvelkor> "));
    enter("get server.port");
    EXPECT_TRUE(terminal.shows("\r\n'8080'\r\n"));
}

TEST_F(LineEditorTest, ControlCOnAnEmptyLineEndsNothing) {
    terminal.type(controlC);
    EXPECT_TRUE(terminal.shows("^C\r\nvelkor> "));
    enter("get server.port");
    EXPECT_TRUE(terminal.shows("'8080'\r\n"));
}

TEST_F(LineEditorTest, ControlDEndsTheSession) {
    terminal.type(controlD);
    EXPECT_EQ(terminal.exitCode(), 0);
}

TEST_F(LineEditorTest, QuitEndsTheSession) {
    enter("quit");
    EXPECT_EQ(terminal.exitCode(), 0);
}

TEST_F(LineEditorTest, ASignalThatEndsTheProgramLeavesAnOrdinaryTerminal) {
    if (testing::isThreadSanitized) {
        GTEST_SKIP() << "the thread sanitizer loses a signal that comes as a system call begins";
    }
    EXPECT_FALSE(terminal.isOrdinary());
    terminal.signal(SIGTERM);
    EXPECT_EQ(terminal.exitCode(), -1);
    EXPECT_TRUE(terminal.isOrdinary());
}

TEST_F(LineEditorTest, TheEndOfTheProgramLeavesAnOrdinaryTerminal) {
    enter("quit");
    EXPECT_EQ(terminal.exitCode(), 0);
    EXPECT_TRUE(terminal.isOrdinary());
}

TEST_F(LineEditorTest, WatchedValuesStandOnLinesOfTheirOwn) {
    enter("watch server.port");
    EXPECT_TRUE(terminal.shows("\r\nserver.port = '8080'\r\nvelkor> "));
    enter("set server.port 1");
    EXPECT_TRUE(terminal.shows("\r\nserver.port = 1\r\nvelkor> "));
}

TEST_F(LineEditorTest, TheTerminalMayGetAnotherSizeWhileALineIsEdited) {
    for (const unsigned columns : {2U, 10U, 80U}) {
        terminal.resize(1, columns);
        terminal.type(std::string(60, 'x') + "typed");
        EXPECT_TRUE(terminal.shows("typed"));
        terminal.resize(24, 80);
        terminal.type("again");
        EXPECT_TRUE(terminal.shows("again"));
        terminal.type(controlC);
        EXPECT_TRUE(terminal.shows("^C\r\nvelkor> "));
    }
    enter("get server.port");
    EXPECT_TRUE(terminal.shows("'8080'\r\n"));
}

TEST_F(LineEditorTest, MessagesNameNoLineNumber) {
    enter("nope");
    EXPECT_TRUE(terminal.shows("velkor-config: Unknown command: nope\r\nvelkor> "));
}

TEST_F(LineEditorTest, ACommandThatFailedIsNoFailureOfTheSession) {
    enter("nope");
    EXPECT_TRUE(terminal.shows("Unknown command"));
    enter("quit");
    EXPECT_EQ(terminal.exitCode(), 0);
}

TEST(LineEditor, GivenLinesThatFailAreAFailureAlsoOnATerminal) {
    TerminalSession terminal({"-c", "nope"});
    EXPECT_EQ(terminal.exitCode(), 1);
}

}  // namespace
}  // namespace velkor::host
