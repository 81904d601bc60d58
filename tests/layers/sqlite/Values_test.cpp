// Every value is in the file as it was set, and can be read there.

#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <cstring>
#include <limits>
#include <ostream>
#include <string>
#include <vector>

#include "layers/sqlite/SqliteSource.hpp"
#include "tests/layers/sqlite/StateTesting.hpp"

namespace velkor::testing {
namespace {

using configuration::ConfigurationValue;

double fromBits(std::uint64_t bits) {
    double number = 0;
    std::memcpy(&number, &bits, sizeof number);
    return number;
}

/// Equal bit for bit: a number that is none equals itself, and 0 is not -0.
class SameBits : public boost::static_visitor<bool> {
public:
    template <class A, class B>
    bool operator()(const A&, const B&) const {
        return false;
    }

    template <class T>
    bool operator()(const T& a, const T& b) const {
        return a == b;
    }

    bool operator()(const double& a, const double& b) const {
        return std::memcmp(&a, &b, sizeof a) == 0;
    }

    bool operator()(const std::vector<double>& a, const std::vector<double>& b) const {
        if (a.size() != b.size()) return false;
        for (std::size_t i = 0; i < a.size(); ++i) {
            if (!(*this)(a[i], b[i])) return false;
        }
        return true;
    }
};

struct Sample {
    std::string name;
    ConfigurationValue value;
    std::string inTheFile;
};

void PrintTo(const Sample& sample, std::ostream* stream) {
    *stream << sample.name;
}

const std::string everyByte = [] {
    std::string bytes;
    for (int i = 0; i < 256; ++i) bytes += static_cast<char>(i);
    return bytes;
}();

std::vector<Sample> samples() {
    using namespace std::string_literals;
    const double infinity = std::numeric_limits<double>::infinity();
    return {
        {"True", true, "bool:true"},
        {"False", false, "bool:false"},
        {"Least", std::numeric_limits<int>::min(), "int:-2147483648"},
        {"Greatest", std::numeric_limits<int>::max(), "int:2147483647"},
        {"Unsigned", std::numeric_limits<unsigned>::max(), "uint:4294967295"},
        {"Tenth", 0.1, "double:0.1"},
        {"Zero", 0.0, "double:0"},
        {"NegativeZero", -0.0, "double:-0"},
        {"Tiny", std::numeric_limits<double>::denorm_min(), "double:5e-324"},
        {"Huge", std::numeric_limits<double>::max(), "double:1.7976931348623157e+308"},
        {"Infinity", infinity, "double:inf"},
        {"NegativeInfinity", -infinity, "double:-inf"},
        {"QuietNan", fromBits(0x7FF8000000000000), "double:nan7ff8000000000000"},
        {"NanWithPayload", fromBits(0xFFF80000DEADBEEF), "double:nanfff80000deadbeef"},
        {"EmptyText", ""s, "string:"},
        {"TextThatLooksLikeAnother", "int:1,\n"s, "string:int:1,\n"},
        {"TextWithZeros", "a\0b\0"s, "string:a\0b\0"s},
        {"TextOfAllBytes", everyByte, "string:" + everyByte},
        {"EmptyWideText", u""s, "ustring:"},
        {"WideText", u"A\0\u20AC\xD800\xFFFF"s, "ustring:A\0\0\0\xAC\x20\0\xD8\xFF\xFF"s},
        {"NoTruths", std::vector<bool>{}, "boolArray:"},
        {"Truths", std::vector<bool>{true, false}, "boolArray:true,false,"},
        {"Numbers", std::vector<int>{-1, 0, 5}, "intArray:-1,0,5,"},
        {"UnsignedNumbers", std::vector<unsigned>{0, 4294967295}, "uintArray:0,4294967295,"},
        {"Doubles", std::vector<double>{-0.0, fromBits(0x7FF0000000000001), infinity},
         "doubleArray:-0,nan7ff0000000000001,inf,"},
        {"NoTexts", std::vector<std::string>{}, "stringArray:"},
        {"EmptyTexts", std::vector<std::string>{"", ""}, "stringArray:0:,0:,"},
        {"Texts", std::vector<std::string>{"a,2:", "\0\xFF"s}, "stringArray:4:a,2:,2:\0\xFF,"s},
        {"WideTexts", std::vector<std::u16string>{u"", u"\xDC00"s}, "ustringArray:0:,2:\0\xDC,"s},
    };
}

class ValueInTheFile : public ::testing::TestWithParam<Sample> {};

TEST_P(ValueInTheFile, IsReadAsItWasSet) {
    const StateFolder folder;
    SqliteSource::open(folder.file())->set("key", GetParam().value);
    const auto read = SqliteSource::open(folder.file())->get("key");
    EXPECT_TRUE(boost::apply_visitor(SameBits(), read, GetParam().value)) << textOf(read);
}

TEST_P(ValueInTheFile, CanBeReadByPeople) {
    const StateFolder folder;
    SqliteSource::open(folder.file())->set("key", GetParam().value);
    std::string hex;
    for (const char byte : GetParam().inTheFile) {
        char digits[3];
        std::snprintf(digits, sizeof digits, "%02X", static_cast<unsigned char>(byte));
        hex += digits;
    }
    EXPECT_EQ(OtherProgram(folder.file()).run("SELECT hex(value) FROM entries"), hex + " ");
}

TEST_P(ValueInTheFile, StandsInTheJournal) {
    const StateFolder folder;
    const auto source = SqliteSource::open(folder.file());
    source->set("key", GetParam().value);
    source->unset("key");
    source->committed().get();
    const auto entries = source->history("key", 2);
    EXPECT_TRUE(boost::apply_visitor(SameBits(), *entries.at(1).after, GetParam().value));
    EXPECT_TRUE(boost::apply_visitor(SameBits(), *entries.at(0).before, GetParam().value));
}

INSTANTIATE_TEST_SUITE_P(, ValueInTheFile, ::testing::ValuesIn(samples()),
                         [](const auto& sample) { return sample.param.name; });

class KeyInTheFile : public ::testing::TestWithParam<std::string> {};

TEST_P(KeyInTheFile, IsReadAsItWasSet) {
    const StateFolder folder;
    SqliteSource::open(folder.file())->set(GetParam(), 1);
    const auto source = SqliteSource::open(folder.file());
    EXPECT_EQ(source->keys(), std::set<std::string>{GetParam()});
    EXPECT_EQ(source->history(GetParam(), 2).size(), 1U);
}

INSTANTIATE_TEST_SUITE_P(, KeyInTheFile,
                         ::testing::Values("", "a", "a.", "\xC3\xA4", "\xFF\xFE",
                                           std::string("a\0b", 3), std::string(10'000, 'k')));

class UnknownValue : public ::testing::TestWithParam<std::string> {};

TEST_P(UnknownValue, IsIgnoredAndStays) {
    const StateFolder folder;
    SqliteSource::open(folder.file())->set("known", 1);
    const std::string count = "SELECT count(*) FROM entries WHERE value = CAST('" + GetParam() +
                              "' AS BLOB) AND key = CAST('unknown' AS BLOB)";
    OtherProgram(folder.file())
        .run("INSERT INTO entries (key, value) VALUES (CAST('unknown' AS BLOB), CAST('" +
             GetParam() + "' AS BLOB))");
    {
        const auto source = SqliteSource::open(folder.file());
        EXPECT_EQ(source->keys(), std::set<std::string>{"known"});
        source->set("known", 2);
    }
    EXPECT_EQ(OtherProgram(folder.file()).run(count), "1 ");
}

INSTANTIATE_TEST_SUITE_P(, UnknownValue,
                         ::testing::Values("map:{}", "int", "", "int:", "int:1 ", "int:2147483648",
                                           "uint:-1", "bool:maybe", "double:", "double:nan",
                                           "double:nan7ff0000000000000", "double:nan7ff8",
                                           "ustring:abc", "intArray:1", "intArray:1,,",
                                           "stringArray:1:a", "stringArray:2:a,", "stringArray:a,",
                                           "stringArray:18446744073709551615:a,",
                                           "ustringArray:1:a,", "boolArray:1,"));

TEST(UnknownValueInTheJournal, IsShownAsItsBytesAndNotUndone) {
    const StateFolder folder;
    SqliteSource::open(folder.file())->set("a", 1);
    OtherProgram(folder.file())
        .run("UPDATE entries SET value = CAST('map:{}' AS BLOB) WHERE key = CAST('a' AS BLOB)");
    const auto source = SqliteSource::open(folder.file());
    source->set("a", 2);
    source->committed().get();
    const auto entry = source->history("a", 1).at(0);
    EXPECT_FALSE(entry.known);
    EXPECT_EQ(textOf(entry.before.value()), "string map:{}");
    EXPECT_THROW(source->undo(), std::runtime_error);
    EXPECT_EQ(textOf(source->get("a")), "int 2");
}

}  // namespace
}  // namespace velkor::testing
