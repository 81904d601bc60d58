#include "host/Options.hpp"

#include <gtest/gtest.h>

#include <optional>
#include <ostream>
#include <string>
#include <vector>

#include "tests/support/Thrown.hpp"

namespace velkor::host {
namespace {

using velkor::testing::thrownText;
using Words = std::vector<std::string>;

std::string usageError(const Words& arguments) {
    return thrownText<UsageError>([&] { parseOptions(arguments); });
}

Words pathsOf(const Options& options) {
    Words paths;
    for (const auto& source : options.sources) paths.push_back(source.location);
    return paths;
}

TEST(Options, OfNothingAreEmpty) {
    const Options options = parseOptions({});
    EXPECT_TRUE(options.sources.empty());
    EXPECT_TRUE(options.lines.empty());
    EXPECT_TRUE(options.logs.empty());
    EXPECT_EQ(options.information, "");
}

TEST(Options, AFileIsAReadOnlySourceBehindOverride) {
    const auto source = parseOptions({"a/b.properties"}).sources.at(0);
    EXPECT_EQ(source.name, std::nullopt);
    EXPECT_EQ(source.location, "a/b.properties");
    EXPECT_EQ(source.group, "");
    EXPECT_EQ(source.order, 1000);
    EXPECT_FALSE(source.writable);
}

TEST(Options, ASourceSaysItInFull) {
    const auto source = parseOptions({"--source", "n=p.x,group=g,order=-5,writable"}).sources.at(0);
    EXPECT_EQ(source.name, "n");
    EXPECT_EQ(source.location, "p.x");
    EXPECT_EQ(source.group, "g");
    EXPECT_EQ(source.order, -5);
    EXPECT_TRUE(source.writable);
}

TEST(Options, ASourceNeedsNoSettings) {
    const auto source = parseOptions({"--source=n=p"}).sources.at(0);
    EXPECT_EQ(source.group, "");
    EXPECT_EQ(source.order, 1000);
    EXPECT_FALSE(source.writable);
}

TEST(Options, APathMayHoldAnEqualsSign) {
    EXPECT_EQ(parseSource("n=a=b").location, "a=b");
}

TEST(Options, FilesAndSourcesKeepTheirCommonOrder) {
    EXPECT_EQ(pathsOf(parseOptions({"a", "--source", "n=b", "c", "-c", "list", "--source=m=d"})),
              (Words{"a", "b", "c", "d"}));
}

TEST(Options, AfterTwoDashesEverythingIsACommand) {
    const Options options = parseOptions({"a", "--", "get", "--log", "[b]", "--", ""});
    EXPECT_EQ(pathsOf(options), Words{"a"});
    EXPECT_EQ(options.command, (Words{"get", "--log", "[b]", "--", ""}));
}

TEST(Options, BracketsAreTakenAsTheyAre) {
    const Options options = parseOptions({"[a,b]", "-c", "[c,d]", "--source", "n=[e]", "[]"});
    EXPECT_EQ(pathsOf(options), (Words{"[a,b]", "[e]", "[]"}));
    EXPECT_EQ(options.lines, Words{"[c,d]"});
}

TEST(Options, LinesAreKeptInOrderAndAsTheyAre) {
    EXPECT_EQ(parseOptions({"-c", "set a 'b, c'", "-c", "-x", "-c", "", "-clist"}).lines,
              (Words{"set a 'b, c'", "-x", "", "list"}));
}

TEST(Options, FilesMayHave256MiBUnlessTheCommandLineSaysOtherwise) {
    EXPECT_EQ(parseOptions({}).limits.fileBytes, 268'435'456U);
    EXPECT_EQ(parseOptions({"--max-file-size", "1KiB", "a"}).limits.fileBytes, 1024U);
    EXPECT_EQ(parseOptions({"--max-file-size=1", "--max-file-size=2"}).limits.fileBytes, 2U);
}

TEST(Options, AFileSizeMayHaveAUnit) {
    EXPECT_EQ(parseFileSize("0"), 0U);
    EXPECT_EQ(parseFileSize("12345"), 12'345U);
    EXPECT_EQ(parseFileSize("3KiB"), 3'072U);
    EXPECT_EQ(parseFileSize("64MiB"), 67'108'864U);
    EXPECT_EQ(parseFileSize("1GiB"), 1'073'741'824U);
    EXPECT_EQ(parseFileSize("18446744073709551615"), 18'446'744'073'709'551'615U);
    EXPECT_EQ(parseFileSize("17179869183GiB"), 18'446'744'072'635'809'792U);
}

TEST(Options, TheEnvironmentIsASourceInFrontOfTheFiles) {
    const Options options = parseOptions({"--env", "APP_", "a"});
    EXPECT_EQ(pathsOf(options), (Words{"a", "APP_"}));
    EXPECT_EQ(options.sources[1].kind, "environment");
    EXPECT_LT(options.sources[1].order, options.sources[0].order);
    EXPECT_FALSE(options.sources[1].writable);
}

TEST(Options, AnAssignmentIsAKeyAndWhatFollowsTheFirstEqualsSign) {
    const auto assignments =
        parseOptions({"--set", "a.b=c=d", "--set=[a]=[b,c]", "--set", "e="}).assignments;
    ASSERT_EQ(assignments.size(), 3U);
    EXPECT_EQ(assignments[0].key, "a.b");
    EXPECT_EQ(assignments[0].text, "c=d");
    EXPECT_EQ(assignments[1].key, "[a]");
    EXPECT_EQ(assignments[1].text, "[b,c]");
    EXPECT_EQ(assignments[2].text, "");
}

TEST(Options, TheLastPlaceForTheStateCounts) {
    EXPECT_EQ(parseOptions({"a"}).statePath, std::nullopt);
    EXPECT_EQ(parseOptions({"--state", "a.db"}).statePath, "a.db");
    EXPECT_EQ(parseOptions({"--state=a.db", "--state=b.db"}).statePath, "b.db");
}

TEST(Options, TheLastWordOnWatchedFilesCounts) {
    EXPECT_EQ(parseOptions({"a"}).watchesFiles, std::nullopt);
    EXPECT_EQ(parseOptions({"--watch-files"}).watchesFiles, true);
    EXPECT_EQ(parseOptions({"--no-watch-files"}).watchesFiles, false);
    EXPECT_EQ(parseOptions({"--no-watch-files", "--watch-files"}).watchesFiles, true);
    EXPECT_EQ(parseOptions({"--watch-files", "--no-watch-files"}).watchesFiles, false);
}

TEST(Options, HistoryIsKeptUnlessTheCommandLineSaysOtherwise) {
    EXPECT_TRUE(parseOptions({}).keepsHistory);
    EXPECT_FALSE(parseOptions({"--no-history"}).keepsHistory);
}

TEST(Options, LogNamesAChannelAndItsSeverities) {
    const auto logs =
        parseOptions({"--log", "velkor::configuration=debug,trace", "--log=b=24"}).logs;
    ASSERT_EQ(logs.size(), 2U);
    EXPECT_EQ(logs[0].channel, "velkor::configuration");
    EXPECT_EQ(logs[0].severities, 24U);
    EXPECT_EQ(logs[1].channel, "b");
    EXPECT_EQ(logs[1].severities, 24U);
}

TEST(Options, HelpDescribesEveryOption) {
    const std::string help = parseOptions({"--help"}).information;
    for (const char* part :
         {"FILE", "--source NAME=PATH[,group=G][,order=N][,writable]", "--max-file-size SIZE",
          "--etcd URL[,URL...][,prefix=P][,SETTING...]", "--env PREFIX", "--set KEY=VALUE",
          "--state FILE", "--watch-files", "--no-watch-files", "--check", "-c LINE", "--no-history",
          "--log CHANNEL=SEVERITIES", "--help", "--version", "Exit status"}) {
        EXPECT_NE(help.find(part), std::string::npos) << part;
    }
}

TEST(Options, OfTheProgramAreThoseThatHelpDescribes) {
    const std::string help = parseOptions({"--help"}).information;
    for (const auto& option : programUsage().options) {
        EXPECT_NE(help.find(option.help), std::string::npos) << option.help;
        for (const auto& name : option.names) EXPECT_NE(help.find(name), std::string::npos) << name;
    }
    EXPECT_EQ(programUsage().options.front().names, (Words{"-h", "--help"}));
}

TEST(Options, VersionNamesTheProgram) {
    EXPECT_EQ(parseOptions({"--version"}).information.rfind("velkor-config ", 0), 0U);
}

struct UsageCase {
    const char* name;
    Words arguments;
    std::string message;

    friend std::ostream& operator<<(std::ostream& out, const UsageCase& it) {
        return out << it.name;
    }
};

UsageCase badSize(const char* name, const std::string& size) {
    return {name,
            {"--max-file-size=" + size},
            "--max-file-size " + size + ": a number of bytes is needed, such as 1048576 or 64MiB"};
}

class BadOptionsTest : public ::testing::TestWithParam<UsageCase> {};

TEST_P(BadOptionsTest, AreRefusedWithAClearText) {
    EXPECT_EQ(usageError(GetParam().arguments), GetParam().message);
}

INSTANTIATE_TEST_SUITE_P(
    CommandLines, BadOptionsTest,
    ::testing::Values(
        UsageCase{"UnknownOption",
                  {"--foo"},
                  "The following argument was not expected: --foo (see --help)"},
        UsageCase{"LineMissing", {"-c"}, "-c: 1 required LINE missing (see --help)"},
        UsageCase{"NoCommand", {"a", "--"}, "-- needs a COMMAND (see --help)"},
        UsageCase{"LineAndCommand",
                  {"-c", "list", "--", "list"},
                  "-c LINE and -- COMMAND can't both be carried out (see --help)"},
        UsageCase{"CheckAndLine",
                  {"--check", "a", "-c", "list"},
                  "--check goes without -c LINE, -- COMMAND and --listen (see --help)"},
        UsageCase{"CheckAndCommand",
                  {"--check", "a", "--", "list"},
                  "--check goes without -c LINE, -- COMMAND and --listen (see --help)"},
        UsageCase{"CheckAndServing",
                  {"--check", "a", "--listen", "0"},
                  "--check goes without -c LINE, -- COMMAND and --listen (see --help)"},
        UsageCase{"CheckOfNothing", {"--check"}, "--check: a FILE is needed"},
        UsageCase{"TwoDashesAreNoValue",
                  {"-c", "--", "list"},
                  "-c: 1 required LINE missing (see --help)"},
        UsageCase{"NoPath", {"--source", "n"}, "--source n: NAME=PATH is needed"},
        UsageCase{"EmptyPath", {"--source", "n="}, "--source n=: NAME=PATH is needed"},
        UsageCase{"EmptyName", {"--source", "=p"}, "--source =p: NAME=PATH is needed"},
        UsageCase{"NothingAtAll", {"--source", ""}, "--source : NAME=PATH is needed"},
        UsageCase{"NoKey", {"--set", "=v"}, "--set =v: KEY=VALUE is needed"},
        UsageCase{"NoValue", {"--set", "k"}, "--set k: KEY=VALUE is needed"},
        badSize("SizeNegative", "-1"), badSize("SizeBlank", " 1"),
        badSize("SizeWithoutNumber", "KiB"), badSize("SizeWithUnknownUnit", "1KB"),
        badSize("SizeWithTextBehind", "1KiBs"), badSize("SizeFractional", "0.5GiB"),
        badSize("SizeOverflowing", "18446744073709551616"),
        badSize("SizeOverflowingByItsUnit", "17179869184GiB"),
        UsageCase{"UnknownSetting",
                  {"--source", "n=p,ordre=5"},
                  "--source n=p,ordre=5: unknown setting: ordre=5"},
        UsageCase{"OrderIsNoNumber",
                  {"--source", "n=p,order=5x"},
                  "--source n=p,order=5x: the order is no number of 32 bits: 5x"},
        UsageCase{"OrderIsTooGreat",
                  {"--source", "n=p,order=2147483648"},
                  "--source n=p,order=2147483648: the order is no number of 32 bits: 2147483648"},
        UsageCase{
            "NoSeverities", {"--log", "channel"}, "--log channel: CHANNEL=SEVERITIES is needed"},
        UsageCase{"NoChannel", {"--log", "=8"}, "--log =8: CHANNEL=SEVERITIES is needed"},
        UsageCase{"UnknownSeverity", {"--log", "c=loud"}, "--log c=loud: Unknown severity: loud"}),
    [](const auto& tested) { return std::string(tested.param.name); });

}  // namespace
}  // namespace velkor::host
