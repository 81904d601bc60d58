#include "configuration/sources/PropertyFileLint.hpp"

#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <set>
#include <sstream>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include "tests/configuration/sources/PropertyReading.hpp"
#include "tests/configuration/sources/PropertyTexts.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::configuration {
namespace {

using namespace std::string_view_literals;
using testing::Properties;

std::vector<PropertyRemark> remarksOn(std::string_view text) {
    std::vector<PropertyRemark> remarks;
    lintProperties({text}, [&](const PropertyRemark& remark) { remarks.push_back(remark); });
    return remarks;
}

std::set<PropertyFlaw> flawsOf(std::string_view text) {
    std::set<PropertyFlaw> flaws;
    for (const auto& remark : remarksOn(text)) flaws.insert(remark.flaw);
    return flaws;
}

Properties propertiesIn(std::string_view text) {
    PropertyFileSource source(PropertyText{text});
    return testing::propertiesOf(source);
}

// Reads a line that ends at a line feed or a carriage return.
bool readLine(std::istringstream& text, std::string& line) {
    line.clear();
    char byte = 0;
    while (text.get(byte)) {
        if (byte == '\n' || byte == '\r') return true;
        line += byte;
    }
    return false;
}

// Random texts of the bytes that matter, of which every run has the same.
class RandomTexts {
public:
    std::string next() {
        std::string text(random() % 30, '\0');
        for (char& byte : text) byte = alphabet[random() % alphabet.size()];
        return text;
    }

private:
    static constexpr std::string_view alphabet =
        "kk==:: \t\n\n\r\\\\\\uuuu#![].0014189aAfFdDxX-+z\0\v\f\xC3\xA9\xA0\xEF\xBB\xBF\xFF"sv;
    std::mt19937 random{20261121};  // NOLINT(cert-msc51-cpp)
};

// What somebody expects of a file: each line that is no comment is one property, whatever stands
// around it.
TEST(PropertyFileLint, RemarksOnEveryTextThatIsNotReadLineByLine) {
    RandomTexts texts;
    int clean = 0;
    for (int round = 0; round < 100000; ++round) {
        const std::string text = texts.next() + '\n';
        if (!remarksOn(text).empty() || text.find('\\') != text.npos) continue;
        ++clean;
        Properties expected;
        std::istringstream lines(text);
        for (std::string line; readLine(lines, line);) {
            const Properties property = propertiesIn(line + '\n');
            const bool isComment = line.empty() || line[0] == '#' || line[0] == '!';
            ASSERT_EQ(property.size(), isComment ? 0U : 1U) << ::testing::PrintToString(text);
            expected.insert(property.begin(), property.end());
        }
        ASSERT_EQ(propertiesIn(text), expected) << ::testing::PrintToString(text);
    }
    EXPECT_GT(clean, 1000);
}

TEST(PropertyFileLint, KnowsASectionByWhatStandsBehindIt) {
    for (const auto* const line : {"[a]", "[a] ", "[a]# b", "[a] ! b", "[a] ; b", "[a]\t;"}) {
        EXPECT_EQ(flawsOf(line).count(PropertyFlaw::section), 1U) << line;
    }
    for (const auto* const line : {"[a", "[a];b", "[a]b", "[a] b", "a]"}) {
        EXPECT_EQ(flawsOf(line).count(PropertyFlaw::section), 0U) << line;
    }
}

TEST(PropertyFileLint, SaysWhenTheEndOfATextIsLeftOut) {
    RandomTexts texts;
    for (int round = 0; round < 20000; ++round) {
        const std::string text = texts.next();
        const auto flaws = flawsOf(text);
        const bool saysSo = flaws.count(PropertyFlaw::backslashAtEnd) != 0 ||
                            flaws.count(PropertyFlaw::droppedLine) != 0 ||
                            flaws.count(PropertyFlaw::section) != 0 ||
                            flaws.count(PropertyFlaw::shortEscape) != 0;
        // What comes behind such a text is read as the beginning of a line only if it was complete.
        const std::string more = text + "\nanother=1\n";
        const bool isComplete = propertiesIn(more).count("another") != 0;
        ASSERT_TRUE(isComplete || saysSo || text.empty()) << ::testing::PrintToString(text);
    }
}

TEST(PropertyFileLint, SaysWhyTheEndOfATextIsLeftOut) {
    for (const auto* const text : {"k", "key"}) {
        EXPECT_EQ(flawsOf(text), std::set{PropertyFlaw::droppedLine}) << text;
    }
    for (const auto* const text : {"key\\", "k=a\\", "k=a\\\n"}) {
        EXPECT_EQ(flawsOf(text), std::set{PropertyFlaw::backslashAtEnd}) << text;
    }
}

TEST(PropertyFileLint, SaysLineAndColumn) {
    struct Row {
        std::string_view text;
        PropertyFlaw flaw;
        std::size_t line;
        std::size_t column;
    };
    const std::vector<Row> rows{
        {"a=b\n\xFF=c\n", PropertyFlaw::notUtf8, 2, 1},
        {"a=\xC3\xA9\xFF\n", PropertyFlaw::notUtf8, 1, 4},  // two bytes are one character
        {"a=b\r\n[s]\r\n", PropertyFlaw::section, 2, 1},
        {"a=b\n\rc=d \n", PropertyFlaw::trailingBlanks, 3, 4},
        {"a=b\\ud83d\n", PropertyFlaw::surrogate, 1, 4},
        {"a=b\\u12\n", PropertyFlaw::shortEscape, 1, 4},
    };
    for (const auto& row : rows) {
        const auto remarks = remarksOn(row.text);
        EXPECT_EQ(std::count_if(remarks.begin(), remarks.end(),
                                [&](const PropertyRemark& remark) {
                                    return remark.flaw == row.flaw && remark.line == row.line &&
                                           remark.column == row.column;
                                }),
                  1)
            << ::testing::PrintToString(row.text);
    }
}

TEST(PropertyFileLint, HasNothingAgainstEscapes) {
    for (const auto* const text : {"a=\\u00e9\n", "a=\\uFFFF\n", "a=\\ud7ff\n", "a=\\t\\\\\n"}) {
        EXPECT_EQ(flawsOf(text), std::set<PropertyFlaw>()) << text;
    }
}

::testing::AssertionResult arePlacedIn(std::string_view text,
                                       const std::vector<PropertyRemark>& remarks) {
    std::size_t line = 1;
    std::size_t column = 0;
    for (const auto& remark : remarks) {
        const bool isBehindTheLastOne =
            remark.line > line || (remark.line == line && remark.column >= column);
        line = remark.line;
        column = remark.column;
        if (isBehindTheLastOne && column <= text.size() + 1 && remark.firstLine < line) continue;
        return ::testing::AssertionFailure() << "for " << ::testing::PrintToString(text);
    }
    return ::testing::AssertionSuccess();
}

TEST(PropertyFileLint, PlacesEveryRemarkInTheTextAndInOrder) {
    RandomTexts texts;
    for (int round = 0; round < 20000; ++round) {
        const std::string text = texts.next();
        ASSERT_TRUE(arePlacedIn(text, remarksOn(text)));
    }
}

TEST(PropertyFileLint, EndsOnEveryTextThatTheParserIsTriedOn) {
    for (const auto& texts :
         {testing::everyShortText(), testing::randomTexts(), testing::randomEscapes()}) {
        for (const auto& text : texts) ASSERT_TRUE(arePlacedIn(text, remarksOn(text)));
    }
}

TEST(PropertyFileLint, KnowsEveryKeyThatStandsTwice) {
    RandomTexts texts;
    for (int round = 0; round < 2000; ++round) {
        const std::string half = texts.next() + "\nx=1\n";
        if (propertiesIn(half).count("x") == 0) continue;
        EXPECT_EQ(flawsOf(half + half).count(PropertyFlaw::sameKey), 1U)
            << ::testing::PrintToString(half);
    }
}

TEST(PropertyFileLint, TakesTimeInProportionToTheSizeOfHostileTexts) {
    const auto check = [](std::string_view piece, std::size_t size) {
        std::string text;
        text.reserve(size);
        while (text.size() < size) text += piece;
        EXPECT_LE(remarksOn(text).size(), size) << ::testing::PrintToString(std::string(piece));
    };
    check("=\n", 10'000'000);  // the most remarks
    for (const std::string_view piece : {"=\n"sv, "[\n"sv, "[]\n"sv, " \n"sv, "\\u"sv, "\xFF\n"sv,
                                         "a= \n"sv, "\\\n"sv, "]"sv, "a"sv, "\r"sv, "k\\\n"sv}) {
        check(piece, 1'000'000);
    }
}

TEST(PropertyFileLint, PassesOnWhatTheCallerThrows) {
    const auto refuse = [](const PropertyRemark&) { throw std::runtime_error("enough"); };
    EXPECT_EQ(testing::thrownText<std::runtime_error>([&] { lintProperties({"a=1 "}, refuse); }),
              "enough");
}

}  // namespace
}  // namespace velkor::configuration
