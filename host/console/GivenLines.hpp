#pragma once

#include <cstddef>
#include <string>
#include <utility>
#include <vector>

#include "host/console/LineSource.hpp"

namespace velkor::host {

/// Lines that are known beforehand.
class GivenLines final : public LineSource {
public:
    explicit GivenLines(std::vector<std::string> givenLines) : lines(std::move(givenLines)) {}

    std::optional<std::string> nextLine() override {
        if (next == lines.size()) return std::nullopt;
        return lines[next++];
    }

private:
    const std::vector<std::string> lines;
    std::size_t next = 0;
};

}  // namespace velkor::host
