#include "host/security/Certificate.h"

#include "host/security/Secret.h"
#include "host/security/SelfSigned.h"
#include "host/security/WholeFile.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdio>
#include <ctime>
#include <stdexcept>
#include <system_error>

#include <netdb.h>
#include <sys/stat.h>
#include <unistd.h>

namespace marlo::security {

namespace {

constexpr mode_t forbiddenKeyModes = 07137; ///< 0640 is what the group of those who may read keys gets

[[noreturn]] void fail(const std::string& file, const std::string& what) {
    throw std::runtime_error(file + ": " + what);
}

/** Holds a key's text no longer than needed. */
struct SecretText {
    explicit SecretText(std::string content) : text(std::move(content)) {}

    ~SecretText() { wipe(text); }

    SecretText(const SecretText&) = delete;
    SecretText& operator=(const SecretText&) = delete;

    std::string text;
};

bool exists(const std::string& path) {
    struct stat status {};

    if (::stat(path.c_str(), &status) == 0) {
        return true;
    }
    if (errno != ENOENT) {
        throw std::system_error(errno, std::generic_category(), path);
    }
    return false;
}

X509Certificate certificateFrom(const std::string& file) {
    X509Certificate certificate = readCertificate(readWhole(file));
    if (!certificate) {
        fail(file, "holds no certificate: " + openSslReason());
    }
    return certificate;
}

void checkPrivate(const std::string& file) {
    struct stat status {};

    if (::stat(file.c_str(), &status) != 0) {
        throw std::system_error(errno, std::generic_category(), file);
    }
    if ((status.st_mode & forbiddenKeyModes) != 0) {
        std::array<char, 8> mode{};
        static_cast<void>(
            std::snprintf(mode.data(), mode.size(), "%04o", static_cast<unsigned>(status.st_mode & 07777U)));
        fail(file, std::string("a key of mode ") + mode.data() + " is not private; 0600 would do");
    }
    if (status.st_uid != 0 && status.st_uid != ::geteuid()) {
        fail(file, "a key that belongs to user " + std::to_string(status.st_uid) + " is not private");
    }
}

Key keyFrom(const std::string& file) {
    checkPrivate(file);
    const SecretText pem(readWhole(file));
    Key key = readKey(pem.text);
    if (!key) {
        fail(file, "holds no key that can be used: " + openSslReason());
    }
    return key;
}

/** Compares a time of a certificate with now and something: below 0 when it lies before. */
int compared(const ASN1_TIME* time, std::chrono::seconds fromNow) {
    std::time_t moment = std::time(nullptr) + fromNow.count();
    return X509_cmp_time(time, &moment);
}

/** "2027-02-24 12:00:00 UTC" */
std::string shown(const ASN1_TIME* time) {
    std::tm parts{};
    if (ASN1_TIME_to_tm(time, &parts) != 1) {
        return "a time that cannot be read";
    }
    std::array<char, 32> text{};
    return {text.data(), std::strftime(text.data(), text.size(), "%Y-%m-%d %H:%M:%S UTC", &parts)};
}

/** The names that /etc/hosts has for a host: gethostent(3) asks nobody else. */
void addAliases(std::vector<std::string>& names, const std::string& host) {
    ::sethostent(0);
    while (const hostent* entry = ::gethostent()) {
        std::vector<std::string> all{entry->h_name};
        for (char** alias = entry->h_aliases; *alias != nullptr; ++alias) {
            all.emplace_back(*alias);
        }
        if (std::find(all.begin(), all.end(), host) != all.end()) {
            names.insert(names.end(), all.begin(), all.end());
        }
    }
    ::endhostent();
}

std::vector<std::string> allNames(const std::vector<std::string>& further) {
    std::vector<std::string> names;
    std::array<char, 256> host{};
    if (::gethostname(host.data(), host.size() - 1) == 0) {
        names.emplace_back(host.data());
        addAliases(names, names.front());
    }
    names.insert(names.end(), {"localhost", "127.0.0.1", "::1"});
    names.insert(names.end(), further.begin(), further.end());
    std::vector<std::string> unique;
    std::copy_if(names.begin(), names.end(), std::back_inserter(unique), [&](const std::string& name) {
        return std::find(unique.begin(), unique.end(), name) == unique.end();
    });
    return unique;
}

void makeKeyFile(const std::string& file) {
    const SecretText pem(toPem(makeKey()));
    writeWhole(file, pem.text, 0600);
}

bool isDue(const std::string& file) {
    if (!exists(file)) {
        return true;
    }
    const X509Certificate certificate = certificateFrom(file);
    return isSelfMade(certificate) && compared(X509_get0_notAfter(certificate.get()), certificateRenewal) <= 0;
}

} // namespace

OwnCertificate ownCertificate(const std::string& directory, const std::vector<std::string>& names) {
    OwnCertificate own{{directory + "/certificate.pem", directory + "/key.pem"}};
    makeDirectory(directory);
    // The key first, which stays: a kill in between leaves no certificate without its key.
    if (!exists(own.files.key)) {
        if (exists(own.files.certificate)) {
            fail(own.files.key, "is missing, but its certificate is there");
        }
        makeKeyFile(own.files.key);
    }
    if (isDue(own.files.certificate)) {
        const X509Certificate made = makeCertificate(keyFrom(own.files.key), allNames(names), certificateLife);
        writeWhole(own.files.certificate, toPem(made), 0644);
        own.isNew = true;
    }
    checkCertificate(own.files);
    return own;
}

void checkCertificate(const CertificateFiles& files) {
    const X509Certificate certificate = certificateFrom(files.certificate);
    const Key key = keyFrom(files.key);
    if (X509_check_private_key(certificate.get(), key.get()) != 1) {
        static_cast<void>(openSslReason());
        fail(files.key, "is not the key of " + files.certificate);
    }
    if (compared(X509_get0_notBefore(certificate.get()), std::chrono::seconds(0)) > 0) {
        fail(files.certificate, "is not in force before " + shown(X509_get0_notBefore(certificate.get())));
    }
    if (compared(X509_get0_notAfter(certificate.get()), std::chrono::seconds(0)) <= 0) {
        fail(files.certificate, "expired on " + shown(X509_get0_notAfter(certificate.get())));
    }
}

std::string fingerprint(const std::string& certificateFile) {
    const X509Certificate certificate = certificateFrom(certificateFile);
    std::array<unsigned char, EVP_MAX_MD_SIZE> bytes{};
    unsigned size = 0;
    if (X509_digest(certificate.get(), EVP_sha256(), bytes.data(), &size) != 1) {
        fail(certificateFile, openSslReason());
    }
    std::string text = "SHA-256 ";
    for (unsigned index = 0; index < size; ++index) {
        std::array<char, 4> pair{};
        static_cast<void>(std::snprintf(pair.data(), pair.size(), index == 0 ? "%02X" : ":%02X",
                                        static_cast<unsigned>(bytes[index])));
        text += pair.data();
    }
    return text;
}

} // namespace marlo::security
