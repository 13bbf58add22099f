#include "Certificate.h"

#include <openssl/bio.h>
#include <openssl/ec.h>
#include <openssl/pem.h>
#include <openssl/rand.h>
#include <openssl/x509v3.h>

#include <stdexcept>

namespace provider {

namespace {

constexpr long kValidSeconds = 365L * 24 * 3600;

void require(bool ok) {
    if (!ok) throw std::runtime_error("cannot make a certificate");
}

void addExtension(X509* certificate, int nid, const char* value) {
    const std::unique_ptr<X509_EXTENSION, void (*)(X509_EXTENSION*)> extension(
        X509V3_EXT_conf_nid(nullptr, nullptr, nid, value), X509_EXTENSION_free);
    require(extension != nullptr && X509_add_ext(certificate, extension.get(), -1) == 1);
}

std::string pemOf(X509* certificate) {
    const std::unique_ptr<BIO, int (*)(BIO*)> memory(BIO_new(BIO_s_mem()), BIO_free);
    require(memory != nullptr && PEM_write_bio_X509(memory.get(), certificate) == 1);
    char* text = nullptr;
    const long length = BIO_get_mem_data(memory.get(), &text);
    return {text, static_cast<std::size_t>(length)};
}

}  // namespace

Certificate Certificate::make() {
    Certificate made;
    made.key.reset(EVP_PKEY_Q_keygen(nullptr, nullptr, "EC", "P-256"));
    made.certificate.reset(X509_new());
    X509* certificate = made.certificate.get();
    require(made.key != nullptr && certificate != nullptr);
    // A serial of its own each time: clients refuse two certificates with one name and one serial.
    std::uint64_t serial = 0;
    require(RAND_bytes(reinterpret_cast<unsigned char*>(&serial), sizeof serial) == 1);
    require(X509_set_version(certificate, 2) == 1 &&
            ASN1_INTEGER_set_uint64(X509_get_serialNumber(certificate), serial >> 1U) == 1);
    require(X509_gmtime_adj(X509_getm_notBefore(certificate), -3600) != nullptr &&
            X509_gmtime_adj(X509_getm_notAfter(certificate), kValidSeconds) != nullptr);
    X509_NAME* name = X509_get_subject_name(certificate);
    const auto* common = reinterpret_cast<const unsigned char*>("localhost");
    require(X509_NAME_add_entry_by_txt(name, "CN", MBSTRING_ASC, common, -1, -1, 0) == 1);
    require(X509_set_issuer_name(certificate, name) == 1 &&
            X509_set_pubkey(certificate, made.key.get()) == 1);
    addExtension(certificate, NID_basic_constraints, "critical,CA:TRUE");
    addExtension(certificate, NID_subject_alt_name, "DNS:localhost,IP:127.0.0.1");
    require(X509_sign(certificate, made.key.get(), EVP_sha256()) > 0);
    made.pem = pemOf(certificate);
    return made;
}

}  // namespace provider
