#include <gtest/gtest.h>

#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include "tests/host/TerminalSession.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::host {
namespace {

using velkor::testing::TemporaryFile;
using Words = std::vector<std::string>;

constexpr const char* prompt = "velkor> ";
constexpr const char* arrowUp = "\x1b[A";

class PromptTest : public ::testing::Test {
protected:
    std::string historyAfter(const Words& lines, const Words& arguments = {}) {
        TerminalSession terminal(arguments, "dumb", environment);
        for (const auto& line : lines) {
            EXPECT_TRUE(terminal.shows(prompt));
            terminal.type(line + "\n");
        }
        EXPECT_TRUE(terminal.shows(prompt));
        terminal.type("exit\n");
        EXPECT_EQ(terminal.exitCode(), 0);
        std::ifstream in(folder.parent() / "velkor" / "history");
        return {std::istreambuf_iterator<char>(in), {}};
    }

    const TemporaryFile folder{""};
    const Words environment{"XDG_STATE_HOME=" + folder.parent().string()};
};

TEST_F(PromptTest, TheFirstLineNamesHelp) {
    TerminalSession terminal({});
    EXPECT_TRUE(terminal.shows("velkor-config " VELKOR_VERSION
                               ": 'help' lists the commands, 'quit' ends the session.\r\n"));
    EXPECT_TRUE(terminal.shows(prompt));
}

TEST_F(PromptTest, TheSessionInTheManualIsWhatATerminalShows) {
    std::ifstream manual(VELKOR_DOCUMENTS "/console.md");
    std::string line;
    while (std::getline(manual, line) && line.rfind("    $ velkor-config ", 0) != 0) continue;
    TerminalSession terminal(
        {VELKOR_EXAMPLES "/service.properties", VELKOR_EXAMPLES "/site.properties"});
    std::string shown;
    while (std::getline(manual, line) && line.rfind("    ", 0) == 0) {
        const std::string text = line.substr(4);
        shown += text + "\r\n";
        if (text.rfind(prompt, 0) != 0) continue;
        EXPECT_TRUE(terminal.shows(prompt));
        terminal.type(text.substr(std::strlen(prompt)) + '\n');
    }
    EXPECT_EQ(terminal.exitCode(), 0);
    EXPECT_EQ(terminal.everything(), shown);
}

TEST_F(PromptTest, TheQuestionMarkHelps) {
    TerminalSession terminal({});
    EXPECT_TRUE(terminal.shows(prompt));
    terminal.type("?\n");
    EXPECT_TRUE(terminal.shows("A command may be called by the last word of its name."));
}

TEST_F(PromptTest, WhatWasTypedIsThereInTheNextSession) {
    EXPECT_EQ(historyAfter({"set a 1", "get a"}), "set a 1\nget a\nexit\n");
    TerminalSession terminal({}, "dumb", environment);
    EXPECT_TRUE(terminal.shows(prompt));
    terminal.type(std::string(arrowUp) + arrowUp + "\n");
    EXPECT_TRUE(terminal.shows("No configuration option with key: a"));
}

TEST_F(PromptTest, WhatWasTypedIsPrivate) {
    using Perms = std::filesystem::perms;
    EXPECT_NE(historyAfter({"set a 1"}), "");
    const auto kept = folder.parent() / "velkor";
    EXPECT_EQ(std::filesystem::status(kept).permissions(), Perms::owner_all);
    EXPECT_EQ(std::filesystem::status(kept / "history").permissions(),
              Perms::owner_read | Perms::owner_write);
}

TEST_F(PromptTest, ALineThatBeginsWithABlankIsNotKept) {
    EXPECT_EQ(historyAfter({" set a 1", "get a"}), "get a\nexit\n");
}

TEST_F(PromptTest, NothingIsKeptWhereThatIsNotWanted) {
    EXPECT_EQ(historyAfter({"set a 1"}, {"--no-history"}), "");
}

TEST_F(PromptTest, ALineThatCantBeKeptIsNoFailure) {
    TerminalSession terminal({}, "dumb", {"XDG_STATE_HOME=" + folder.path().string()});
    EXPECT_TRUE(terminal.shows("velkor-config: History can't be kept: " + folder.path().string()));
    EXPECT_TRUE(terminal.shows(prompt));
    terminal.type("exit\n");
    EXPECT_EQ(terminal.exitCode(), 0);
}

TEST_F(PromptTest, AnswersAreColouredWhereTheTerminalHasColours) {
    TerminalSession terminal({"-c", "set a 1", "-c", "explain a"}, "xterm");
    EXPECT_TRUE(terminal.shows("effective  \x1b[34moverride\x1b[0m  \x1b[36m1\x1b[0m\r\n"));
}

TEST_F(PromptTest, AnswersAreNotColouredWhereThatIsNotWantedOrNotPossible) {
    TerminalSession unwanted({"-c", "set a 1", "-c", "explain a"}, "xterm", {"NO_COLOR=1"});
    EXPECT_TRUE(unwanted.shows("effective  override  1\r\n"));
    TerminalSession incapable({"-c", "set a 1", "-c", "explain a"}, "vt100");
    EXPECT_TRUE(incapable.shows("effective  override  1\r\n"));
}

TEST_F(PromptTest, WhereNobodyTypesNothingIsKept) {
    ::setenv("XDG_STATE_HOME", folder.parent().c_str(), 1);
    const auto result = runProgram({}, "set a 1\n");
    ::unsetenv("XDG_STATE_HOME");
    EXPECT_EQ(result.out, "");
    EXPECT_FALSE(std::filesystem::exists(folder.parent() / "velkor"));
}

}  // namespace
}  // namespace velkor::host
