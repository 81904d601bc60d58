#include <gtest/gtest.h>

#include <fstream>
#include <iterator>
#include <string>

#include "tests/host/ChildProcess.hpp"
#include "tests/host/TerminalSession.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::host {
namespace {

using velkor::testing::TemporaryFile;

class SettingsConsoleTest : public ::testing::Test {
protected:
    ChildResult run(const std::string& commands) const {
        return runProgram({"--source", "site=" + file.path().string()}, commands);
    }

    const TemporaryFile file{"server.port=8443\nserver.password=verysecret\nserver.prot=1\n"};
};

TEST_F(SettingsConsoleTest, ShowsASecretByNoCommand) {
    const auto result = run(
        "get server.password\n"
        "explain server.password\n"
        "watch server.password\n"
        "set server.password othersecret\n"
        "list\n"
        "settings\n"
        "send ConfigurationGet {\"key\":\"server.password\"}\n"
        "send ConfigurationSet {\"key\":\"server.password\",\"value\":{\"type\":\"string\"}}\n");
    EXPECT_EQ(result.out.substr(0, result.out.find("KEY")),
              "•••\n"
              "effective  site  •••\n"
              "server.password = •••\n"
              "server.password = •••\n"
              "server.password = •••\n"
              "server.port = '8443'\n"
              "server.prot = '1'\n");
    EXPECT_EQ(result.out.find("verysecret"), std::string::npos);
    EXPECT_EQ(result.out.find("othersecret"), std::string::npos);
    EXPECT_EQ(result.err, "");
    EXPECT_EQ(result.exitCode, 0);
}

TEST_F(SettingsConsoleTest, ShowsASecretInNoFormOfAValue) {
    const auto result =
        run("set server.password othersecret\n"
            "show server.password\n"
            "show server.password --all\n"
            "show server.password --raw\n"
            "show server.password --json\n"
            "show server.password --json --all\n"
            "explain server.password --json\n"
            "watch server.password --json\n"
            "send --raw ConfigurationGet {\"key\":\"server.password\"}\n"
            "diff override\n");
    const std::string value = "{\"type\":\"string\",\"value\":\"•••\"}";
    const std::string layers = "[{\"source\":\"override\",\"value\":" + value +
                               "},{\"source\":\"site\",\"value\":" + value + "}]";
    EXPECT_EQ(result.out,
              "server.password = •••\n"
              "server.password = ••• (override)\n"
              "server.password = ••• (site, overridden)\n"
              "•••\n"
              "{\n\"server.password\":" +
                  value + "\n}\n{\n\"server.password\":" + layers +
                  "\n}\n"
                  "{\"key\":\"server.password\",\"layers\":" +
                  layers + "}\n{\"key\":\"server.password\",\"value\":" + value +
                  "}\n{\"key\":\"server.password\",\"source\":\"override\",\"value\":" + value +
                  "}\n~ server.password = ••• -> •••\n");
    EXPECT_EQ(result.exitCode, 0);
}

TEST_F(SettingsConsoleTest, ExportsNoSecretAndSaysSo) {
    for (const char* const format : {"properties", "json"}) {
        const auto result = run(std::string("export server.p* --format ") + format + '\n');
        EXPECT_NE(result.out.find("8443"), std::string::npos);
        EXPECT_EQ(result.out.find("server.password"), std::string::npos);
        EXPECT_EQ(result.err, "velkor-config: Left out since they are secret: server.password\n");
        EXPECT_EQ(result.exitCode, 0);
    }
}

TEST_F(SettingsConsoleTest, ShowsASecretInNoRecord) {
    const auto result = runProgram({"--source", "site=" + file.path().string(), "--log",
                                    "velkor::configuration=31", "--log", "velkor::settings=31"},
                                   "set server.password othersecret\nset server.port none\n");
    EXPECT_NE(result.err.find("debug velkor::configuration: set: server.password@override\n"),
              std::string::npos);
    EXPECT_NE(result.err.find("error velkor::settings: server.port: 'none' from source"),
              std::string::npos);
    EXPECT_EQ(result.err.find("verysecret"), std::string::npos);
    EXPECT_EQ(result.err.find("othersecret"), std::string::npos);
}

TEST_F(SettingsConsoleTest, NamesTheCommandAmongTheOthers) {
    const std::string help = run("help\n").out;
    EXPECT_NE(help.find("\nsettings                   [--undeclared] [KEY-PREFIX]  "),
              std::string::npos);
    EXPECT_NE(help.find("  List the settings that are declared"), std::string::npos);
    EXPECT_EQ(run("help settings\n").out,
              "settings ([--undeclared] [KEY-PREFIX])\n"
              "List the settings that are declared, or the keys that are not.\n");
}

TEST_F(SettingsConsoleTest, KeepsNoSecretInItsHistory) {
    TerminalSession terminal({"--source", "site=" + file.path().string()}, "dumb",
                             {"XDG_STATE_HOME=" + file.parent().string()});
    for (const char* line : {"set server.port 1\n", "set server.password othersecret\n",
                             "send ConfigurationKeys\n", "quit\n"}) {
        EXPECT_TRUE(terminal.shows("velkor> "));
        terminal.type(line);
    }
    EXPECT_EQ(terminal.exitCode(), 0);
    std::ifstream history(file.parent() / "velkor" / "history");
    EXPECT_EQ(std::string(std::istreambuf_iterator<char>(history), {}),
              "set server.port 1\nquit\n");
}

TEST(SettingsConsole, EndsBeforeTheFirstCommandWhenSettingsDoNotFit) {
    const auto result = runProgram({}, "list\n");
    EXPECT_EQ(result.out, "");
    EXPECT_EQ(result.err, "server.password: no value, and no default\n");
    EXPECT_EQ(result.exitCode, 1);
}

}  // namespace
}  // namespace velkor::host
