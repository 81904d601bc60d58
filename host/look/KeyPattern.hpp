#pragma once

#include <functional>
#include <string>
#include <string_view>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"

namespace velkor::host {

/// Which keys somebody means by a word:
///
/// - one that is a key of the store: that key, whatever it holds;
/// - one that ends in ".": all keys that it begins;
/// - one with * or ?: all keys that it matches from beginning to end, where * stands for any number
///   of characters, dots included, and ? for exactly one;
/// - any other: all keys that it and a "." begin.
class KeyPattern {
public:
    /// For the keys of `store`.
    KeyPattern(std::string word, configuration::ConfigurationImpl& store);

    bool matches(std::string_view key) const;

    /// Whether it means one key only.
    bool isKey() const noexcept { return kind == Kind::key; }

    /// What all keys begin with that match.
    const std::string& beginning() const noexcept { return fixed; }

    /// What there is to say when no key matches: "No configuration option with key: " or "No key
    /// matches: ", and the word.
    std::string missingText() const;

private:
    enum class Kind { key, prefix, glob };

    std::string pattern;
    std::string fixed;
    Kind kind;
};

/// The keys of a store that any of several patterns means; all keys if there is none.
class KeySelection {
public:
    /// Takes `words` for patterns.
    KeySelection(const std::vector<std::string>& words, configuration::ConfigurationImpl& store);

    /// Calls `visit` with each key, sorted byte by byte. Throws as `walkKeys`. To be called once.
    void forEach(const std::function<void(const std::string& key)>& visit);

    /// Throws `CommandError` with the texts of all patterns that no key has matched, separated by
    /// "; ": see `KeyPattern::missingText`.
    void requireAllFound() const;

private:
    struct Part {
        KeyPattern pattern;
        bool isFound = false;
    };

    void visitKeys(const std::function<void(const std::string& key)>& visit);
    bool selects(const std::string& key);
    bool isBehindAll(const std::string& key) const;

    configuration::ConfigurationImpl& store;
    std::vector<Part> parts;
};

}  // namespace velkor::host
