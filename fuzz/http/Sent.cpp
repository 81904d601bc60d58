#include "fuzz/http/Sent.hpp"

#include <algorithm>

namespace velkor::fuzz::http {

namespace {

std::string_view takeWord(std::string_view& rest) {
    const std::string_view word = rest.substr(0, rest.find(' '));
    rest.remove_prefix(std::min(rest.size(), word.size() + 1));
    return word;
}

std::string methodOf(char mark) {
    switch (mark) {
        case 'P':
            return "POST";
        case 'A':
            return "PATCH";
        case 'H':
            return "HEAD";
        case 'O':
            return "OPTIONS";
        case 'D':
            return "DELETE";
        default:
            return "GET";
    }
}

std::string hostOf(std::string_view marks) {
    for (const char mark : marks) {
        if (mark == 'f') return "evil.example";
        if (mark == 'a') return "127.0.0.1";
        if (mark == 'p') return "LocalHost:8080";
    }
    return "localhost";
}

void addHeader(Request& request, char mark, const std::string& host) {
    const auto add = [&](std::string_view name, const std::string& value) {
        request.headers.emplace_back(name, value);
    };
    switch (mark) {
        case 'r':
            return add("authorization", std::string("Bearer ") + readToken);
        case 'w':
            return add("authorization", std::string("bearer ") + writeToken);
        case 'u':
            return add("authorization", "Bearer unknown");
        case 'b':
            return add("authorization", std::string("Basic ") + writeToken);
        case 'o':
            return add("origin", "http://" + host);
        case 'i':
            return add("origin", "https://" + host);
        case 'e':
            return add("origin", "null");
        case 's':
            return add("sec-fetch-site", "same-origin");
        case 'c':
            return add("sec-fetch-site", "cross-site");
        case 'f':
        case 'a':
        case 'p':
            return add("host", host);
        default:
            return;
    }
}

}  // namespace

Request readRequest(std::string_view line) {
    const std::string_view marks = takeWord(line);
    Request request;
    request.method = methodOf(marks.empty() ? 'G' : marks.back());
    request.target = takeWord(line);
    request.body = line;
    request.client.address = "127.0.0.1:50312";
    request.client.secure = marks.find('t') != std::string_view::npos;
    const std::string host = hostOf(marks);
    if (marks.find_first_of("hfap") == std::string_view::npos) {
        request.headers.emplace_back("host", host);
    }
    for (const char mark : marks) addHeader(request, mark, host);
    return request;
}

}  // namespace velkor::fuzz::http
