#include "framework/common/WidePathInputFileStream.hpp"

#include <gtest/gtest.h>

#include <filesystem>
#include <iterator>
#include <locale>
#include <string>

#include "tests/support/ScopedGlobalLocale.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace {

using velkor::common::WidePathInputFileStream;
using velkor::testing::CommaNumbers;
using velkor::testing::ScopedGlobalLocale;
using velkor::testing::TemporaryFile;

std::string contentOf(std::istream& stream) {
    return std::string(std::istreambuf_iterator<char>(stream), {});
}

void expectNotOpen(const std::u16string& path) {
    const WidePathInputFileStream stream(path);
    EXPECT_FALSE(stream.is_open());
    EXPECT_TRUE(stream.fail());
}

TEST(WidePathInputFileStream, ReadsTheFile) {
    const TemporaryFile file("some content");
    WidePathInputFileStream stream(file.widePath());
    EXPECT_EQ(contentOf(stream), "some content");
}

TEST(WidePathInputFileStream, OpenFileIsReady) {
    const TemporaryFile file("x");
    const WidePathInputFileStream stream(file.widePath());
    EXPECT_TRUE(stream.is_open());
    EXPECT_TRUE(stream.good());
}

TEST(WidePathInputFileStream, GivesEveryByteAsItIs) {
    std::string bytes;
    for (int byte = 0; byte < 256; ++byte) bytes.push_back(static_cast<char>(byte));
    const TemporaryFile file(bytes + "\r\n\x1a" + bytes);
    WidePathInputFileStream stream(file.widePath());
    EXPECT_EQ(contentOf(stream), bytes + "\r\n\x1a" + bytes);
}

TEST(WidePathInputFileStream, GivesEveryByteAsItIsInAForeignLocale) {
    const ScopedGlobalLocale foreign(std::locale(std::locale::classic(), new CommaNumbers));
    const TemporaryFile file("\x80\xff\r\n");
    WidePathInputFileStream stream(file.widePath());
    EXPECT_EQ(contentOf(stream), "\x80\xff\r\n");
}

TEST(WidePathInputFileStream, EmptyFileOpens) {
    const TemporaryFile file("");
    WidePathInputFileStream stream(file.widePath());
    EXPECT_TRUE(stream.is_open());
    EXPECT_EQ(contentOf(stream), "");
}

TEST(WidePathInputFileStream, PathMayHoldLettersOutsideAscii) {
    const TemporaryFile file("x",
                             "gr\xc3\xb6\xc3\x9f"
                             "e.properties");
    WidePathInputFileStream stream(file.parent().u16string() + u"/gr\u00f6\u00dfe.properties");
    EXPECT_EQ(contentOf(stream), "x");
}

TEST(WidePathInputFileStream, PathMayHoldSurrogatePairs) {
    const TemporaryFile file("x", "\xf0\x9f\x98\x80.properties");
    WidePathInputFileStream stream(file.parent().u16string() + u"/\U0001F600.properties");
    EXPECT_EQ(contentOf(stream), "x");
}

TEST(WidePathInputFileStream, PathMayGoThroughALink) {
    const TemporaryFile file("x");
    std::filesystem::create_symlink(file.path(), file.parent() / "link");
    WidePathInputFileStream stream(file.parent().u16string() + u"/link");
    EXPECT_EQ(contentOf(stream), "x");
}

TEST(WidePathInputFileStream, PathMayBeRelative) {
    const TemporaryFile file("x");
    WidePathInputFileStream stream(std::filesystem::relative(file.path()).u16string());
    EXPECT_EQ(contentOf(stream), "x");
}

TEST(WidePathInputFileStream, MissingFileIsNotOpened) {
    const TemporaryFile file("x");
    expectNotOpen(file.parent().u16string() + u"/missing");
}

TEST(WidePathInputFileStream, MissingFolderIsNotOpened) {
    const TemporaryFile file("x");
    expectNotOpen(file.parent().u16string() + u"/missing/file.properties");
}

TEST(WidePathInputFileStream, EmptyPathIsNotOpened) {
    expectNotOpen(u"");
}

TEST(WidePathInputFileStream, DirectoryIsNotOpened) {
    const TemporaryFile file("x");
    expectNotOpen(file.parent().u16string());
}

TEST(WidePathInputFileStream, LinkToADirectoryIsNotOpened) {
    const TemporaryFile file("x");
    std::filesystem::create_directory_symlink(file.parent(), file.parent() / "link");
    expectNotOpen(file.parent().u16string() + u"/link");
}

TEST(WidePathInputFileStream, LinkToItselfIsNotOpened) {
    const TemporaryFile file("x");
    std::filesystem::create_symlink(file.parent() / "loop", file.parent() / "loop");
    expectNotOpen(file.parent().u16string() + u"/loop");
}

TEST(WidePathInputFileStream, PathWithANulIsNotOpenedUpToIt) {
    const TemporaryFile file("x");
    expectNotOpen(file.widePath() + std::u16string(u"\0.old", 5));
}

TEST(WidePathInputFileStream, PathEndingInANulIsNotOpened) {
    const TemporaryFile file("x");
    expectNotOpen(file.widePath() + std::u16string(1, u'\0'));
}

TEST(WidePathInputFileStream, PathThatIsNoTextIsNotOpened) {
    const TemporaryFile file("x");
    expectNotOpen(file.parent().u16string() + u'/' + std::u16string(1, char16_t{0xD800}));
}

TEST(WidePathInputFileStream, PathThatIsTooLongIsNotOpened) {
    expectNotOpen(u"/" + std::u16string(100000, u'x'));
}

}  // namespace
