#include <gtest/gtest.h>

#include <cstdlib>
#include <ostream>
#include <string>
#include <vector>

#include <fcntl.h>
#include <unistd.h>

#include "tests/host/ChildProcess.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::host {
namespace {

using namespace std::string_literals;
using velkor::testing::TemporaryFile;

const std::string serviceFile = VELKOR_EXAMPLES "/service.properties";
const std::string siteFile = VELKOR_EXAMPLES "/site.properties";

TEST(Program, ShowsLayersAndLetsAWriteWin) {
    const auto result =
        runProgram({serviceFile, siteFile},
                   "list\nset server.port 9090\nget server.port\nexplain server.port\n");
    EXPECT_EQ(result.exitCode, 0);
    EXPECT_EQ(result.err, "");
    EXPECT_NE(result.out.find("server.port = '8443'\n"), std::string::npos);
    EXPECT_NE(result.out.find("server.backlog = '128'\n"), std::string::npos);
    const std::string end =
        "\n9090\n"
        "effective   override  9090\n"
        "overridden  site      '8443'\n"
        "overridden  service   '8080'\n";
    ASSERT_GT(result.out.size(), end.size());
    EXPECT_EQ(result.out.substr(result.out.size() - end.size()), end);
}

TEST(Program, ShowsWatchedValuesInOrderWithTheAnswers) {
    const auto result =
        runProgram({serviceFile, siteFile},
                   "watch server.port\nset server.port 1\nget server.port\nset server.port 2\n");
    EXPECT_EQ(result.out, "server.port = '8443'\nserver.port = 1\n1\nserver.port = 2\n");
    EXPECT_EQ(result.exitCode, 0);
}

TEST(Program, ListsItsSources) {
    EXPECT_EQ(runProgram({serviceFile, siteFile, "-c", "sources"}).out,
              "NAME      GROUP  ORDER       ACCESS\n"
              "override  -      0           writable\n"
              "site      -      1000        read-only\n"
              "service   -      1000        read-only\n"
              "default   -      2147483647  writable\n");
}

#if !VELKOR_HAS_ETCD
TEST(Program, RefusesALayerInEtcdWhereItWasBuiltWithoutThat) {
    const auto result = runProgram({"--etcd", "http://a:1,prefix=/p/", "-c", "get port"});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_EQ(result.err,
              "velkor-config: --etcd needs velkor::etcd, which this velkor-config was built "
              "without: http://a:1\n");
    EXPECT_EQ(result.out, "No configuration option with key: port\n");
}
#endif

TEST(Program, HasNoCommandForSettingsWhereThereAreNone) {
    EXPECT_EQ(runProgram({"-c", "settings"}).err, "velkor-config: Unknown command: settings\n");
    EXPECT_EQ(runProgram({"-c", "help"}).out.find("settings"), std::string::npos);
}

TEST(Program, TakesValuesFromTheEnvironmentAndTheCommandLine) {
    ::setenv("PROGRAM_TEST_SERVER__PORT", "1", 1);
    ::setenv("PROGRAM_TEST_SERVER__BACKLOG", "2", 1);
    const auto result =
        runProgram({"--set", "server.port=3.5", serviceFile, "--env", "PROGRAM_TEST_", "-c",
                    "sources", "-c", "explain server.port", "-c", "get server.backlog"});
    ::unsetenv("PROGRAM_TEST_SERVER__PORT");
    ::unsetenv("PROGRAM_TEST_SERVER__BACKLOG");
    EXPECT_EQ(result.out,
              "NAME          GROUP  ORDER       ACCESS\n"
              "override      -      0           writable\n"
              "command-line  -      100         read-only\n"
              "environment   -      200         read-only\n"
              "service       -      1000        read-only\n"
              "default       -      2147483647  writable\n"
              "effective   command-line  3.5\n"
              "overridden  environment   '1'\n"
              "overridden  service       '8080'\n"
              "'2'\n");
    EXPECT_EQ(result.exitCode, 0);
}

TEST(Program, ReadsFilesOnceWhereThereIsNoTerminal) {
    EXPECT_EQ(runProgram({"/no/file", "-c", "sources"}).out.find("file"), std::string::npos);
    EXPECT_NE(runProgram({"--watch-files", "/no/file", "-c", "sources"})
                  .out.find("Property file could not be opened: /no/file: No such file"),
              std::string::npos);
}

TEST(Program, ReadsAPipeToItsEndThoughFilesAreWatched) {
    EXPECT_EQ(runProgram({"--watch-files", "/dev/stdin", "-c", "get a"}, "a=1\n").out, "'1'\n");
}

TEST(Program, TakesMessagesAsJson) {
    const auto result = runProgram(
        {"-c", R"(send ConfigurationSet {"key":"server.port","value":{"type":"int","value":9090}})",
         "-c", R"(send ConfigurationGet {"key":"server.port"})"});
    EXPECT_EQ(result.out,
              R"(velkor/configuration/ConfigurationOptionResponse )"
              R"({"key":"server.port","source":"","value":{"type":"int","value":9090}})"
              "\n"
              R"(velkor/configuration/ConfigurationOptionResponse )"
              R"({"key":"server.port","source":"override","value":{"type":"int","value":9090}})"
              "\n");
    EXPECT_EQ(result.exitCode, 0);
}

TEST(Program, WritesValuesByteForByteWhereThereIsNoTerminal) {
    const TemporaryFile file("a=\\u001b[31m\xff\t\n");
    EXPECT_EQ(runProgram({file.path().string(), "-c", "get a"}).out, "'\x1b[31m\xff\t'\n");
}

TEST(Program, GivenLinesTakeThePlaceOfStandardInput) {
    EXPECT_EQ(runProgram({"-c", "set a 1", "-c", "get a"}, "get b\n").out, "1\n");
}

TEST(Program, CarriesOutOneCommandWhoseWordsAreTakenAsTheyAre) {
    const TemporaryFile file("a\\ 'key=b\n");
    const auto result = runProgram({file.path().string(), "--", "get", "a 'key"}, "set a 1\n");
    EXPECT_EQ(result.out, "'b'\n");
    EXPECT_EQ(result.err, "");
    EXPECT_EQ(result.exitCode, 0);
}

TEST(Program, TakesAMessageAsOneCommand) {
    EXPECT_EQ(runProgram({"--", "send", "ConfigurationKeys", "{ }"}).out,
              "velkor/configuration/ConfigurationKeysResponse {\"keys\":[]}\n");
}

TEST(Program, TakesAMessageWithItsOptionAsOneCommand) {
    EXPECT_EQ(runProgram({"--", "send", "--raw", "ConfigurationKeys", "{ }"}).out,
              "{\"keys\":[]}\n");
}

TEST(Program, OneCommandHasOptionsOfItsOwn) {
    EXPECT_EQ(runProgram({"--", "put", "a", "x y", "--dry-run"}).out,
              "LAYER      NOW  THEN\n"
              "override   -    'x y'\n"
              "effective  -    'x y' (override)\n");
}

TEST(Program, OneCommandThatFailsDecidesTheExitStatus) {
    for (const std::string command : {"nope", "#"}) {
        const auto result = runProgram({"--", command});
        EXPECT_EQ(result.err.rfind("velkor-config: Unknown command: " + command, 0), 0U);
        EXPECT_EQ(result.exitCode, 1);
    }
}

TEST(Program, OneCommandMayHaveARemark) {
    EXPECT_EQ(runProgram({"--", "set", "a", "20s"}).err,
              "velkor-config: set a: 20s was stored as 20; put stores the whole word\n");
}

TEST(Program, RefusesACommandWhereFilesAreNamed) {
    const auto result = runProgram({"/no/file", "get", "a key"});
    EXPECT_EQ(result.out, "");
    EXPECT_EQ(result.err,
              "velkor-config: get is a command and no file; say: velkor-config [OPTIONS] [FILE...] "
              "-- get a\\ key, or -c \"get a\\ key\"\n");
    EXPECT_EQ(result.exitCode, 2);
}

TEST(Program, EndsAtQuit) {
    const auto result = runProgram({}, "set a 1\nquit\nget a\n");
    EXPECT_EQ(result.out, "");
    EXPECT_EQ(result.exitCode, 0);
}

TEST(Program, GoesOnAfterAFailedCommandAndTellsSoAtItsEnd) {
    const auto result = runProgram({}, "nope\nget\nget 'a\nset a 1\nget a\n");
    EXPECT_EQ(result.out, "1\n");
    EXPECT_EQ(result.err,
              "velkor-config: line 1: Unknown command: nope\n"
              "velkor-config: line 2: velkor.configuration.get takes 1 argument; given: 0\n"
              "velkor-config: line 3: Unbalanced quote: '\n");
    EXPECT_EQ(result.exitCode, 1);
}

TEST(Program, AnAbsentKeyIsAnAnswerNotAFailure) {
    const auto result = runProgram({"-c", "get a"});
    EXPECT_EQ(result.out, "No configuration option with key: a\n");
    EXPECT_EQ(result.exitCode, 0);
}

TEST(Program, SaysWhenSetStoresSomethingElseThanWasTyped) {
    const auto result = runProgram({}, "set host 10.20.0.9\nset a 1\nget host\n");
    EXPECT_EQ(result.out, "10.2\n");
    EXPECT_EQ(result.err,
              "velkor-config: line 1: set host: 10.20.0.9 was stored as 10.2; put stores the whole "
              "word\n");
    EXPECT_EQ(result.exitCode, 0);
}

TEST(Program, SaysWhenAnOptionStoresSomethingElseThanItsText) {
    const auto result = runProgram({"--set", "a=1x", "--set", "a=10.20.0.9", "--set", "b=5",
                                    "--set", "c=9007199254740993.0", "-c", "get a"});
    EXPECT_EQ(result.out, "10.2\n");
    EXPECT_EQ(result.err,
              "velkor-config: --set a: 10.20.0.9 was stored as 10.2; put stores the whole word\n"
              "velkor-config: --set c: 9007199254740993.0 was stored as 9.0072e+15; put stores the "
              "whole word\n");
    EXPECT_EQ(result.exitCode, 0);
}

TEST(Program, PutTellsQuotedWordsFromOthers) {
    EXPECT_EQ(runProgram({"-c", "put a 5", "-c", "put b '5'", "-c", "list"}).out,
              "a = 5\nb = '5'\n");
}

TEST(Program, PutFailsWhereTheValueDoesNotFit) {
    const auto result = runProgram({"-c", "put a --type uint -1", "-c", "list"});
    EXPECT_EQ(result.out, "");
    EXPECT_EQ(result.err, "velkor-config: --type uint: not within 0 to 4294967295\n");
    EXPECT_EQ(result.exitCode, 1);
}

struct PutCase {
    const char* type;
    std::string words;
    std::string value;  ///< As JSON.

