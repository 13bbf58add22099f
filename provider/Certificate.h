// Certificate: a self-signed certificate for the loopback addresses, made anew at each start.
#pragma once

#include <openssl/evp.h>
#include <openssl/x509.h>

#include <memory>
#include <string>

namespace provider {

struct Certificate {
    std::unique_ptr<EVP_PKEY, void (*)(EVP_PKEY*)> key{nullptr, EVP_PKEY_free};
    std::unique_ptr<X509, void (*)(X509*)> certificate{nullptr, X509_free};
    std::string pem;  // of the certificate, for clients that verify

    // Valid for "localhost", 127.0.0.1 and the next year. Throws std::runtime_error.
    static Certificate make();
};

}  // namespace provider
