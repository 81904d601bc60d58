#include <gtest/gtest.h>

#include <csignal>
#include <string>
#include <vector>

#include <sys/stat.h>
#include <unistd.h>

#include "tests/host/TerminalSession.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::host {
namespace {

using velkor::testing::TemporaryFile;

constexpr const char* prompt = "velkor> ";
constexpr const char* controlC = "\x03";

// More than a terminal takes before somebody looks.
std::string manyProperties(unsigned count) {
    std::string text;
    for (unsigned i = 0; i < count; ++i) text += "key" + std::to_string(1'000'000 + i) + "=value\n";
    return text;
}

class ControlCTest : public ::testing::Test {
protected:
    static constexpr unsigned keyCount = 100'000;

    ControlCTest() {
        EXPECT_TRUE(terminal.shows(prompt));
        enter("set kept 1");
        EXPECT_TRUE(terminal.shows(prompt));
    }

    void enter(const std::string& line) { terminal.type(line + "\n"); }

    // Begins a command, and gives once Ctrl-C is a signal and no key.
    void begin(const std::string& line) {
        enter(line);
        EXPECT_TRUE(terminal.becomesOrdinary());
    }

    // What was set is there still.
    void expectTheSession() {
        EXPECT_TRUE(terminal.shows(std::string("\n") + prompt));
        enter("get kept");
        EXPECT_TRUE(terminal.shows("\r\n1\r\n"));
    }

    const TemporaryFile file{manyProperties(keyCount)};
    TerminalSession terminal{{file.path().string()}};
};

TEST_F(ControlCTest, EndsALongOutput) {
    enter("list");
    EXPECT_TRUE(terminal.shows("key1000000 = "));
    terminal.type(controlC);
    expectTheSession();
    EXPECT_EQ(terminal.everything().find("key1099999"), std::string::npos);
}

TEST_F(ControlCTest, EndsACommandThatHasShownNothingYet) {
    begin("list");
    terminal.type(controlC);
    expectTheSession();
    EXPECT_EQ(terminal.everything().find("key1099999"), std::string::npos);
}

TEST_F(ControlCTest, EndsWhatIsShown) {
    enter("show --source");
    EXPECT_TRUE(terminal.shows("key1000000 = "));
    terminal.type(controlC);
    expectTheSession();
    EXPECT_EQ(terminal.everything().find("key1099999"), std::string::npos);
}

TEST_F(ControlCTest, EndsWhatHasNothingToShowYet) {
    begin("show *9999");
    terminal.type(controlC);
    expectTheSession();
    EXPECT_EQ(terminal.everything().find("key1099999"), std::string::npos);
}

TEST_F(ControlCTest, EndsAWaitForAFile) {
    const std::string pipe = file.path().string() + ".pipe";
    ASSERT_EQ(::mkfifo(pipe.c_str(), 0600), 0);
    begin(R"(send AddPropertyFileSource {"name":"n","path":")" + pipe + "\"}");
    EXPECT_TRUE(terminal.showsAfterPressing(
        controlC, "Property file could not be opened: " + pipe + ": Interrupted system call\r\n"));
    expectTheSession();
}

TEST_F(ControlCTest, MayBePressedAgainAndAgain) {
    for (int round = 0; round < 3; ++round) {
        enter("list");
        EXPECT_TRUE(terminal.shows("key1000000 = "));
        terminal.type(controlC);
        EXPECT_TRUE(terminal.shows(std::string("\n") + prompt));
    }
    enter("quit");
    EXPECT_EQ(terminal.exitCode(), 0);
}

TEST_F(ControlCTest, ASignalWhileALineIsEditedChangesNothing) {
    terminal.type("get ke");
    EXPECT_TRUE(terminal.shows("get ke"));
    terminal.signal(SIGINT);
    enter("pt");
    EXPECT_TRUE(terminal.shows("\r\n1\r\n"));
}

TEST(ControlC, EndsTheProgramWhenItsLinesAreGiven) {
    const TemporaryFile file(manyProperties(100'000));
    TerminalSession terminal({file.path().string(), "-c", "list"});
    EXPECT_TRUE(terminal.shows("key1000000 = "));
    terminal.type(controlC);
    EXPECT_EQ(terminal.exitCode(), -1);
}

}  // namespace
}  // namespace velkor::host
