#pragma once

#include <openssl/evp.h>
#include <openssl/pem.h>
#include <openssl/x509.h>

#include <cstdio>
#include <memory>
#include <string>

#include "tests/support/TemporaryFile.hpp"

namespace velkor::testing {

/// A certificate for "localhost" that signs itself, and its key, as PEM files.
class Certificate {
public:
    Certificate() {
        const std::unique_ptr<EVP_PKEY, decltype(&::EVP_PKEY_free)> key(newKey(), ::EVP_PKEY_free);
        const std::unique_ptr<X509, decltype(&::X509_free)> made(::X509_new(), ::X509_free);
        constexpr long day = 24 * 60 * 60;
        ::ASN1_INTEGER_set(::X509_get_serialNumber(made.get()), 1);
        ::X509_gmtime_adj(::X509_getm_notBefore(made.get()), -day);
        ::X509_gmtime_adj(::X509_getm_notAfter(made.get()), day);
        ::X509_set_pubkey(made.get(), key.get());
        X509_NAME* const name = ::X509_get_subject_name(made.get());
        const unsigned char host[] = "localhost";
        ::X509_NAME_add_entry_by_txt(name, "CN", MBSTRING_ASC, &host[0], -1, -1, 0);
        ::X509_set_issuer_name(made.get(), name);
        ::X509_sign(made.get(), key.get(), nullptr);

        write(certificate, [&](std::FILE* out) { ::PEM_write_X509(out, made.get()); });
        write(keyFile, [&](std::FILE* out) {
            ::PEM_write_PrivateKey(out, key.get(), nullptr, nullptr, 0, nullptr, nullptr);
        });
    }

    std::string certificatePath() const { return certificate.path().string(); }
    std::string keyPath() const { return keyFile.path().string(); }

private:
    static EVP_PKEY* newKey() {
        EVP_PKEY* key = nullptr;
        EVP_PKEY_CTX* const making = ::EVP_PKEY_CTX_new_from_name(nullptr, "ED25519", nullptr);
        ::EVP_PKEY_keygen_init(making);
        ::EVP_PKEY_generate(making, &key);
        ::EVP_PKEY_CTX_free(making);
        return key;
    }

    template <class Write>
    static void write(const TemporaryFile& file, Write&& content) {
        std::FILE* const out = std::fopen(file.path().c_str(), "w");
        content(out);
        std::fclose(out);
    }

    const TemporaryFile certificate{"", "certificate.pem"};
    const TemporaryFile keyFile{"", "key.pem"};
};

}  // namespace velkor::testing
