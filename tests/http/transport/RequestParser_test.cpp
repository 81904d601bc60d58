#include "http/detail/transport/RequestParser.hpp"

#include <gtest/gtest.h>

#include <cstddef>
#include <ostream>
#include <string>
#include <vector>

namespace velkor::http::detail::transport {
namespace {

using State = RequestParser::State;

constexpr std::size_t headLimit = 512;
constexpr std::size_t bodyLimit = 64;

// Gives `text` in pieces of at most `size` bytes, as a connection does: what isn't taken comes
// again with what follows. Says how many bytes were taken.
std::size_t give(RequestParser& parser, const std::string& text, std::size_t size) {
    std::size_t taken = 0;
    for (std::size_t end = 0; end < text.size() && parser.state() == State::incomplete;) {
        end = std::min(text.size(), end + size);
        taken += parser.put(std::string_view(text).substr(taken, end - taken));
    }
    return taken;
}

struct Read {
    int refusal = 0;
    bool complete = false;
    Request request;
};

Read read(const std::string& text, std::size_t size = 100'000) {
    RequestParser parser(headLimit, bodyLimit);
    give(parser, text, size);
    Read result;
    result.refusal = parser.refusal();
    result.complete = parser.state() == State::complete;
    if (result.complete) result.request = parser.take();
    return result;
}

TEST(RequestParser, GivesWhatWasSent) {
    const Read result =
        read("POST /a/b?c=%20d HTTP/1.1\r\nHost: h\r\nContent-Length: 3\r\n\r\nabc");
    ASSERT_TRUE(result.complete);
    EXPECT_EQ(result.request.method, "POST");
    EXPECT_EQ(result.request.target, "/a/b?c=%20d");
    EXPECT_EQ(result.request.body, "abc");
}

TEST(RequestParser, PassesOnEachOccurrenceOfTheHeadersThatAreWanted) {
    const Read result = read(
        "GET / HTTP/1.1\r\nhOST: a\r\nCookie: secret\r\nHost:  b \r\nSec-Fetch-Site: none\r\n\r\n");
    ASSERT_TRUE(result.complete);
    using Headers = decltype(Request::headers);
    EXPECT_EQ(result.request.headers,
              (Headers{{"host", "a"}, {"host", "b"}, {"sec-fetch-site", "none"}}));
}

TEST(RequestParser, TakesTheHostFromATargetThatNamesIt) {
    struct Row {
        const char* target;
        const char* path;
        const char* host;
    };
    const Row rows[] = {{"http://a:80/b?c", "/b?c", "a:80"},
                        {"HTTPS://a/", "/", "a"},
                        {"http://a", "/", "a"},
                        {"http://a?b", "/?b", "a"},
                        {"http:///b", "/b", ""},
                        {"/b?http://a/", "/b?http://a/", "own"},
                        {"ftp://a/", "ftp://a/", "own"},
                        {"*", "*", "own"}};
    for (const Row& row : rows) {
        SCOPED_TRACE(row.target);
        const Read result =
            read("GET " + std::string(row.target) + " HTTP/1.1\r\nHost: own\r\n\r\n");
        ASSERT_TRUE(result.complete);
        EXPECT_EQ(result.request.target, row.path);
        EXPECT_EQ(result.request.headers, (decltype(Request::headers){{"host", row.host}}));
    }
}

TEST(RequestParser, JoinsTheChunksOfABody) {
    const Read result = read(
        "POST / HTTP/1.1\r\nTransfer-Encoding: Chunked\r\n\r\n"
        "3;name=value\r\nabc\r\nA\r\n0123456789\r\n0\r\nX: y\r\n\r\n");
    ASSERT_TRUE(result.complete);
    EXPECT_EQ(result.request.body, "abc0123456789");
}

TEST(RequestParser, TakesNoTrailerForAHeader) {
    const Read result = read(
        "POST / HTTP/1.1\r\nTransfer-Encoding: chunked\r\n\r\n"
        "1\r\na\r\n0\r\nAuthorization: Bearer x\r\n\r\n");
    ASSERT_TRUE(result.complete);
    EXPECT_FALSE(result.request.header("authorization"));
}

TEST(RequestParser, LeavesTheNextRequest) {
    const std::string first = "POST / HTTP/1.1\r\nContent-Length: 2\r\n\r\nab";
    const std::string second = "GET /next HTTP/1.1\r\n\r\n";
    RequestParser parser(headLimit, bodyLimit);
    EXPECT_EQ(parser.put(first + second), first.size());
    EXPECT_EQ(parser.take().body, "ab");
    EXPECT_EQ(parser.put(second), second.size());
    EXPECT_EQ(parser.take().target, "/next");
}

TEST(RequestParser, SaysHowTheConnectionGoesOn) {
    struct Row {
        const char* head;
        bool keepsAlive;
        bool isOld;
    };
    const Row rows[] = {{"HTTP/1.1\r\n", true, false},
                        {"HTTP/1.1\r\nConnection: close\r\n", false, false},
                        {"HTTP/1.0\r\n", false, true},
                        {"HTTP/1.0\r\nConnection: keep-alive\r\n", true, true}};
    for (const Row& row : rows) {
        SCOPED_TRACE(row.head);
        RequestParser parser(headLimit, bodyLimit);
        parser.put("GET / " + std::string(row.head) + "\r\n");
        ASSERT_EQ(parser.state(), State::complete);
        EXPECT_EQ(parser.keepsAlive(), row.keepsAlive);
        EXPECT_EQ(parser.isOld(), row.isOld);
    }
}

TEST(RequestParser, SaysOnceThatTheBodyIsHeldBack) {
    RequestParser parser(headLimit, bodyLimit);
    parser.put("POST / HTTP/1.1\r\nContent-Length: 1\r\nExpect: 100-continue\r\n\r\n");
    EXPECT_TRUE(parser.takeExpectation());
    EXPECT_FALSE(parser.takeExpectation());
}

TEST(RequestParser, InvitesNobodyWhoSendsAnyway) {
    RequestParser parser(headLimit, bodyLimit);
    parser.put("POST / HTTP/1.1\r\nContent-Length: 2\r\nExpect: 100-continue\r\n\r\na");
    EXPECT_FALSE(parser.takeExpectation());
}

struct Sample {
    const char* name;
    int refusal;  // 0: none
    std::string text;

