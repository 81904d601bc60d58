#include "host/look/KeyPattern.hpp"

#include <algorithm>
#include <set>
#include <utility>

#include "host/TerminalText.hpp"
#include "host/console/Command.hpp"
#include "host/look/KeyWalk.hpp"

namespace velkor::host {

namespace {

constexpr const char* wildcards = "*?";

bool begins(std::string_view beginning, std::string_view text) {
    return text.substr(0, beginning.size()) == beginning;
}

/// `text` without its first character.
std::string_view behindCharacter(std::string_view text) {
    std::size_t size = 1;
    while (size < text.size() && isContinuationByte(text[size])) ++size;
    return text.substr(size);
}

// On a mismatch the last * takes one more byte: what stood before it fits already. A part of a
// character that it takes, the others of which a ? takes, fits as well as none of it.
bool matchesGlob(std::string_view glob, std::string_view text) {
    bool hasStar = false;
    std::string_view globBehindStar;
    std::string_view textBehindStar;
    while (!text.empty() || !glob.empty()) {
        if (!glob.empty() && glob.front() == '*') {
            glob.remove_prefix(1);
            hasStar = true;
            globBehindStar = glob;
            textBehindStar = text;
        } else if (!glob.empty() && !text.empty() && glob.front() == '?') {
            glob.remove_prefix(1);
            text = behindCharacter(text);
        } else if (!glob.empty() && !text.empty() && glob.front() == text.front()) {
            glob.remove_prefix(1);
            text.remove_prefix(1);
        } else if (hasStar && !textBehindStar.empty()) {
            textBehindStar.remove_prefix(1);
            text = textBehindStar;
            glob = globBehindStar;
        } else {
            return false;
        }
    }
    return true;
}

}  // namespace

KeyPattern::KeyPattern(std::string word, configuration::ConfigurationImpl& store)
    : pattern(std::move(word)), fixed(pattern), kind(Kind::prefix) {
    if (store.has(pattern).get()) {
        kind = Kind::key;
    } else if (const auto wildcard = pattern.find_first_of(wildcards); wildcard != pattern.npos) {
        kind = Kind::glob;
        fixed.resize(wildcard);
    } else if (pattern.empty() || pattern.back() != '.') {
        fixed += '.';
    }
}

bool KeyPattern::matches(std::string_view key) const {
    switch (kind) {
        case Kind::key:
            return key == pattern;
        case Kind::prefix:
            return begins(fixed, key);
        case Kind::glob:
            return matchesGlob(pattern, key);
    }
    return false;
}

std::string KeyPattern::missingText() const {
    const bool namesOneKey = kind != Kind::glob && fixed != pattern;
    return (namesOneKey ? "No configuration option with key: " : "No key matches: ") + pattern;
}

KeySelection::KeySelection(const std::vector<std::string>& words,
                           configuration::ConfigurationImpl& keyStore)
    : store(keyStore) {
    for (const auto& word : words) parts.push_back({KeyPattern(word, store)});
}

void KeySelection::forEach(const std::function<void(const std::string& key)>& visit) {
    if (!parts.empty() && std::all_of(parts.begin(), parts.end(),
                                      [](const Part& part) { return part.pattern.isKey(); })) {
        return visitKeys(visit);
    }
    std::string first;
    if (!parts.empty()) {
        first = std::min_element(parts.begin(), parts.end(), [](const Part& a, const Part& b) {
                    return a.pattern.beginning() < b.pattern.beginning();
                })->pattern.beginning();
    }
    walkKeys(store, first, [&](const std::string& key) {
        if (selects(key)) visit(key);
        return !isBehindAll(key);
    });
}

// Without a look at any other key.
void KeySelection::visitKeys(const std::function<void(const std::string& key)>& visit) {
    std::set<std::string> keys;
    for (Part& part : parts) {
        part.isFound = true;
        keys.insert(part.pattern.beginning());
    }
    for (const auto& key : keys) visit(key);
}

void KeySelection::requireAllFound() const {
    std::string missing;
    for (const Part& part : parts) {
        if (part.isFound) continue;
        missing += (missing.empty() ? "" : "; ") + part.pattern.missingText();
    }
    if (!missing.empty()) throw CommandError(missing);
}

// All patterns are asked, so that each knows whether it was found.
bool KeySelection::selects(const std::string& key) {
    bool isSelected = parts.empty();
    for (Part& part : parts) {
        if (!part.pattern.matches(key)) continue;
        part.isFound = true;
        isSelected = true;
    }
    return isSelected;
}

bool KeySelection::isBehindAll(const std::string& key) const {
    return !parts.empty() && std::all_of(parts.begin(), parts.end(), [&](const Part& part) {
        const std::string& beginning = part.pattern.beginning();
        return key > beginning && !begins(beginning, key);
    });
}

}  // namespace velkor::host
