#include "host/console/Colours.hpp"

#include <gtest/gtest.h>

#include <ostream>
#include <string>

namespace velkor::host {
namespace {

// The colours as letters, so that a failure can be read.
std::string spelled(std::string text) {
    struct Spelling {
        const char* code;
        const char* name;
    };
    for (const Spelling& colour :
         {Spelling{"\x1b[34m", "<source "}, Spelling{"\x1b[32m", "<text "},
          Spelling{"\x1b[36m", "<number "}, Spelling{"\x1b[33m", "<truth "},
          Spelling{"\x1b[35m", "<array "}, Spelling{"\x1b[0m", ">"}}) {
        const std::string code = colour.code;
        for (auto at = text.find(code); at != std::string::npos; at = text.find(code)) {
            text.replace(at, code.size(), colour.name);
        }
    }
    return text;
}

struct PaintCase {
    const char* name;
    const char* command;
    std::string line;
    std::string painted;

    friend std::ostream& operator<<(std::ostream& out, const PaintCase& it) {
        return out << it.line;
    }
};

class PaintTest : public ::testing::TestWithParam<PaintCase> {};

TEST_P(PaintTest, LooksLikeThis) {
    EXPECT_EQ(spelled(paintOf(GetParam().command)(GetParam().line)), GetParam().painted);
}

constexpr const char* get = "velkor.configuration.get";
constexpr const char* list = "velkor.configuration.list";

INSTANTIATE_TEST_SUITE_P(
    Lines, PaintTest,
    ::testing::Values(
        PaintCase{"Text", get, "'5'", "<text '5'>"}, PaintCase{"Number", get, "-5", "<number -5>"},
        PaintCase{"Exponent", get, "1e+06", "<number 1e+06>"},
        PaintCase{"Infinity", get, "-inf", "<number -inf>"},
        PaintCase{"Truth", get, "true", "<truth true>"},
        PaintCase{"Array", get, "[1, 2]", "<array [1, 2]>"}, PaintCase{"Secret", get, "•••", "•••"},
        PaintCase{"MissingKey", get, "No configuration option with key: 5",
                  "No configuration option with key: 5"},
        PaintCase{"Nothing", get, "", ""}, PaintCase{"Option", list, "a = 1", "a = <number 1>"},
        PaintCase{"TextWithBrackets", list, "a = 'b (c)'", "a = <text 'b (c)'>"},
        PaintCase{"LineOfAText", list, "x)", "x)"},
        PaintCase{"BracketOnly", list, "a = )", "a = )"},
        PaintCase{"OptionWithSource", "unset", "a = 1 (site)", "a = <number 1> (<source site>)"},
        PaintCase{"ShownOption", "show", "a = 1 (site)", "a = <number 1> (<source site>)"},
        PaintCase{"Change", "diff", "+ a = 1", "+ a = <number 1>"},
        PaintCase{"Source", "sources", "site  -  5  read-only", "<source site>  -  5  read-only"},
        PaintCase{"Header", "sources", "NAME  GROUP", "NAME  GROUP"},
        PaintCase{"Explanation", "explain", "overridden  my site  'x  y'",
                  "overridden  <source my site>  <text 'x  y'>"},
        PaintCase{"NoExplanation", "explain", "No such key", "No such key"}),
    [](const auto& tested) { return std::string(tested.param.name); });

TEST(Colours, AreOfSomeCommandsOnly) {
    EXPECT_EQ(paintOf("history"), nullptr);
}

}  // namespace
}  // namespace velkor::host
