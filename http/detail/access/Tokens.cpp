#include "http/detail/access/Tokens.hpp"

#include <algorithm>
#include <cerrno>
#include <system_error>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "http/Refused.hpp"
#include "http/detail/Descriptor.hpp"

namespace velkor::http::detail {

namespace {

constexpr std::size_t mostBytes = std::size_t{64} << 10U;

[[noreturn]] void refuseFile(const std::string& path, const std::string& reason) {
    throw Refused("can't read the token file " + path + ": " + reason);
}

[[noreturn]] void refuseForSystem(const std::string& path) {
    refuseFile(path, std::generic_category().message(errno));
}

std::string contentOf(const std::string& path) {
    const Descriptor file(::open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK));
    if (!file) refuseForSystem(path);
    struct stat status {};
    if (::fstat(file.get(), &status) != 0) refuseForSystem(path);
    if (!S_ISREG(status.st_mode)) refuseFile(path, "no regular file");
    if ((status.st_mode & (S_IRGRP | S_IWGRP | S_IROTH | S_IWOTH)) != 0) {
        throw Refused("the token file " + path + " is open to others than its owner (chmod 600)");
    }
    std::string content(mostBytes + 1, '\0');
    std::size_t size = 0;
    while (size < content.size()) {
        const auto count = ::read(file.get(), content.data() + size, content.size() - size);
        if (count < 0 && errno == EINTR) continue;
        if (count < 0) refuseForSystem(path);
        if (count == 0) break;
        size += static_cast<std::size_t>(count);
    }
    if (size > mostBytes) refuseFile(path, "larger than " + std::to_string(mostBytes) + " bytes");
    content.resize(size);
    return content;
}

std::string_view trimmed(std::string_view text) {
    constexpr std::string_view blanks = " \t\r";
    const auto begin = std::min(text.find_first_not_of(blanks), text.size());
    text.remove_prefix(begin);
    return text.empty() ? text : text.substr(0, text.find_last_not_of(blanks) + 1);
}

bool isVisible(char character) {
    return character > ' ' && character <= '~';
}

// Goes through all of `token`, whatever `given` is.
bool isSame(std::string_view token, std::string_view given) {
    unsigned differences = token.size() == given.size() ? 0 : 1;
    for (std::size_t i = 0; i < token.size(); ++i) {
        const char other = given.empty() ? '\0' : given[i % given.size()];
        differences |= static_cast<unsigned char>(token[i] ^ other);
    }
    return differences == 0;
}

}  // namespace

std::optional<Tokens::Token> Tokens::parsed(std::string_view line) {
    const auto wordEnd = std::min(line.find_first_of(" \t"), line.size());
    const std::string_view word = line.substr(0, wordEnd);
    const std::string_view token = trimmed(line.substr(wordEnd));
    if (word != "read" && word != "write") return std::nullopt;
    if (token.empty() || !std::all_of(token.begin(), token.end(), isVisible)) return std::nullopt;
    return Token{std::string(token), word == "read" ? Right::read : Right::write};
}

Tokens::Tokens(const std::string& path) {
    const std::string content = contentOf(path);
    std::string_view rest = content;
    for (std::size_t number = 1; !rest.empty(); ++number) {
        const std::string_view line = rest.substr(0, rest.find('\n'));
        rest.remove_prefix(std::min(rest.size(), line.size() + 1));
        const std::string_view words = trimmed(line);
        if (words.empty() || words.front() == '#') continue;
        auto token = parsed(words);
        if (!token) {
            throw Refused("the token file " + path + ", line " + std::to_string(number) +
                          ": neither 'read TOKEN' nor 'write TOKEN'");
        }
        tokens.push_back(*std::move(token));
    }
    if (tokens.empty()) throw Refused("the token file " + path + " holds no token");
}

std::optional<TokenHolder> Tokens::holderOf(std::string_view token) const {
    std::optional<TokenHolder> holder;
    for (std::size_t i = 0; i < tokens.size(); ++i) {
        const bool same = isSame(tokens[i].text, token);
        if (same && (!holder || tokens[i].right > holder->right)) {
            holder = TokenHolder{tokens[i].right, i + 1};
        }
    }
    return holder;
}

}  // namespace velkor::http::detail
