#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <ostream>
#include <string>
#include <vector>

#include "tests/host/ChildProcess.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::host {
namespace {

using velkor::testing::TemporaryFile;

struct ShowCase {
    const char* name;
    std::string arguments;
    std::string answer;
    std::string message{};  ///< Behind "velkor-config: "; empty if there is none.

    friend std::ostream& operator<<(std::ostream& out, const ShowCase& it) {
        return out << it.arguments;
    }
};

class Show : public ::testing::TestWithParam<ShowCase> {};

TEST_P(Show, Answers) {
    const TemporaryFile base("a.x=1\na.y=2\na=3\nb.x=\\u00e9\nb.xy=5\nstar*=6\nc.d.e=7\n",
                             "base.properties");
    const TemporaryFile site("a.y=20\nd =  two  \n", "site.properties");
    const auto result = runProgram({base.path().string(), site.path().string(), "-c",
                                    "set number 5", "-c", "show " + GetParam().arguments});
    const std::string notice = "velkor-config: " + site.path().string() + ": 1 remark, see check\n";
    EXPECT_EQ(result.out, GetParam().answer);
    EXPECT_EQ(
        result.err,
        notice + (GetParam().message.empty() ? "" : "velkor-config: " + GetParam().message + '\n'));
    EXPECT_EQ(result.exitCode, GetParam().message.empty() ? 0 : 1);
}

std::string nameOf(const ::testing::TestParamInfo<ShowCase>& info) {
    return info.param.name;
}

TEST(ShowInLatin1, AStarEndsBeforeAByteThatIsNoCharacterByItself) {
    const TemporaryFile file("a\x98z=1\nb=2\n", "latin1.properties");
    const auto result = runProgram({file.path().string(), "-c", "show *\x98z"});
    EXPECT_THAT(result.out, ::testing::HasSubstr("= '1'\n"));
    EXPECT_THAT(result.out, ::testing::Not(::testing::HasSubstr("'2'")));
    EXPECT_EQ(result.exitCode, 0);
}

INSTANTIATE_TEST_SUITE_P(
    Patterns, Show,
    ::testing::Values(
        ShowCase{
            "Everything", "",
            "a = '3'\na.x = '1'\na.y = '20'\nb.x = 'é'\nb.xy = '5'\nc.d.e = '7'\nd = ' two  '\n"
            "number = 5\nstar* = '6'\n"},
        ShowCase{"AKeyIsThatKeyOnly", "a", "a = '3'\n"},
        ShowCase{"ADotMakesAPrefix", "a.", "a.x = '1'\na.y = '20'\n"},
        ShowCase{"AGroupIsAPrefix", "c", "c.d.e = '7'\n"},
        ShowCase{"AGroupWithinAGroup", "c.d", "c.d.e = '7'\n"},
        ShowCase{"APartOfAWordIsNoPrefix", "b.", "b.x = 'é'\nb.xy = '5'\n"},
        ShowCase{"AStarIsAnything", "*.x*", "a.x = '1'\nb.x = 'é'\nb.xy = '5'\n"},
        ShowCase{"AStarIsDotsToo", "c*e", "c.d.e = '7'\n"},
        ShowCase{"AQuestionMarkIsOneCharacter", "?.x", "a.x = '1'\nb.x = 'é'\n"},
        ShowCase{"AKeyWithAStarIsThatKey", "star*", "star* = '6'\n"},
        ShowCase{"SeveralAreShownOnceAndSorted", "b.xy a.? a.x",
                 "a.x = '1'\na.y = '20'\nb.xy = '5'\n"},
        ShowCase{"SeveralKeys", "number a number", "a = '3'\nnumber = 5\n"},
        ShowCase{"AMissingKey", "nope", "", "No configuration option with key: nope"},
        ShowCase{"AMissingPrefix", "nope.", "", "No key matches: nope."},
        ShowCase{"AMissingGlob", "n?pe*", "", "No key matches: n?pe*"},
        ShowCase{"SomeMissing", "nope a ?", "a = '3'\nd = ' two  '\n",
                 "No configuration option with key: nope"},
        ShowCase{"SeveralMissing", "x z* a", "a = '3'\n",
                 "No configuration option with key: x; No key matches: z*"}),
    nameOf);

INSTANTIATE_TEST_SUITE_P(
    Forms, Show,
    ::testing::Values(
        ShowCase{"Source", "--source a.", "a.x = '1' (base)\na.y = '20' (site)\n"},
        ShowCase{"All", "a.y a.x --all",
                 "a.x = '1' (base)\na.y = '20' (site)\na.y = '2' (base, overridden)\n"},
        ShowCase{"Raw", "--raw d number", " two  \n5\n"},
        ShowCase{"Json", "--json a number",
                 "{\n\"a\":{\"type\":\"string\",\"value\":\"3\"},\n"
                 "\"number\":{\"type\":\"int\",\"value\":5}\n}\n"},
        ShowCase{
            "JsonWithSources", "--json --source a.y",
            "{\n\"a.y\":{\"source\":\"site\",\"value\":{\"type\":\"string\",\"value\":\"20\"}}\n"
            "}\n"},
        ShowCase{
            "JsonOfAllLayers", "--json --all a.y",
            "{\n\"a.y\":[{\"source\":\"site\",\"value\":{\"type\":\"string\",\"value\":\"20\"}},"
            "{\"source\":\"base\",\"value\":{\"type\":\"string\",\"value\":\"2\"}}]\n}\n"},
        ShowCase{"JsonOfNothing", "--json x", "{\n}\n", "No configuration option with key: x"},
        ShowCase{"RawAlone", "--raw --json", "", "--raw goes with no other option."},
        ShowCase{"UnknownOption", "--rwa", "",
                 "show knows no option --rwa; quote it where it is an ordinary word."},
        ShowCase{"QuotedWord", "'--raw'", "", "No configuration option with key: --raw"},
        ShowCase{"WordsBehindTwoDashes", "-- --raw", "",
                 "No configuration option with key: --raw"}),
    nameOf);

TEST(ShowValues, AreBareInEveryType) {
    const auto send = [](const std::string& type, const std::string& value) {
        return R"(send ConfigurationSet {"key":"a","value":{"type":")" + type + R"(","value":)" +
               value + "}}\n";
    };
    std::string commands;
    std::string expected;
    const auto expect = [&](const std::string& type, const std::string& value,
                            const std::string& bare) {
        commands += send(type, value) + "show --raw a\n";
        expected += bare + '\n';
    };
    expect("bool", "true", "true");
    expect("int", "-5", "-5");
    expect("uint", "4000000000", "4000000000");
    expect("double", "0.1234567891", "0.1234567891");
    expect("string", "\"it's\"", "it's");
    expect("ustring", "\"\\u20ac\"", "€");
    expect("boolArray", "[true,false]", "true, false");
    expect("intArray", "[1,2]", "1, 2");
    expect("uintArray", "[1,2]", "1, 2");
    expect("doubleArray", "[0.5,2]", "0.5, 2");
    expect("stringArray", "[\"a\",\"b, c\"]", "a, \"b, c\"");
    expect("ustringArray", "[\"a\",\"\\u20ac\"]", "a, €");
    std::string shown;
    const auto result = runProgram({}, commands);
    EXPECT_EQ(result.err, "");
    for (std::size_t at = 0; at < result.out.size();) {
        const std::size_t end = result.out.find('\n', at) + 1;
        const std::string line = result.out.substr(at, end - at);
        if (line.rfind("velkor/configuration/", 0) != 0) shown += line;
        at = end;
    }
    EXPECT_EQ(shown, expected);
}

}  // namespace
}  // namespace velkor::host
