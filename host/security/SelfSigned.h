/**
 * @file
 * Making keys and certificates with OpenSSL, and reading them from PEM text.
 */
#pragma once

#include <chrono>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include <openssl/evp.h>
#include <openssl/x509.h>

namespace marlo::security {

struct FreeKey {
    void operator()(EVP_PKEY* key) const { EVP_PKEY_free(key); }
};

struct FreeCertificate {
    void operator()(X509* certificate) const { X509_free(certificate); }
};

using Key = std::unique_ptr<EVP_PKEY, FreeKey>;
using X509Certificate = std::unique_ptr<X509, FreeCertificate>;

/** What OpenSSL has to say about the last failure on this thread; its errors are cleared. */
std::string openSslReason();

/** All that make something throw std::runtime_error with OpenSSL's reason. */
Key makeKey();

/**
 * A certificate for a server that its own key signs, in force from an hour ago, for clocks that are behind, and for
 * `life` in all. `names` are host names and numeric addresses; what is neither is left out. The first host name is
 * the subject's common name where it is short enough (RFC 5280, ub-common-name).
 */
X509Certificate makeCertificate(const Key& key, const std::vector<std::string>& names, std::chrono::seconds life);

/** Whether a certificate was made by makeCertificate. */
bool isSelfMade(const X509Certificate& certificate);

std::string toPem(const Key& key);
std::string toPem(const X509Certificate& certificate);

/** The first of its kind in the text; none when there is none, or it is encrypted: nobody is there to be asked. */
Key readKey(std::string_view pem);
X509Certificate readCertificate(std::string_view pem);

} // namespace marlo::security
