#include <gtest/gtest.h>

#include <filesystem>
#include <string>

#include "tests/host/TerminalSession.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::host {
namespace {

using velkor::testing::TemporaryFile;

constexpr const char* prompt = "velkor> ";

class WatchedFilesTest : public ::testing::Test {
protected:
    void begin(TerminalSession& terminal, const std::string& value) {
        EXPECT_TRUE(terminal.shows(prompt));
        terminal.type("watch port\n");
        EXPECT_TRUE(terminal.shows("\r\nport = '" + value + "'\r\nvelkor> "));
    }

    const TemporaryFile file{"port=1\n"};
};

TEST_F(WatchedFilesTest, AreReadAgainOnATerminal) {
    TerminalSession terminal({file.path().string()});
    begin(terminal, "1");
    file.rewrite("port=2\n");
    EXPECT_TRUE(terminal.shows("\r\nport = '2'\r\nvelkor> "));
}

TEST_F(WatchedFilesTest, LeaveALineThatIsBeingTypedAsItIs) {
    TerminalSession terminal({file.path().string()});
    begin(terminal, "1");
    terminal.type("get p\u00e9");
    EXPECT_TRUE(terminal.shows("get p\u00e9"));
    file.rewrite("port=2\n");
    EXPECT_TRUE(terminal.shows("\r\nport = '2'\r\nvelkor> get p\u00e9"));
    terminal.type("\x7fort\n");
    EXPECT_TRUE(terminal.shows("\r\n'2'\r\nvelkor> "));
}

TEST_F(WatchedFilesTest, TakeTheRowOfTheLineWhereTheTerminalCanClearIt) {
    TerminalSession terminal({file.path().string()}, "xterm", {"NO_COLOR=1"});
    begin(terminal, "1");
    terminal.type("get p");
    EXPECT_TRUE(terminal.shows("get p"));
    file.rewrite("port=2\n");
    EXPECT_TRUE(terminal.shows("\r\x1b[Kport = '2'\r\nvelkor> get p"));
    terminal.type(std::string(80, 'x'));
    EXPECT_TRUE(terminal.shows("xxxx"));
    file.rewrite("port=3\n");
    EXPECT_TRUE(terminal.shows("\nport = '3'\r\nvelkor> get pxxxx"));
}

TEST_F(WatchedFilesTest, MayComeLater) {
    const TemporaryFile moved("port=1\n", "moved.properties");
    const auto later = file.parent() / "folder" / "file.properties";
    TerminalSession terminal({later.string()});
    EXPECT_TRUE(terminal.shows("velkor-config: Property file could not be opened: " +
                               later.string() + ": No such file or directory\r\n"));
    EXPECT_TRUE(terminal.shows(prompt));
    terminal.type("watch port\n");
    EXPECT_TRUE(terminal.shows(prompt));
    std::filesystem::create_directory(later.parent_path());
    std::filesystem::rename(moved.path(), later);
    EXPECT_TRUE(terminal.shows("port = '1'\r\n"));
    terminal.type("sources\nquit\n");
    EXPECT_EQ(terminal.exitCode(), 3);
    EXPECT_EQ(terminal.everything().find("PROBLEM"), std::string::npos);
}

TEST_F(WatchedFilesTest, KeepTheirValuesWhenTheyGoAndSaySo) {
    TerminalSession terminal({file.path().string()});
    begin(terminal, "1");
    const auto moved = file.parent() / "moved";
    std::filesystem::rename(file.path(), moved);
    const std::string problem = "Property file could not be opened: " + file.path().string() +
                                ": No such file or directory\r\n";
    EXPECT_TRUE(terminal.showsAfterPressing("sources\n", problem));
    terminal.type("get port\n");
    EXPECT_TRUE(terminal.shows("\r\n'1'\r\nvelkor> "));
}

TEST_F(WatchedFilesTest, AreReadOnceWhenToldSo) {
    TerminalSession terminal({"--no-watch-files", file.path().string(), "/no/file"});
    EXPECT_TRUE(terminal.shows("/no/file: No such file or directory\r\n"));
    EXPECT_TRUE(terminal.shows(prompt));
    terminal.type("sources\nquit\n");
    EXPECT_EQ(terminal.exitCode(), 3);
    EXPECT_EQ(terminal.everything().find("PROBLEM"), std::string::npos);
}

}  // namespace
}  // namespace velkor::host
