#include "http/detail/transport/ResponseText.hpp"

#include <gtest/gtest.h>

#include <string>

namespace velkor::http::detail::transport {
namespace {

TEST(ResponseText, SaysMomentsAsTheProtocolDoes) {
    EXPECT_EQ(dateText(784111777), "Sun, 06 Nov 1994 08:49:37 GMT");
    EXPECT_EQ(dateText(0), "Thu, 01 Jan 1970 00:00:00 GMT");
}

TEST(ResponseText, NamesWhatItIs) {
    Response response;
    response.status = 401;
    response.contentType = "application/problem+json";
    response.body = "{}";
    response.headers = {{"WWW-Authenticate", "Bearer"}};
    EXPECT_EQ(headOf(response, Staying::usual, "NOW"),
              "HTTP/1.1 401 Unauthorized\r\n"
              "Date: NOW\r\n"
              "Cache-Control: no-store\r\n"
              "X-Content-Type-Options: nosniff\r\n"
              "Content-Type: application/problem+json\r\n"
              "WWW-Authenticate: Bearer\r\n"
              "Content-Length: 2\r\n"
              "\r\n");
}

TEST(ResponseText, SaysWhatBecomesOfTheConnection) {
    const auto contains = [](const std::string& head, const char* line) {
        return head.find(line) != std::string::npos;
    };
    EXPECT_FALSE(contains(headOf({}, Staying::usual, ""), "Connection"));
    EXPECT_TRUE(contains(headOf({}, Staying::said, ""), "\r\nConnection: keep-alive\r\n"));
    EXPECT_TRUE(contains(headOf({}, Staying::none, ""), "\r\nConnection: close\r\n"));
}

TEST(ResponseText, OfAStreamSaysNoLength) {
    EXPECT_EQ(streamHead("NOW"),
              "HTTP/1.1 200 OK\r\n"
              "Date: NOW\r\n"
              "Cache-Control: no-store\r\n"
              "X-Content-Type-Options: nosniff\r\n"
              "Content-Type: text/event-stream\r\n"
              "X-Accel-Buffering: no\r\n"
              "Connection: close\r\n"
              "\r\n");
}

TEST(ResponseText, OfTheHeadOfAStreamAloneSaysNoLengthEither) {
    Response head;
    head.contentType = "text/event-stream";
    EXPECT_EQ(headOf(head, Staying::usual, "").find("Content-Length"), std::string::npos);
}

}  // namespace
}  // namespace velkor::http::detail::transport
