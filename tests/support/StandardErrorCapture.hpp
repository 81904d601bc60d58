#pragma once

#include <iostream>
#include <sstream>
#include <streambuf>
#include <string>

namespace velkor::testing {

/// Lets `std::cerr` write into `buffer` while it lives.
class StandardErrorRedirection {
public:
    explicit StandardErrorRedirection(std::streambuf& buffer)
        : original(std::cerr.rdbuf(&buffer)), exceptions(std::cerr.exceptions()) {}

    ~StandardErrorRedirection() {
        std::cerr.exceptions(std::ios_base::goodbit);
        std::cerr.rdbuf(original);
        std::cerr.exceptions(exceptions);
    }

    StandardErrorRedirection(const StandardErrorRedirection&) = delete;
    StandardErrorRedirection& operator=(const StandardErrorRedirection&) = delete;

private:
    std::streambuf* const original;
    const std::ios_base::iostate exceptions;
};

/// Collects what is written to `std::cerr` while it lives. One thread writes at a time.
class StandardErrorCapture {
public:
    std::string text() const { return buffer.str(); }

private:
    std::stringbuf buffer;
    StandardErrorRedirection redirection{buffer};
};

}  // namespace velkor::testing