    friend std::ostream& operator<<(std::ostream& out, const PutCase& it) { return out << it.type; }
};

class PutTypeTest : public ::testing::TestWithParam<PutCase> {};

TEST_P(PutTypeTest, IsStored) {
    const std::string type = GetParam().type;
    const auto result =
        runProgram({}, "put a --type " + type + ' ' + GetParam().words + "\nshow a --json\n");
    EXPECT_EQ(result.out,
              "{\n\"a\":{\"type\":\"" + type + "\",\"value\":" + GetParam().value + "}\n}\n");
    EXPECT_EQ(result.err, "");
}

INSTANTIATE_TEST_SUITE_P(
    Types, PutTypeTest,
    ::testing::Values(PutCase{"bool", "false", "false"}, PutCase{"int", "-5", "-5"},
                      PutCase{"uint", "4294967295", "4294967295"}, PutCase{"double", "1", "1"},
                      PutCase{"string", "5", "\"5\""}, PutCase{"ustring", "x", "\"x\""},
                      PutCase{"boolArray", "true false", "[true,false]"},
                      PutCase{"intArray", "1 -2", "[1,-2]"}, PutCase{"uintArray", "", "[]"},
                      PutCase{"doubleArray", "0.5 2", "[0.5,2]"},
                      PutCase{"stringArray", "a 'b c'", "[\"a\",\"b c\"]"},
                      PutCase{"ustringArray", "\u20ac", "[\"\u20ac\"]"}),
    [](const auto& tested) { return std::string(tested.param.type); });

TEST(Program, PutTakesAWholeWordForANumberOnly) {
    EXPECT_EQ(runProgram({}, "put a 10.20.0.9\nput b 20s\nput c 1e3\nput d true\nlist\n").out,
              "a = '10.20.0.9'\nb = '20s'\nc = 1000\nd = true\n");
}

TEST(Program, PutAndUnsetReportWhatTheStoreRefuses) {
    for (const std::string name : {"put", "unset"}) {
        const std::string command = name + (name == "put" ? " a 1" : " server.port");
        const auto result =
            runProgram({"--source", "s=" + serviceFile, "-c", command + " --source s"});
        EXPECT_EQ(
            result.err.rfind("velkor-config: " + name + ": Source not found or not writable: ", 0),
            0U)
            << result.err;
        EXPECT_EQ(result.out, "");
        EXPECT_EQ(result.exitCode, 1);
    }
}

TEST(Program, PutAndUnsetReachTheSourceThatIsNamed) {
    const auto result = runProgram({},
                                   "put a 1 --source default\nput a 2\n"
                                   "unset a\nunset a --source default\nunset a\n");
    EXPECT_EQ(result.out, "a = 1 (default)\nNo configuration option with key: a\n");
    EXPECT_EQ(result.err,
              "velkor-config: line 5: Nothing to unset: No configuration option with key: a\n");
    EXPECT_EQ(result.exitCode, 1);
}

TEST(Program, LoadsAndUnloadsSourcesAsItGoes) {
    const TemporaryFile file("port=80\n");
    const std::string path = file.path().string();
    const auto result =
        runProgram({}, "load " + path + "\nload " + path +
                           " --name site --group server --order 7\nsources\nget server.port\n"
                           "unload site\nunload file\nlist\nunload override\nload /no/file\n");
    EXPECT_EQ(result.out,
              "Loaded as file.\n"
              "Loaded as site.\n"
              "NAME      GROUP    ORDER       ACCESS\n"
              "override  -        0           writable\n"
              "site      server.  7           read-only\n"
              "file      -        1000        read-only\n"
              "default   -        2147483647  writable\n"
              "'80'\n");
    EXPECT_EQ(result.err,
              "velkor-config: line 8: The session needs its source: override\n"
              "velkor-config: line 9: Property file could not be opened: /no/file: No such "
              "file or directory\n");
    EXPECT_EQ(result.exitCode, 1);
}

TEST(Program, DropsNoCommandBesideACheck) {
    for (const std::vector<std::string>& command :
         {std::vector<std::string>{"-c", "list"}, std::vector<std::string>{"--", "list"}}) {
        std::vector<std::string> arguments{"--check", serviceFile};
        arguments.insert(arguments.end(), command.begin(), command.end());
        const auto result = runProgram(arguments);
        EXPECT_EQ(result.out, "");
        EXPECT_EQ(result.err,
                  "velkor-config: --check goes without -c LINE, -- COMMAND and --listen (see "
                  "--help)\n");
        EXPECT_EQ(result.exitCode, 2);
    }
}

TEST(Program, ReportsWhatASourceRefuses) {
    const auto result = runProgram(
        {"--source", "s=" + serviceFile + ",order=-1,writable", "-c", "set server.port 1"});
    EXPECT_EQ(result.err,
              "velkor-config: velkor.configuration.set: PropertyFileSource does not support "
              "writing\n");
    EXPECT_EQ(result.exitCode, 1);
}

TEST(Program, ReportsBadUsage) {
    const auto result = runProgram({"--frob"});
    EXPECT_EQ(result.out, "");
    EXPECT_EQ(result.err,
              "velkor-config: The following argument was not expected: --frob (see --help)\n");
    EXPECT_EQ(result.exitCode, 2);
}

TEST(Program, ReportsEverySourceThatCantBeLoadedAndGoesOn) {
    const auto result =
        runProgram({"/no/a", "--source", "override=" + serviceFile, "-c", "set a 1", "-c", "list"});
    EXPECT_EQ(result.out, "a = 1\n");
    EXPECT_EQ(result.err,
              "velkor-config: Property file could not be opened: /no/a: No such file or directory\n"
              "velkor-config: Source with the requested name already exists: override\n");
    EXPECT_EQ(result.exitCode, 3);
}

TEST(Program, ASourceThatCantBeLoadedDecidesTheExitStatus) {
    EXPECT_EQ(runProgram({"/no/a", "-c", "nope"}).exitCode, 3);
}

TEST(Program, StopsReadingAFileAtTheLimit) {
    const auto result = runProgram({"--max-file-size", "1MiB", "/dev/zero", "-c", "sources"});
    EXPECT_EQ(result.err, "velkor-config: Property file is larger than 1048576 bytes: /dev/zero\n");
    EXPECT_EQ(result.out.find("zero"), std::string::npos);
    EXPECT_EQ(result.exitCode, 3);
}

TEST(Program, StopsReadingAFileThatHasNoEnd) {
    const auto result = runProgram({"/dev/zero", "-c", "set a 1", "-c", "get a"});
    EXPECT_EQ(result.err,
              "velkor-config: Property file is larger than 268435456 bytes: /dev/zero\n");
    EXPECT_EQ(result.out, "1\n");
    EXPECT_EQ(result.exitCode, 3);
}

TEST(Program, ReportsAFileThatCantBeRead) {
    const auto result = runProgram({"/proc/self/mem", "-c", "list"});
    EXPECT_EQ(result.err,
              "velkor-config: Property file could not be read: /proc/self/mem: Input/output "
              "error\n");
    EXPECT_EQ(result.exitCode, 3);
}

TEST(Program, ShowsItsVersion) {
    const auto result = runProgram({"--version"});
    EXPECT_EQ(result.out, "velkor-config " VELKOR_VERSION "\n");
    EXPECT_EQ(result.exitCode, 0);
}

TEST(Program, ShowsItsHelpOnStandardOutput) {
    const auto result = runProgram({"--help"});
    EXPECT_NE(result.out.find("Usage: velkor-config [OPTIONS] [FILE...]"), std::string::npos);
    EXPECT_EQ(result.err, "");
    EXPECT_EQ(result.exitCode, 0);
}

TEST(Program, RefusesAManualInAFormThatThereIsNot) {
    const auto result = runProgram({"--manual", "html"});
    EXPECT_EQ(result.err, "velkor-config: --manual: one of man, bash, usage is needed\n");
    EXPECT_EQ(result.exitCode, 2);
}

TEST(Program, WritesALogChannelToStandardError) {
    const auto result =
        runProgram({"--log", "velkor::configuration=debug", "-c", "set a 1", "-c", "get a"});
    EXPECT_EQ(result.out, "1\n");
    EXPECT_NE(result.err.find("debug velkor::configuration: set: a@override\n"), std::string::npos);
    EXPECT_EQ(result.err.find("property_file"), std::string::npos);
}

TEST(Program, LogsTheLoadingOfFiles) {
    const TemporaryFile file("a=1\n");
    EXPECT_EQ(
        runProgram({file.path().string(), "--log", "velkor::configuration::property_file=16"}).err,
        "trace velkor::configuration::property_file: Parsed property: a = 1\n");
}

TEST(Program, LogsNothingUnasked) {
    EXPECT_EQ(runProgram({serviceFile, "-c", "set a 1"}).err, "");
}

TEST(Program, EndsQuietlyWhenItsReaderGoesAway) {
    int pipeEnds[2];
    ASSERT_EQ(::pipe2(pipeEnds, O_CLOEXEC), 0);
    ::close(pipeEnds[0]);
    const auto result = runProgramWithOutput({serviceFile}, "list\nlist\nnope\n", pipeEnds[1]);
    ::close(pipeEnds[1]);
    EXPECT_EQ(result.err, "");
    EXPECT_EQ(result.exitCode, 0);
}

TEST(Program, ReportsThatItsOutputCantBeWritten) {
    const int full = ::open("/dev/full", O_WRONLY | O_CLOEXEC);
    ASSERT_GE(full, 0);
    const auto result = runProgramWithOutput({serviceFile}, "list\nlist\n", full);
    ::close(full);
    EXPECT_EQ(result.err,
              "velkor-config: Standard output can't be written: No space left on device\n");
    EXPECT_EQ(result.exitCode, 1);
}

TEST(Program, ReportsThatThereIsNoOutput) {
    const auto result = runProgramWithOutput({"-c", "sources"}, "", -1);
    EXPECT_EQ(result.err, "velkor-config: Standard output can't be written: Bad file descriptor\n");
    EXPECT_EQ(result.exitCode, 1);
}

struct HostileCase {
    const char* name;
    std::string input;

