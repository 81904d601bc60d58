#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>
#include <random>
#include <string>
#include <vector>

#include "http/detail/transport/RequestParser.hpp"

namespace velkor::http::detail::transport {
namespace {

using State = RequestParser::State;

constexpr std::size_t headLimit = 256;
constexpr std::size_t bodyLimit = 64;

int rounds() {
    const char* const wanted = std::getenv("VELKOR_FUZZ_ROUNDS");
    return wanted == nullptr ? 20'000 : std::atoi(wanted);
}

// A request of pieces that requests consist of, some of them spoilt.
class Requests {
public:
    std::string next() {
        static const std::vector<std::string> pieces{"GET ",
                                                     "POST ",
                                                     "/",
                                                     "/watch?key=a",
                                                     " HTTP/1.1",
                                                     " HTTP/1.0",
                                                     "\r\n",
                                                     "\r\n",
                                                     "\r\n",
                                                     "\r\n\r\n",
                                                     "Content-Length: ",
                                                     "5",
                                                     "0",
                                                     "18446744073709551615",
                                                     "-1",
                                                     "Transfer-Encoding: ",
                                                     "chunked",
                                                     "gzip",
                                                     "Host: a",
                                                     ";a=b",
                                                     "1\r\na\r\n",
                                                     "0\r\n\r\n",
                                                     "ffffffffffffffff",
                                                     "Expect: 100-continue",
                                                     " ",
                                                     "\t",
                                                     "\n",
                                                     "\x80",
                                                     ":",
                                                     ",",
                                                     "Connection: close",
                                                     "abcde",
                                                     "x-y: z\r\n z"};
        std::string text = below(4) == 0 ? "" : "POST / HTTP/1.1\r\n";
        for (std::size_t count = below(16); count > 0; --count)
            text += pieces[below(pieces.size())];
        for (std::size_t count = below(3); count > 0 && !text.empty(); --count) {
            text[below(text.size())] = static_cast<char>(below(256));
        }
        if (below(16) == 0) text += std::string(below(600), 'x');
        return text;
    }

    std::size_t below(std::size_t limit) {
        return std::uniform_int_distribution<std::size_t>(0, limit - 1)(random);
    }

private:
    std::mt19937_64 random{20240229};
};

// The bodies of the requests in `text`, which comes in pieces of `size` bytes, up to the first that
// is refused or not complete.
std::vector<std::string> bodiesOf(const std::string& text, std::size_t size) {
    RequestParser parser(headLimit, bodyLimit);
    std::vector<std::string> bodies;
    std::size_t taken = 0;
    for (std::size_t end = 0; end < text.size() && parser.state() != State::refused;) {
        end = std::min(text.size(), end + size);
        std::size_t now = 0;
        do {
            now = parser.put(std::string_view(text).substr(taken, end - taken));
            taken += now;
            if (parser.state() != State::complete) break;
            bodies.push_back(parser.take().body);
        } while (taken < end);
        EXPECT_LE(end - taken, headLimit + size);
    }
    return bodies;
}

TEST(ParserFuzz, HowBytesArriveDoesNotChangeWhatTheyMean) {
    Requests requests;
    for (int round = 0; round < rounds(); ++round) {
        const std::string text = requests.next();
        const auto whole = bodiesOf(text, text.size() + 1);
        for (const std::string& body : whole) ASSERT_LE(body.size(), bodyLimit);
        ASSERT_EQ(bodiesOf(text, 1), whole) << text;
        ASSERT_EQ(bodiesOf(text, 1 + requests.below(40)), whole) << text;
    }
}

}  // namespace
}  // namespace velkor::http::detail::transport
