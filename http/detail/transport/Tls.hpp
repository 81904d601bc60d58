#pragma once

#include <openssl/types.h>

#include <memory>
#include <string>

namespace velkor::http::detail::transport {

/// What a server needs for TLS 1.2 and 1.3, with the certificate chain and the private key in these
/// PEM files; null if both names are empty. Throws `Refused` with the texts that `Server` says.
std::shared_ptr<SSL_CTX> tlsContext(const std::string& certificateFile, const std::string& keyFile);

}  // namespace velkor::http::detail::transport