    friend std::ostream& operator<<(std::ostream& out, const HostileCase& it) {
        return out << it.name;
    }
};

class HostileInputTest : public ::testing::TestWithParam<HostileCase> {};

TEST_P(HostileInputTest, IsReportedAndTheSessionGoesOn) {
    const auto result = runProgram({}, GetParam().input + "\nset a 1\nget a\n");
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_EQ(result.out, "1\n");
    EXPECT_EQ(result.err.rfind("velkor-config: line 1: ", 0), 0U);
    EXPECT_EQ(result.err.find('\n'), result.err.size() - 1);
    EXPECT_LT(result.err.size(), 1000U);
}

std::string everyByteButLineFeed() {
    std::string bytes;
    for (int byte = 0; byte < 256; ++byte) {
        if (byte != '\n') bytes += static_cast<char>(byte);
    }
    return bytes;
}

INSTANTIATE_TEST_SUITE_P(Inputs, HostileInputTest,
                         ::testing::Values(HostileCase{"LongWord", std::string(1'000'000, 'x')},
                                           HostileCase{"TooLongLine", std::string(5'000'000, 'x')},
                                           HostileCase{"ManyWords", "get" +
                                                                        [] {
                                                                            std::string words;
                                                                            for (int i = 0;
                                                                                 i < 100'000; ++i)
                                                                                words += " a";
                                                                            return words;
                                                                        }()},
                                           HostileCase{"Nuls", std::string(1000, '\0')},
                                           HostileCase{"InvalidUtf8", std::string(1000, '\xff')},
                                           HostileCase{"EveryByte", everyByteButLineFeed()},
                                           HostileCase{"DeepJson", "send ConfigurationGet " +
                                                                       std::string(500'000, '[')}),
                         [](const auto& tested) { return std::string(tested.param.name); });

TEST(Program, TakesALineThatEndsInCarriageReturn) {
    EXPECT_EQ(runProgram({}, "set a 1\r\nget a\r\n").out, "1\n");
}

TEST(Program, NeedsNoInputAtAll) {
    const auto result = runProgram({}, "");
    EXPECT_EQ(result.out + result.err, "");
    EXPECT_EQ(result.exitCode, 0);
}

}  // namespace
}  // namespace velkor::host