    friend void PrintTo(const Sample& sample, std::ostream* out) { *out << sample.name; }
};

std::string withHead(const std::string& head, const std::string& body = "") {
    return "POST / HTTP/1.1\r\n" + head + "\r\n" + body;
}

std::vector<Sample> samples() {
    using namespace std::string_literals;
    const std::string chunked = "Transfer-Encoding: chunked\r\n";
    const std::string longest(bodyLimit, 'b');
    const std::string frame = "GET / HTTP/1.1\r\nX: \r\n\r\n";
    const auto ofSize = [&](std::size_t size) {
        return "GET / HTTP/1.1\r\nX: " + std::string(size - frame.size(), 'x') + "\r\n\r\n";
    };
    std::string manyExtensions;
    for (int i = 0; i < 6; ++i) manyExtensions += "1;" + std::string(100, 'e') + "\r\na\r\n";
    return {
        {"NotHttp", 400, "hello\r\n\r\n"},
        {"EmptyLineFirst", 400, "\r\nGET / HTTP/1.1\r\n\r\n"},
        {"StartOfTls", 400, "\x16\x03\x01\x02\x00\x01\x00\x01\xfc\x03\x03\r\n\r\n"s},
        {"Version2", 400, "PRI * HTTP/2.0\r\n\r\nSM\r\n\r\n"},
        {"Version12", 400, "GET / HTTP/1.2\r\n\r\n"},
        {"NoVersion", 400, "GET /\r\n\r\n"},
        {"NulInTarget", 400, "GET /a\0b HTTP/1.1\r\n\r\n"s},
        {"NulInHeader", 400, "GET / HTTP/1.1\r\nHost: a\0b\r\n\r\n"s},
        {"SpaceInTarget", 400, "GET /a b HTTP/1.1\r\n\r\n"},
        {"SpaceBeforeColon", 400, withHead("Host : a\r\n")},
        {"FoldedLine", 400, withHead("Host: a\r\n b\r\nX: y\r\n")},
        {"LineFoldedAtATab", 400, withHead("X:\r\n\tb\r\n")},
        {"LastLineFolded", 400, withHead("X: y\r\n \r\n")},
        {"NoColon", 400, withHead("Host\r\n")},
        {"BareLineFeeds", 400, "GET / HTTP/1.1\nHost: a\n\n\r\n\r\n"},
        {"LengthTwice", 400, withHead("Content-Length: 1\r\nContent-Length: 1\r\n", "a")},
        {"LengthsDiffer", 400, withHead("Content-Length: 1\r\nContent-Length: 2\r\n", "ab")},
        {"ListOfLengths", 400, withHead("Content-Length: 1, 1\r\n", "a")},
        {"NegativeLength", 400, withHead("Content-Length: -1\r\n")},
        {"SignedLength", 400, withHead("Content-Length: +1\r\n", "a")},
        {"HugeLength", 400, withHead("Content-Length: 99999999999999999999999\r\n")},
        {"HexLength", 400, withHead("Content-Length: 0x1\r\n", "a")},
        {"EmptyLength", 400, withHead("Content-Length: \r\n")},
        {"LengthThenCoding", 400, withHead("Content-Length: 5\r\n" + chunked, "0\r\n\r\n")},
        {"CodingThenLength", 400, withHead(chunked + "Content-Length: 5\r\n", "0\r\n\r\n")},
        {"CodingTwice", 400, withHead(chunked + chunked, "0\r\n\r\n")},
        {"OtherCoding", 400, withHead("Transfer-Encoding: gzip\r\n")},
        {"OtherCodingFirst", 400, withHead("Transfer-Encoding: gzip, chunked\r\n", "0\r\n\r\n")},
        {"CodingBehindAnother", 400, withHead("Transfer-Encoding: chunked, identity\r\n")},
        {"CodingWithVerticalTab", 400, withHead("Transfer-Encoding: \vchunked\r\n", "0\r\n\r\n")},
        {"CodingInHttp10", 400, "POST / HTTP/1.0\r\nTransfer-Encoding: chunked\r\n\r\n0\r\n\r\n"},
        {"NoChunkSize", 400, withHead(chunked, "\r\n\r\n")},
        {"ChunkSizeIsNoNumber", 400, withHead(chunked, "g\r\n\r\n")},
        {"ChunkSizeWithPrefix", 400, withHead(chunked, "0x1\r\na\r\n0\r\n\r\n")},
        {"ChunkSizeOverflows", 400, withHead(chunked, "ffffffffffffffffff\r\n\r\n")},
        {"ChunkIsLonger", 400, withHead(chunked, "1\r\nab\r\n0\r\n\r\n")},
        {"ChunkEndsByLineFeed", 400, withHead(chunked, "1\na\n0\n\n\r\n\r\n")},
        {"TrailerLength", 400, withHead(chunked, "0\r\nContent-Length: 5\r\n\r\n")},
        {"LongestHead", 0, ofSize(headLimit)},
        {"HeadTooLong", 431, ofSize(headLimit + 1)},
        {"TargetTooLong", 431, "GET /" + std::string(headLimit, 'x')},
        {"OneEndlessHeader", 431, "GET / HTTP/1.1\r\nX: " + std::string(headLimit, 'x')},
        {"OneEndlessExtension", 431, withHead(chunked, "1;" + std::string(headLimit, 'e'))},
        {"ExtensionsTogetherTooLong", 431, withHead(chunked, manyExtensions)},
        {"EndlessTrailers", 431, withHead(chunked, "0\r\nX: " + std::string(headLimit, 'x'))},
        {"LongestBody", 0, withHead("Content-Length: 64\r\n", longest)},
        {"LongestBodyInChunks", 0, withHead(chunked, "40\r\n" + longest + "\r\n0\r\n\r\n")},
        {"BodyTooLong", 413, withHead("Content-Length: 65\r\n")},
        {"ChunkTooLong", 413, withHead(chunked, "41\r\n")},
        {"ChunksTogetherTooLong", 413, withHead(chunked, "40\r\n" + longest + "\r\n1\r\n")},
    };
}

class RequestParserSamples : public ::testing::TestWithParam<Sample> {};

TEST_P(RequestParserSamples, AreTakenOrRefusedHoweverTheyArrive) {
    for (const std::size_t size : {1U, 2U, 3U, 7U, 100000U}) {
        SCOPED_TRACE(size);
        const Read result = read(GetParam().text, size);
        EXPECT_EQ(result.refusal, GetParam().refusal);
        EXPECT_EQ(result.complete, GetParam().refusal == 0);
    }
}

INSTANTIATE_TEST_SUITE_P(All, RequestParserSamples, ::testing::ValuesIn(samples()),
                         [](const auto& instance) { return instance.param.name; });

}  // namespace
}  // namespace velkor::http::detail::transport
