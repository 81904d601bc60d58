#include "http/detail/transport/Tls.hpp"

#include <openssl/err.h>
#include <openssl/ssl.h>

#include <cerrno>
#include <fstream>
#include <new>
#include <system_error>

#include "http/Refused.hpp"

namespace velkor::http::detail::transport {
namespace {

[[noreturn]] void refuse(const std::string& what, const std::string& file, const char* reason) {
    errno = 0;
    const bool canBeRead = std::ifstream(file).good();
    throw Refused("can't use the " + what + " " + file + ": " +
                  (canBeRead ? reason : std::generic_category().message(errno)));
}

// What is wrong with a key that can be read.
const char* keyProblem() {
    const bool isAnothers = ERR_GET_LIB(::ERR_peek_error()) == ERR_LIB_X509;
    return isAnothers ? "it is not that of the certificate" : "no key in PEM is in it";
}

// No one is there who could type a pass phrase.
int noPassPhrase(char* /*text*/, int /*size*/, int /*writing*/, void* /*data*/) {
    return -1;
}

}  // namespace

std::shared_ptr<SSL_CTX> tlsContext(const std::string& certificateFile,
                                    const std::string& keyFile) {
    if (certificateFile.empty() && keyFile.empty()) return nullptr;
    if (certificateFile.empty() || keyFile.empty()) {
        throw Refused("TLS needs both a certificate and a key");
    }
    std::shared_ptr<SSL_CTX> context(::SSL_CTX_new(::TLS_server_method()), ::SSL_CTX_free);
    if (!context) throw std::bad_alloc();
    ::SSL_CTX_set_min_proto_version(context.get(), TLS1_2_VERSION);
    ::SSL_CTX_set_options(context.get(), SSL_OP_NO_RENEGOTIATION | SSL_OP_NO_COMPRESSION);
    ::SSL_CTX_set_mode(context.get(), SSL_MODE_RELEASE_BUFFERS);
    ::SSL_CTX_set_default_passwd_cb(context.get(), noPassPhrase);
    ::ERR_clear_error();
    if (::SSL_CTX_use_certificate_chain_file(context.get(), certificateFile.c_str()) != 1) {
        refuse("certificate", certificateFile, "no certificate in PEM is in it");
    }
    if (::SSL_CTX_use_PrivateKey_file(context.get(), keyFile.c_str(), SSL_FILETYPE_PEM) != 1) {
        refuse("key", keyFile, keyProblem());
    }
    return context;
}

}  // namespace velkor::http::detail::transport
