#include "host/console/SecretLines.hpp"

#include <algorithm>

#include "host/console/CommandLine.hpp"

namespace velkor::host {

namespace {

// In the JSON of a message a key may be written in many ways.
constexpr const char* messageCommand = "send";

bool holdsOne(const std::string& text, const std::set<std::string>& secrets) {
    return std::any_of(secrets.begin(), secrets.end(),
                       [&](const std::string& key) { return text.find(key) != std::string::npos; });
}

}  // namespace

bool mayHoldSecret(const std::string& line, const std::set<std::string>& secrets) {
    if (secrets.empty()) return false;
    if (holdsOne(line, secrets)) return true;
    CommandLine words(line);
    try {
        for (auto word = words.nextWord(); word; word = words.nextWord()) {
            if (*word == messageCommand || holdsOne(*word, secrets)) return true;
        }
        return false;
    } catch (const CommandLineError&) {
        return true;
    }
}

}  // namespace velkor::host
