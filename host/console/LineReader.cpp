#include "host/console/LineReader.hpp"

namespace velkor::host {

std::optional<std::string> LineReader::nextLine() {
    std::string line;
    bool tooLong = false;
    bool anything = false;
    char byte = '\0';
    while (in.get(byte)) {
        anything = true;
        if (byte == '\n') break;
        if (line.size() < longestLine) {
            line += byte;
        } else {
            tooLong = true;
        }
    }
    ++lineNumber;
    if (in.bad()) {
        in.clear(std::ios::eofbit | std::ios::failbit);
        throw LineError("Reading failed.");
    }
    if (!anything) return std::nullopt;
    if (tooLong) {
        throw LineError("Line too long; the limit is " + std::to_string(longestLine) + " bytes.");
    }
    return line;
}

std::string LineReader::position() const {
    return "line " + std::to_string(lineNumber) + ": ";
}

}  // namespace velkor::host
