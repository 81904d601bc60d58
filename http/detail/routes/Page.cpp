#include "http/detail/routes/Page.hpp"

#include <openssl/evp.h>
#include <openssl/sha.h>

#include <array>

#include "http/detail/routes/PageText.hpp"

namespace velkor::http::detail {

namespace {

using Digest = std::array<unsigned char, SHA256_DIGEST_LENGTH>;
constexpr std::size_t base64Size = (std::size_t{SHA256_DIGEST_LENGTH} + 2) / 3 * 4;

std::string joined() {
    std::string html;
    for (const auto piece : {pageHead, pageStyle, pageBody, pageScript, pageTail}) html += piece;
    return html;
}

// As a policy names a text.
std::string digestOf(std::string_view text) {
    Digest digest{};
    SHA256(reinterpret_cast<const unsigned char*>(text.data()), text.size(), digest.data());
    std::array<unsigned char, base64Size + 1> encoded{};
    EVP_EncodeBlock(encoded.data(), digest.data(), SHA256_DIGEST_LENGTH);
    return "'sha256-" + std::string(encoded.begin(), encoded.end() - 1) + "'";
}

}  // namespace

std::string_view pageHtml() {
    static const std::string html = joined();
    return html;
}

const std::string& pagePolicy() {
    static const std::string policy = "default-src 'none'; script-src " + digestOf(pageScript) +
                                      "; style-src " + digestOf(pageStyle) +
                                      "; connect-src 'self'; base-uri 'none'; form-action 'none'; "
                                      "frame-ancestors 'none'";
    return policy;
}

const std::vector<std::pair<std::string, std::string>>& pageHeaders() {
    static const std::vector<std::pair<std::string, std::string>> headers{
        {"Content-Security-Policy", pagePolicy()},
        {"Referrer-Policy", "no-referrer"},
        {"Cross-Origin-Opener-Policy", "same-origin"},
        {"Cross-Origin-Resource-Policy", "same-origin"},
    };
    return headers;
}

}  // namespace velkor::http::detail
