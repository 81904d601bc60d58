#include "http/detail/access/Tokens.hpp"

#include <gtest/gtest.h>

#include <string>

#include <sys/stat.h>

#include "http/Refused.hpp"
#include "tests/support/TemporaryFile.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::http::detail {
namespace {

using velkor::testing::TemporaryFile;
using velkor::testing::thrownText;

std::string holder(const Tokens& tokens, const std::string& token) {
    const auto found = tokens.holderOf(token);
    if (!found) return "nobody";
    return (found->right == Right::read ? "reader " : "writer ") + std::to_string(found->number);
}

std::string refusalOf(const std::string& path) {
    return thrownText<Refused>([&] { Tokens{path}; });
}

TEST(Tokens, TellReadersFromWriters) {
    const TemporaryFile file("# who may come\nread abc\n\n  write\txyz  \r\nread abc2");
    const Tokens tokens(file.path());
    EXPECT_EQ(holder(tokens, "abc"), "reader 1");
    EXPECT_EQ(holder(tokens, "xyz"), "writer 2");
    EXPECT_EQ(holder(tokens, "abc2"), "reader 3");
}

TEST(Tokens, AreKnownAsAWholeOnly) {
    const TemporaryFile file("read abcabc\n");
    const Tokens tokens(file.path());
    for (const std::string other :
         {"", "abc", "abcab", "abcabcabc", "abcabcabcabc", "Abcabc", "abcabc ", " abcabc"}) {
        EXPECT_EQ(holder(tokens, other), "nobody") << other;
    }
}

TEST(Tokens, GiveTheGreatestRightOfThoseThatAreTheSame) {
    const TemporaryFile file("read abc\nwrite abc\nread abc\n");
    EXPECT_EQ(holder(Tokens(file.path()), "abc"), "writer 2");
}

TEST(Tokens, RefuseLinesThatSayNothing) {
    for (const std::string line : {"abc", "read", "write ", "admin abc", "read a b", "Read abc",
                                   "read \xC3\xA4", "readabc", "read a\x01"}) {
        const TemporaryFile file("write good\n" + line + "\n");
        EXPECT_EQ(refusalOf(file.path()), "the token file " + file.path().string() +
                                              ", line 2: neither 'read TOKEN' nor 'write TOKEN'")
            << line;
    }
}

TEST(Tokens, RefuseAFileWithoutAny) {
    const TemporaryFile file("# none\n\n");
    EXPECT_EQ(refusalOf(file.path()), "the token file " + file.path().string() + " holds no token");
}

TEST(Tokens, RefuseAFileThatOthersMayReadOrWrite) {
    const TemporaryFile file("read abc\n");
    for (const mode_t mode : {0640U, 0604U, 0620U, 0602U, 0644U}) {
        ::chmod(file.path().c_str(), mode);
        EXPECT_EQ(refusalOf(file.path()), "the token file " + file.path().string() +
                                              " is open to others than its owner (chmod 600)")
            << mode;
    }
    ::chmod(file.path().c_str(), 0400);
    EXPECT_EQ(refusalOf(file.path()), "<nothing thrown>");
}

TEST(Tokens, RefuseWhatIsNoFileOfTokens) {
    EXPECT_EQ(refusalOf("/no/such/file"),
              "can't read the token file /no/such/file: No such file or directory");
    EXPECT_EQ(refusalOf("/tmp"), "can't read the token file /tmp: no regular file");
    const TemporaryFile large(std::string((64 << 10) + 1, '#'));
    EXPECT_EQ(refusalOf(large.path()),
              "can't read the token file " + large.path().string() + ": larger than 65536 bytes");
}

}  // namespace
}  // namespace velkor::http::detail
