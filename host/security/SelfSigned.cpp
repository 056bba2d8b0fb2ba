#include "host/security/SelfSigned.h"

#include <algorithm>
#include <array>
#include <stdexcept>

#include <arpa/inet.h>
#include <openssl/bn.h>
#include <openssl/ec.h>
#include <openssl/err.h>
#include <openssl/pem.h>
#include <openssl/rand.h>
#include <openssl/x509v3.h>

namespace marlo::security {

namespace {

constexpr const char* organisation = "marlo";
constexpr long clockSkew = 3600;
constexpr std::size_t longestCommonName = 64;

struct FreeBio {
    void operator()(BIO* bio) const { BIO_free(bio); }
};

struct FreeExtension {
    void operator()(X509_EXTENSION* extension) const { X509_EXTENSION_free(extension); }
};

using Bio = std::unique_ptr<BIO, FreeBio>;

void require(bool isDone, const char* what) {
    if (!isDone) {
        throw std::runtime_error(std::string(what) + ": " + openSslReason());
    }
}

bool isHostName(const std::string& name) {
    return !name.empty() && name.size() <= 253 && std::all_of(name.begin(), name.end(), [](char character) {
        return (character >= '0' && character <= '9') || (character >= 'A' && character <= 'Z') ||
               (character >= 'a' && character <= 'z') || character == '-' || character == '.' || character == '_';
    });
}

bool isAddress(const std::string& name) {
    std::array<unsigned char, sizeof(in6_addr)> binary{};
    return inet_pton(AF_INET, name.c_str(), binary.data()) == 1 ||
           inet_pton(AF_INET6, name.c_str(), binary.data()) == 1;
}

/** As the configuration of extensions has it (x509v3_config(5)). */
std::string alternativeNames(const std::vector<std::string>& names) {
    std::string text;
    for (const std::string& name : names) {
        if (isAddress(name) || isHostName(name)) {
            text += (text.empty() ? "" : ",") + std::string(isAddress(name) ? "IP:" : "DNS:") + name;
        }
    }
    return text;
}

void addExtension(const X509Certificate& certificate, int kind, const std::string& value) {
    X509V3_CTX context{};
    X509V3_set_ctx_nodb(&context);
    X509V3_set_ctx(&context, certificate.get(), certificate.get(), nullptr, nullptr, 0);
    const std::unique_ptr<X509_EXTENSION, FreeExtension> extension(
        X509V3_EXT_conf_nid(nullptr, &context, kind, value.c_str()));
    require(extension && X509_add_ext(certificate.get(), extension.get(), -1) == 1, "certificate extension");
}

/** Positive and of 127 bits: two certificates of one issuer never share one (RFC 5280, 4.1.2.2). */
void setSerial(const X509Certificate& certificate) {
    std::array<unsigned char, 16> bytes{};
    require(RAND_bytes(bytes.data(), static_cast<int>(bytes.size())) == 1, "random numbers");
    bytes[0] &= 0x7FU;
    const std::unique_ptr<BIGNUM, decltype(&BN_free)> number(
        BN_bin2bn(bytes.data(), static_cast<int>(bytes.size()), nullptr), &BN_free);
    require(number && BN_to_ASN1_INTEGER(number.get(), X509_get_serialNumber(certificate.get())) != nullptr,
            "serial number");
}

void addName(X509_NAME* subject, const char* field, const std::string& value) {
    require(X509_NAME_add_entry_by_txt(subject, field, MBSTRING_ASC,
                                       reinterpret_cast<const unsigned char*>(value.c_str()), -1, -1, 0) == 1,
            "certificate subject");
}

void setSubject(const X509Certificate& certificate, const std::vector<std::string>& names) {
    X509_NAME* subject = X509_get_subject_name(certificate.get());
    addName(subject, "O", organisation);
    const auto name = std::find_if(names.begin(), names.end(), [](const std::string& candidate) {
        return isHostName(candidate) && !isAddress(candidate) && candidate.size() <= longestCommonName;
    });
    if (name != names.end()) {
        addName(subject, "CN", *name);
    }
    require(X509_set_issuer_name(certificate.get(), subject) == 1, "certificate issuer");
}

std::string textOf(const Bio& bio) {
    char* data = nullptr;
    const long size = BIO_get_mem_data(bio.get(), &data);
    return {data, static_cast<std::size_t>(std::max(size, 0L))};
}

/** In the place of OpenSSL's own, which asks on the terminal. */
int noPassphrase(char* /*buffer*/, int /*size*/, int /*isForWriting*/, void* /*data*/) {
    return -1;
}

Bio bioOf(std::string_view text) {
    Bio bio(BIO_new_mem_buf(text.data(), static_cast<int>(text.size())));
    require(bio != nullptr, "memory");
    return bio;
}

} // namespace

std::string openSslReason() {
    const unsigned long error = ERR_get_error();
    ERR_clear_error();
    const char* reason = error == 0 ? nullptr : ERR_reason_error_string(error);
    return reason == nullptr ? "OpenSSL gives no reason" : reason;
}

Key makeKey() {
    Key key(EVP_EC_gen("P-256"));
    require(key != nullptr, "key");
    return key;
}

X509Certificate makeCertificate(const Key& key, const std::vector<std::string>& names, std::chrono::seconds life) {
    X509Certificate certificate(X509_new());
    require(certificate && X509_set_version(certificate.get(), X509_VERSION_3) == 1, "certificate");
    setSerial(certificate);
    setSubject(certificate, names);
    require(X509_gmtime_adj(X509_getm_notBefore(certificate.get()), -clockSkew) != nullptr &&
                X509_gmtime_adj(X509_getm_notAfter(certificate.get()), life.count() - clockSkew) != nullptr &&
                X509_set_pubkey(certificate.get(), key.get()) == 1,
            "certificate");
    addExtension(certificate, NID_basic_constraints, "critical,CA:FALSE");
    addExtension(certificate, NID_key_usage, "critical,digitalSignature");
    addExtension(certificate, NID_ext_key_usage, "serverAuth");
    addExtension(certificate, NID_subject_key_identifier, "hash");
    addExtension(certificate, NID_subject_alt_name, alternativeNames(names));
    require(X509_sign(certificate.get(), key.get(), EVP_sha256()) > 0, "signature");
    return certificate;
}

bool isSelfMade(const X509Certificate& certificate) {
    X509_NAME* subject = X509_get_subject_name(certificate.get());
    std::array<char, 64> text{};
    const int length = X509_NAME_get_text_by_NID(subject, NID_organizationName, text.data(), text.size());
    return length >= 0 && std::string_view(text.data()) == organisation &&
           X509_NAME_cmp(subject, X509_get_issuer_name(certificate.get())) == 0;
}

std::string toPem(const Key& key) {
    const Bio bio(BIO_new(BIO_s_secmem()));
    require(bio && PEM_write_bio_PrivateKey(bio.get(), key.get(), nullptr, nullptr, 0, nullptr, nullptr) == 1, "key");
    return textOf(bio);
}

std::string toPem(const X509Certificate& certificate) {
    const Bio bio(BIO_new(BIO_s_mem()));
    require(bio && PEM_write_bio_X509(bio.get(), certificate.get()) == 1, "certificate");
    return textOf(bio);
}

Key readKey(std::string_view pem) {
    return Key(PEM_read_bio_PrivateKey(bioOf(pem).get(), nullptr, &noPassphrase, nullptr));
}

X509Certificate readCertificate(std::string_view pem) {
    return X509Certificate(PEM_read_bio_X509(bioOf(pem).get(), nullptr, &noPassphrase, nullptr));
}

} // namespace marlo::security
