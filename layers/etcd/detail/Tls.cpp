#include "layers/etcd/detail/Tls.hpp"

#include <openssl/err.h>
#include <openssl/ssl.h>

#include <cerrno>
#include <fstream>
#include <new>
#include <string>
#include <system_error>

#include "layers/etcd/detail/GatewayErrors.hpp"

namespace velkor::layers::etcd {

namespace {

[[noreturn]] void refuse(const std::string& what, const std::string& file) {
    errno = 0;
    const bool canBeRead = std::ifstream(file).good();
    throw Unreachable(
        "can't use the " + what + " " + file + ": " +
        (canBeRead ? "it is none in PEM, or doesn't fit" : std::generic_category().message(errno)));
}

// No one is there who could type a pass phrase.
int noPassPhrase(char* /*text*/, int /*size*/, int /*writing*/, void* /*data*/) {
    return -1;
}

}  // namespace

std::shared_ptr<SSL_CTX> tlsContext(const EtcdOptions& options) {
    std::shared_ptr<SSL_CTX> context(::SSL_CTX_new(::TLS_client_method()), ::SSL_CTX_free);
    if (!context) throw std::bad_alloc();
    ::SSL_CTX_set_min_proto_version(context.get(), TLS1_2_VERSION);
    ::SSL_CTX_set_verify(context.get(), SSL_VERIFY_PEER, nullptr);
    ::SSL_CTX_set_default_passwd_cb(context.get(), noPassPhrase);
    if (options.caFile.empty()) {
        ::SSL_CTX_set_default_verify_paths(context.get());
    } else if (::SSL_CTX_load_verify_file(context.get(), options.caFile.c_str()) != 1) {
        refuse("CA file", options.caFile);
    }
    if (!options.certificateFile.empty() &&
        ::SSL_CTX_use_certificate_chain_file(context.get(), options.certificateFile.c_str()) != 1) {
        refuse("certificate", options.certificateFile);
    }
    if (!options.keyFile.empty() &&
        ::SSL_CTX_use_PrivateKey_file(context.get(), options.keyFile.c_str(), SSL_FILETYPE_PEM) !=
            1) {
        refuse("key", options.keyFile);
    }
    return context;
}

}  // namespace velkor::layers::etcd
