#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "http/detail/access/Right.hpp"

namespace velkor::http::detail {

/// What is known of who has sent a token.
struct TokenHolder {
    Right right;
    std::size_t number;  ///< Of the token in the file, from 1.
};

/// The tokens of a file. Immutable: safe for concurrent use.
class Tokens {
public:
    /// Reads the file at `path`: a token in each line, "read TOKEN" or "write TOKEN", of visible
    /// ASCII characters; empty lines and those that begin with "#" say nothing. Throws `Refused`:
    ///
    /// - "can't read the token file PATH: REASON", the reason being the system's, "no regular
    ///   file" or "larger than 65536 bytes"
    /// - "the token file PATH is open to others than its owner (chmod 600)"
    /// - "the token file PATH, line N: neither 'read TOKEN' nor 'write TOKEN'"
    /// - "the token file PATH holds no token"
    explicit Tokens(const std::string& path);

    /// Who holds `token`; nothing if nobody does. Compares with all tokens, and all of each: how
    /// long that takes tells nothing of them but how long they are together.
    std::optional<TokenHolder> holderOf(std::string_view token) const;

private:
    struct Token {
        std::string text;
        Right right;
    };

    static std::optional<Token> parsed(std::string_view line);

    std::vector<Token> tokens;
};

}  // namespace velkor::http::detail
