#include "http/detail/routes/Target.hpp"

#include <gtest/gtest.h>

#include <string>
#include <utility>

#include "http/detail/routes/Problem.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::http::detail {
namespace {

using velkor::testing::thrownText;

TEST(Target, DecodesBytes) {
    EXPECT_EQ(percentDecoded("a%41%2f%2F+%20%ff%00b"), std::string("aA//+ \xFF\0b", 9));
    EXPECT_EQ(percentDecoded(""), "");
}

TEST(Target, DecodesNothingThatIsNotEncodedRight) {
    for (const char* const text : {"%", "%4", "a%", "%4g", "%g4", "%%41", "% 41", "%-1", "%+1"}) {
        EXPECT_EQ(percentDecoded(text), std::nullopt) << text;
    }
}

TEST(Target, DecodesOnce) {
    EXPECT_EQ(percentDecoded("%2541"), "%41");
}

TEST(Target, EncodesWhatItDecodes) {
    std::string bytes;
    for (int byte = 0; byte < 256; ++byte) bytes += static_cast<char>(byte);
    EXPECT_EQ(percentDecoded(percentEncoded(bytes)), bytes);
    EXPECT_EQ(percentEncoded("aZ09-._~ /\xFF"), "aZ09-._~%20%2F%FF");
}

TEST(Target, ReadsQueries) {
    const Parameters expected{{"a", "1"}, {"b", ""}, {"c=", "=d"}, {"", "e"}, {"f", "+&"}};
    EXPECT_EQ(parsedQuery("a=1&b&&c%3D==d&=e&f=+%26&"), expected);
    EXPECT_TRUE(parsedQuery("").empty());
}

TEST(Target, RefusesQueriesThatAreNotEncodedRight) {
    for (const char* const query : {"a=%", "%zz=1", "a=1&b=%4"}) {
        EXPECT_EQ(thrownText<Problem>([&] { parsedQuery(query); }),
                  "The query is not percent-encoded right.");
    }
}

TEST(Target, ReadsLimits) {
    const auto limit = [](const std::string& text) {
        return limitOf({{"limit", text}}, "limit", 5, 100);
    };
    EXPECT_EQ(limitOf({}, "limit", 5, 100), 5U);
    EXPECT_EQ(limit("1"), 1U);
    EXPECT_EQ(limit("100"), 100U);
    for (const char* const text :
         {"", "0", "101", "-1", "+1", "1 ", " 1", "1.0", "a", "0x1", "99999999999999999999999"}) {
        EXPECT_EQ(thrownText<Problem>([&] { limit(text); }),
                  R"("limit" must be a number from 1 to 100.)")
            << text;
    }
}

TEST(Target, KnowsUtf8) {
    EXPECT_TRUE(isUtf8("a\xC3\xA4\xF0\x9F\x98\x80"));
    EXPECT_TRUE(isUtf8(std::string_view("\0", 1)));
    for (const char* const bytes : {"\xFF", "\xC3", "\xC0\x80", "\xED\xA0\x80", "a\x80"}) {
        EXPECT_FALSE(isUtf8(bytes));
    }
}

}  // namespace
}  // namespace velkor::http::detail
