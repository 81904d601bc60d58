#pragma once

#include <openssl/types.h>

#include <memory>

#include "layers/etcd/EtcdOptions.hpp"

namespace velkor::layers::etcd {

/// What a client needs for TLS 1.2 and 1.3, with the files that `options` name. Throws
/// `Unreachable` with the file and the reason: files are replaced, and read again next time.
std::shared_ptr<SSL_CTX> tlsContext(const EtcdOptions& options);

}  // namespace velkor::layers::etcd
