#include "layers/etcd/Loggers.hpp"

#include <openssl/crypto.h>

#include "layers/detail/Endings.hpp"

namespace velkor::layers {

const common::DiagnosticLogger etcdLogger("velkor::layers::etcd");

namespace {

// Made after what the threads that are waited for use to their end, so that it is destroyed before
// that: the logger, and OpenSSL, which cleans up at the end of the process.
[[maybe_unused]] const bool isReady = [] {
    ::OPENSSL_init_crypto(0, nullptr);
    detail::Endings::ofLibrary();
    return true;
}();

}  // namespace

}  // namespace velkor::layers
