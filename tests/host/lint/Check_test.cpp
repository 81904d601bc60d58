#include <gtest/gtest.h>

#include <ostream>
#include <string>
#include <string_view>
#include <vector>

#include "tests/host/ChildProcess.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::host {
namespace {

using namespace std::string_literals;
using velkor::testing::TemporaryFile;

const std::string mark = "The byte order mark becomes a part of the first key.";
const std::string foreign = "The line holds bytes that are not UTF-8.";
const std::string noSeparator = "The line has no separator: its key goes on in the next line.";
const std::string dropped = "The last line has no value and no end: it is left out.";
const std::string droppedValue = "The last line has no key and no end: it is left out.";
const std::string section = "There are no sections: this begins a key.";
const std::string indented = "The line begins with a blank: it is a value of the empty key.";
const std::string shortEscape =
    "No four hexadecimal digits follow \\u: four bytes are taken for them.";
const std::string surrogate = "Half a character (a surrogate): write the whole character instead.";
const std::string blanks = "The blanks at the end are a part of the value.";
const std::string backslash = "Nothing follows the last backslash: the line is left out.";

std::string sameAsIn(int line) {
    return "The key is in line " + std::to_string(line) + " already: the last one counts.";
}

struct CheckCase {
    const char* name;
    std::string content;
    std::vector<std::string> remarks;  ///< "LINE:COLUMN: TEXT"

