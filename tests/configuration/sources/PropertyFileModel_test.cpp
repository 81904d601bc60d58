#include <gtest/gtest.h>

#include <sstream>
#include <string>
#include <string_view>

#include "tests/configuration/sources/PropertyReading.hpp"
#include "tests/configuration/sources/PropertyTexts.hpp"

namespace velkor::configuration {
namespace {

using testing::Properties;

// Compares the source with the byte-by-byte reader; one file serves all inputs.
class PropertyFileModel : public ::testing::Test {
protected:
    ::testing::AssertionResult agreesOn(const std::string& text) {
        file.rewrite(text);
        std::istringstream stream(text);
        const Properties expected = testing::ReferencePropertyReader(stream).read();
        const Properties actual = testing::readProperties(file);
        if (actual == expected) return ::testing::AssertionSuccess();
        return ::testing::AssertionFailure()
               << "for " << ::testing::PrintToString(text) << " the source holds "
               << ::testing::PrintToString(actual) << " instead of "
               << ::testing::PrintToString(expected);
    }

    testing::TemporaryFile file{""};
};

TEST_F(PropertyFileModel, AgreesOnEveryTextOfUpToFiveSpecialBytes) {
    for (const auto& text : testing::everyShortText()) ASSERT_TRUE(agreesOn(text));
}

TEST_F(PropertyFileModel, AgreesOnRandomTexts) {
    for (const auto& text : testing::randomTexts()) ASSERT_TRUE(agreesOn(text));
}

TEST_F(PropertyFileModel, AgreesOnRandomUnicodeEscapes) {
    for (const auto& text : testing::randomEscapes()) ASSERT_TRUE(agreesOn(text));
}

TEST_F(PropertyFileModel, AgreesOnEveryEscapedByte) {
    for (int byte = 0; byte < 256; ++byte) {
        const std::string escaped = std::string("\\") + static_cast<char>(byte);
        ASSERT_TRUE(agreesOn("a" + escaped + "b=c" + escaped + "d\n"));
    }
}

TEST_F(PropertyFileModel, AgreesOnEveryCodePointOfFourDigits) {
    std::string text;
    for (unsigned code = 0; code <= 0xFFFF; ++code) {
        char line[24];
        std::snprintf(line, sizeof line, "k%04X=\\u%04x\n", code, code);
        text += line;
    }
    EXPECT_TRUE(agreesOn(text));
}

// What is read in blocks must not depend on where a block ends.
class BlockBoundary : public PropertyFileModel,
                      public ::testing::WithParamInterface<std::size_t> {};

TEST_P(BlockBoundary, EverySpecialSequenceMayCrossIt) {
    for (const char* sequence :
         {"\r\n", "\\\n  x", "\\u20AC", " = ", "=  ", "\n#x\n", "\\u41", "\xE2\x82\xAC"}) {
        const std::string_view tail(sequence);
        for (std::size_t inside = 0; inside <= tail.size(); ++inside) {
            const std::string filler = "k=" + std::string(GetParam() - inside - 2, 'v');
            ASSERT_TRUE(agreesOn(filler + sequence));
            ASSERT_TRUE(agreesOn(filler + sequence + "b=2\n"));
        }
    }
}

TEST_P(BlockBoundary, AKeyMayCrossIt) {
    EXPECT_TRUE(agreesOn(std::string(GetParam() + 1, 'k') + "=v\n"));
}

INSTANTIATE_TEST_SUITE_P(Sizes, BlockBoundary,
                         ::testing::Values(4096, 8191, 8192, 65535, 65536, 131072));

}  // namespace
}  // namespace velkor::configuration
