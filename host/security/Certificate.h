/**
 * @file
 * The certificate that the server shows, and its key; PEM files (RFC 7468).
 */
#pragma once

#include <chrono>
#include <string>
#include <vector>

namespace marlo::security {

struct CertificateFiles {
    std::string certificate; ///< with the certificates of its issuers behind it, if any
    std::string key;
};

struct OwnCertificate {
    CertificateFiles files;
    bool isNew = false; ///< made by this call: clients that trusted the former one have to be told
};

/** Longest time that a certificate which is made here is good for; some clients take no longer one. */
inline constexpr std::chrono::hours certificateLife{std::chrono::hours(24) * 825};
/** Its last days, in which it is replaced. */
inline constexpr std::chrono::hours certificateRenewal{std::chrono::hours(24) * 30};

/**
 * The files "certificate.pem" (mode 0644) and "key.pem" (mode 0600) of a directory, which is made when it is not
 * there. A key (ECDSA, P-256) and a certificate that it signs itself are made where they are missing; the certificate
 * is made anew, for the same key, when it was made here and is about to expire. It is good for "localhost",
 * 127.0.0.1,
 * ::1, the host's names as the system knows them without asking anybody, and `names` (names and numeric addresses).
 *
 * The files must then pass checkCertificate; throws as that does, and std::system_error.
 */
OwnCertificate ownCertificate(const std::string& directory, const std::vector<std::string>& names = {});

/**
 * Throws std::runtime_error, which names the file, unless the certificate is in force and the key is its own and
 * private: owned by root or this process's user, no mode beyond 0640.
 */
void checkCertificate(const CertificateFiles& files);

/** "SHA-256 AB:CD:..." of a certificate, as other programs show it. Throws std::runtime_error that names the file. */
std::string fingerprint(const std::string& certificateFile);

} // namespace marlo::security