    friend std::ostream& operator<<(std::ostream& out, const CheckCase& it) {
        return out << it.name;
    }
};

class CheckedFile : public ::testing::TestWithParam<CheckCase> {};

TEST_P(CheckedFile, HasTheseRemarks) {
    const TemporaryFile file(GetParam().content);
    std::string expected;
    for (const auto& remark : GetParam().remarks) {
        expected += file.path().string() + ':' + remark + '\n';
    }
    const auto result = runProgram({"--check", file.path().string()});
    EXPECT_EQ(result.out, expected);
    EXPECT_EQ(result.err, "");
    EXPECT_EQ(result.exitCode, GetParam().remarks.empty() ? 0 : 1);
}

std::string nameOf(const ::testing::TestParamInfo<CheckCase>& info) {
    return info.param.name;
}

INSTANTIATE_TEST_SUITE_P(
    Clean, CheckedFile,
    ::testing::Values(
        CheckCase{"Empty", "", {}},
        CheckCase{"Properties", "# a comment\n! another\n\na = 1\nb: 2\nc 3\nd=\n", {}},
        CheckCase{"LineEndsOfAllKinds", "a=1\r\nb=2\rc=3\n\n\r\n", {}},
        CheckCase{"NoEndOfTheLastLine", "a=1\nb=2", {}},
        CheckCase{"Continuation", "a = one \\\n    two\nb = 3\n", {}},
        CheckCase{"Escapes", "a\\ b\\=c = \\u20AC\\\\ \\#\\ \n\\#d = x\\\\\n", {}},
        CheckCase{"BytesOfSeveralInACharacter",
                  "gr\xC3\xBC\xC3\x9F = \xE2\x82\xAC \xF0\x9F\x98\x80\n",
                  {}},
        CheckCase{
            "BracketsInKeysAndValues", "a[0] = [x]\n[a] = 1\n[b]=[c]\n[d];e = 1\n[f] g\n", {}},
        CheckCase{"SectionsInExportedKeysAndValues",
                  "[a]\\ \\#\\ x = 1\n[b] = # x\n[c]\\ ;x = 1\na\\u000ab = 1\n",
                  {}},
        CheckCase{"BlanksBeforeTheEnd", "a = \nb =\nc \n  ", {}},
        CheckCase{"ABackslashInTheLastComment", "a=1\n# \\", {}}),
    nameOf);

INSTANTIATE_TEST_SUITE_P(
    NoSeparator, CheckedFile,
    ::testing::Values(
        CheckCase{"SwallowsTheNextLine", "a=1\nlonely\nb=2\n", {"2:7: " + noSeparator}},
        CheckCase{"SwallowsPastAnEmptyLine", "lonely\r\n\r\nb=2\r\n", {"1:7: " + noSeparator}},
        CheckCase{"TwoInARow", "one\ntwo\nb=2\n", {"1:4: " + noSeparator, "2:4: " + noSeparator}},
        CheckCase{"IsTheLastLine", "a=1\nlonely\n", {"2:7: " + dropped}},
        CheckCase{"IsTheLastLineWithoutEnd", "a=1\nlonely", {"2:7: " + dropped}},
        CheckCase{"HasNothingButASeparator", "a=1\nb=", {"2:3: " + dropped}},
        CheckCase{"EndsInABackslash", "a\\\nb=1\n", {"1:3: " + noSeparator}},
        CheckCase{"EndsInABackslashAndTwoBytes", "a\\\r\nb=1\r\n", {"1:3: " + noSeparator}},
        CheckCase{"EndsInABackslashAsTheLastLine", "a\\\n", {"1:3: " + dropped}},
        CheckCase{"IsASectionBehindABackslash",
                  "a\\\n[b]\nc=1\n",
                  {"1:3: " + noSeparator, "2:1: " + section}}),
    nameOf);

INSTANTIATE_TEST_SUITE_P(
    NoKey, CheckedFile,
    ::testing::Values(CheckCase{"IsTheLastLineWithoutEnd", "a=1\n=v", {"2:3: " + droppedValue}},
                      CheckCase{"IsTheLastIndentedLineWithoutEnd",
                                "a=1\n b",
                                {"2:1: " + indented, "2:3: " + droppedValue}},
                      CheckCase{"IsComplete", "a=1\n=v\n", {}}),
    nameOf);

INSTANTIATE_TEST_SUITE_P(
    Sections, CheckedFile,
    ::testing::Values(
        CheckCase{"ALine", "[server]\nport = 1\n", {"1:1: " + section}},
        CheckCase{
            "WithABlank", "a=1\n[my server] \nport = 1\n", {"2:1: " + section, "2:12: " + blanks}},
        CheckCase{"WithAComment",
                  "[a] # x\n[b]# x\n[c] ! x\n[d] ; x\n",
                  {"1:1: " + section, "2:1: " + section, "3:1: " + section, "4:1: " + section}},
        CheckCase{
            "BehindAByteOrderMark", "\xEF\xBB\xBF[a]\nb=1\n", {"1:1: " + mark, "1:2: " + section}},
        CheckCase{"InARow", "[a]\n[b]\nc=1\n", {"1:1: " + section, "2:1: " + section}},
        CheckCase{"BehindALineWithoutSeparator",
                  "x\n[a]\nc=1\n",
                  {"1:2: " + noSeparator, "2:1: " + section}}),
    nameOf);

INSTANTIATE_TEST_SUITE_P(
    Bytes, CheckedFile,
    ::testing::Values(
        CheckCase{"ByteOrderMark",
                  "\xEF\xBB\xBF"
                  "a = 1\n",
                  {"1:1: " + mark}},
        CheckCase{"NotUtf8", "a = 1\nb = caf\xE9 \xFF!\n", {"2:8: " + foreign}},
        CheckCase{"NotUtf8InAComment", "# caf\xE9\na=1\n", {"1:6: " + foreign}},
        CheckCase{"ColumnsAreCharacters", "\xC3\xA9\xC3\xA9 = \\u1\n", {"1:6: " + shortEscape}}),
    nameOf);

INSTANTIATE_TEST_SUITE_P(
    Escapes, CheckedFile,
    ::testing::Values(CheckCase{"ThreeDigits", "a = \\u20Az\n", {"1:5: " + shortEscape}},
                      CheckCase{"NoDigitsAtTheEnd", "a = \\u", {"1:5: " + shortEscape}},
                      CheckCase{"DigitsAcrossLines", "a = \\u12\nb = 2\n", {"1:5: " + shortEscape}},
                      CheckCase{"SignsAreNoDigits", "a = \\u+12f\n", {"1:5: " + shortEscape}},
                      CheckCase{"InAKey", "a\\u12g4 = 1\n", {"1:2: " + shortEscape}},
                      CheckCase{"SurrogateHalves",
                                "a = \\uD83D\\uDE00\n",
                                {"1:5: " + surrogate, "1:11: " + surrogate}},
                      CheckCase{"BeforeAndBehindSurrogates", "a = \\uD7FF\\uE000\n", {}}),
    nameOf);

INSTANTIATE_TEST_SUITE_P(
    Blanks, CheckedFile,
    ::testing::Values(
        CheckCase{"AnIndentedLine", "a = 1\n  b = 2\n", {"2:1: " + indented}},
        CheckCase{"ALineOfBlanks", "a = 1\n \t\nb = 2\n", {"2:1: " + indented}},
        CheckCase{"TwoIndentedLines", "\ta=1\n\tb=2\n", {"1:1: " + indented, "2:1: " + indented}},
        CheckCase{"AtTheEndOfAValue", "a = one two \t\nb=\n", {"1:12: " + blanks}},
        CheckCase{"AtTheEndOfTheFile", "a = 1 ", {"1:6: " + blanks}},
        CheckCase{"NothingButBlanks", "a =   \n", {"1:5: " + blanks}}),
    nameOf);

INSTANTIATE_TEST_SUITE_P(
    Endings, CheckedFile,
    ::testing::Values(CheckCase{"ABackslash", "a=1\nb=2\\", {"2:4: " + backslash}},
                      CheckCase{"ABackslashAndALineBreak", "b=2\\\n", {"1:4: " + backslash}},
                      CheckCase{"ABackslashAndEmptyLines", "b=2\\\n  \n\n", {"1:4: " + backslash}},
                      CheckCase{"ABackslashInTheKey", "lonely\\", {"1:7: " + backslash}}),
    nameOf);

INSTANTIATE_TEST_SUITE_P(
    SameKeys, CheckedFile,
    ::testing::Values(
        CheckCase{"Twice", "a = 1\nb = 2\na = 3\n", {"3:1: " + sameAsIn(1)}},
        CheckCase{
            "ThreeTimes", "#\na=1\na=2\na=3\n", {"3:1: " + sameAsIn(2), "4:1: " + sameAsIn(2)}},
        CheckCase{"WrittenOtherwise", "a b=1\na\\u002e\\ b=1\na.\\ b=1\n", {"3:1: " + sameAsIn(2)}},
        CheckCase{"TwoKeysTwice",
                  "a=1\nb=1\nb=2\na=2\n",
                  {"3:1: " + sameAsIn(2), "4:1: " + sameAsIn(1)}}),
    nameOf);

TEST(Check, NamesFilesThatCantBeReadAndGoesOn) {
    const TemporaryFile file("a = 1 \n");
    const auto result = runProgram({"--check", "/no/file", file.path().string()});
    EXPECT_EQ(result.out, file.path().string() + ":1:6: " + blanks + '\n');
    EXPECT_EQ(result.err,
              "velkor-config: Property file could not be opened: /no/file: No such file or "
              "directory\n");
    EXPECT_EQ(result.exitCode, 3);
}

TEST(Check, ReadsFilesThatHaveNames) {
    const TemporaryFile file("a = 1 \n");
    const auto result = runProgram({"--check", "--source", "a=" + file.path().string()});
    EXPECT_EQ(result.out, file.path().string() + ":1:6: " + blanks + '\n');
    EXPECT_EQ(result.exitCode, 1);
}

TEST(Check, NeedsAFile) {
    const auto result = runProgram({"--check"});
    EXPECT_EQ(result.err, "velkor-config: --check: a FILE is needed\n");
    EXPECT_EQ(result.exitCode, 2);
}

TEST(Check, IsACommandAsWellThatFailsWhenItHasFoundSomething) {
    const TemporaryFile bad("a = 1 \nb=2 \n");
    const TemporaryFile good("a = 1\n");
    EXPECT_EQ(runProgram({"-c", "check " + good.path().string()}).exitCode, 0);
    const auto result = runProgram(
        {"-c", "check " + bad.path().string() + ' ' + good.path().string() + " /no/file"});
    EXPECT_EQ(result.out, bad.path().string() + ":1:6: " + blanks + '\n' + bad.path().string() +
                              ":2:4: " + blanks + '\n');
    EXPECT_EQ(result.err,
              "velkor-config: Property file could not be opened: /no/file: No such file or "
              "directory\n"
              "velkor-config: 2 remarks, 1 file not read\n");
    EXPECT_EQ(result.exitCode, 1);
}

TEST(Check, IsMentionedWhereAFileIsLoaded) {
    const TemporaryFile one("a = 1 \n");
    const TemporaryFile two("a = 1 \n\xFF = 1\n");
    for (const char* const watching : {"--watch-files", "--no-watch-files"}) {
        const auto result =
            runProgram({watching, one.path().string(), two.path().string(), "-c", "get a"});
        EXPECT_EQ(result.out, "'1 '\n");
        EXPECT_EQ(result.err, "velkor-config: " + one.path().string() +
                                  ": 1 remark, see check\n"
                                  "velkor-config: " +
                                  two.path().string() + ": 2 remarks, see check\n");
        EXPECT_EQ(result.exitCode, 0);
    }
}

TEST(Check, IsMentionedWhereACommandLoadsAFile) {
    const TemporaryFile file("a = 1 \n");
    const auto result = runProgram({"-c", "load " + file.path().string()});
    EXPECT_EQ(result.out, "Loaded as file.\n");
    EXPECT_EQ(result.err, "velkor-config: " + file.path().string() + ": 1 remark, see check\n");
    EXPECT_EQ(result.exitCode, 0);
}

TEST(Check, EndsQuietlyWhereNobodyReadsIt) {
    const TemporaryFile file("a = 1 \n");
    const auto result = runProgramWithOutput({"--check", file.path().string()}, "", -1);
    EXPECT_EQ(result.exitCode, 1);
}

}  // namespace
}  // namespace velkor::host
