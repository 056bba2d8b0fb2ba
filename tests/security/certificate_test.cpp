#include "host/security/Certificate.h"
#include "host/security/SelfSigned.h"
#include "host/security/WholeFile.h"
#include "tests/security/Shell.h"
#include "tests/security/TemporaryDirectory.h"

#include <array>
#include <chrono>
#include <filesystem>
#include <functional>
#include <memory>
#include <stdexcept>
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

namespace {

namespace fs = std::filesystem;
using namespace std::chrono_literals;
using marlo::security::CertificateFiles;
using marlo::security::checkCertificate;
using marlo::security::fingerprint;
using marlo::security::Key;
using marlo::security::makeCertificate;
using marlo::security::makeKey;
using marlo::security::OwnCertificate;
using marlo::security::ownCertificate;
using marlo::security::readWhole;
using marlo::security::toPem;
using marlo::security::writeWhole;
using marlo::security::X509Certificate;
using marlo::test::shell;
using testing::HasSubstr;
using testing::Not;

constexpr auto day = std::chrono::hours(24);

std::string failureOf(const std::function<void()>& work) {
    try {
        work();
        return "none";
    } catch (const std::runtime_error& error) {
        return error.what();
    }
}

mode_t modeOf(const std::string& path) {
    struct stat status {};

    return stat(path.c_str(), &status) == 0 ? status.st_mode & 07777U : 0;
}

class CertificateTest : public testing::Test {
  protected:
    /** Writes a pair whose certificate is good for `life` in all, an hour of which is over. */
    void writePair(const Key& key, std::chrono::seconds life) const {
        writeWhole(_files.key, toPem(key), 0600);
        writeWhole(_files.certificate, toPem(makeCertificate(key, {"localhost"}, life)), 0644);
    }

    [[nodiscard]] std::string x509(const std::string& arguments) const {
        return shell("openssl x509 -noout -in " + _files.certificate + " " + arguments);
    }

    const marlo::test::TemporaryDirectory _directory;
    const CertificateFiles _files{_directory.file("certificate.pem"), _directory.file("key.pem")};
};

TEST_F(CertificateTest, IsMadeOnceAndKept) {
    const std::string directory = _directory.file("a/b");
    const OwnCertificate own = ownCertificate(directory);
    EXPECT_TRUE(own.isNew);
    EXPECT_EQ(own.files.certificate, directory + "/certificate.pem");
    EXPECT_EQ(own.files.key, directory + "/key.pem");
    EXPECT_EQ(modeOf(directory), 0700U);
    EXPECT_EQ(modeOf(own.files.certificate), 0644U);
    EXPECT_EQ(modeOf(own.files.key), 0600U);

    const std::string made = readWhole(own.files.certificate) + readWhole(own.files.key);
    EXPECT_FALSE(ownCertificate(directory).isNew);
    EXPECT_EQ(readWhole(own.files.certificate) + readWhole(own.files.key), made);
}

TEST_F(CertificateTest, IsOneThatClientsCanTrust) {
    ownCertificate(_directory.path(), {"192.0.2.7", "host.example", "no name, DNS:evil.example"});
    for (const char* name : {"-verify_hostname localhost", "-verify_ip 127.0.0.1", "-verify_ip ::1",
                             "-verify_ip 192.0.2.7", "-verify_hostname host.example"}) {
        EXPECT_THAT(shell("openssl verify -purpose sslserver " + std::string(name) + " -CAfile " +
                          _files.certificate + " " + _files.certificate),
                    HasSubstr(": OK"))
            << name;
    }
    EXPECT_THAT(shell("openssl verify -verify_hostname evil.example -CAfile " + _files.certificate + " " +
                      _files.certificate),
                HasSubstr("hostname mismatch"));
    std::array<char, 256> host{};
    ASSERT_EQ(gethostname(host.data(), host.size()), 0);
    EXPECT_THAT(x509("-ext subjectAltName"), HasSubstr(std::string("DNS:") + host.data()));
}

TEST_F(CertificateTest, HasASaneKeyAndTerm) {
    ownCertificate(_directory.path());
    const std::string text = x509("-text");
    EXPECT_THAT(text, HasSubstr("NIST CURVE: P-256"));
    EXPECT_THAT(text, HasSubstr("ecdsa-with-SHA256"));
    EXPECT_THAT(text, HasSubstr("CA:FALSE"));
    EXPECT_THAT(text, HasSubstr("Version: 3"));
    EXPECT_THAT(x509("-checkend " + std::to_string(std::chrono::seconds(824 * day).count())), Not(HasSubstr("exit")));
    EXPECT_THAT(x509("-checkend " + std::to_string(std::chrono::seconds(825 * day).count())), HasSubstr("exit 1"));
    EXPECT_THAT(readWhole(_files.key), HasSubstr("PRIVATE KEY"));
    EXPECT_THAT(readWhole(_files.certificate), Not(HasSubstr("PRIVATE KEY")));
}

TEST_F(CertificateTest, HasASerialNumberOfItsOwn) {
    ownCertificate(_directory.path());
    const std::string first = x509("-serial");
    fs::remove(_files.certificate);
    ownCertificate(_directory.path());
    EXPECT_NE(x509("-serial"), first);
}

TEST_F(CertificateTest, IsRenewedForTheSameKeyWhenItIsAboutToExpire) {
    writePair(makeKey(), marlo::security::certificateRenewal + 2h);
    EXPECT_FALSE(ownCertificate(_directory.path()).isNew);
    writePair(makeKey(), marlo::security::certificateRenewal + 59min);
    const std::string key = readWhole(_files.key);
    EXPECT_TRUE(ownCertificate(_directory.path()).isNew);
    EXPECT_EQ(readWhole(_files.key), key);
    EXPECT_FALSE(ownCertificate(_directory.path()).isNew);
}

TEST_F(CertificateTest, IsRenewedWhenItHasExpired) {
    writePair(makeKey(), 1min);
    EXPECT_TRUE(ownCertificate(_directory.path()).isNew);
}

TEST_F(CertificateTest, OfSomebodyElseIsNotRenewed) {
    const std::string make =
        "openssl req -x509 -newkey ec -pkeyopt ec_paramgen_curve:P-256 -nodes -subj /O=other -days 7 "
        "-keyout " +
        _files.key + " -out " + _files.certificate;
    ASSERT_THAT(shell(make), Not(HasSubstr("exit")));
    fs::permissions(_files.key, fs::perms(0600));
    const std::string former = readWhole(_files.certificate);
    EXPECT_FALSE(ownCertificate(_directory.path()).isNew);
    EXPECT_EQ(readWhole(_files.certificate), former);
}

TEST_F(CertificateTest, WithoutItsKeyIsNotReplaced) {
    writePair(makeKey(), 90 * day);
    fs::remove(_files.key);
    EXPECT_EQ(failureOf([&] { ownCertificate(_directory.path()); }),
              _files.key + ": is missing, but its certificate is there");
}

TEST_F(CertificateTest, OfAnotherKeyIsRefused) {
    writePair(makeKey(), 90 * day);
    checkCertificate(_files);
    writeWhole(_files.key, toPem(makeKey()), 0600);
    EXPECT_EQ(failureOf([&] { checkCertificate(_files); }), _files.key + ": is not the key of " + _files.certificate);
}

TEST_F(CertificateTest, ThatHasExpiredIsRefused) {
    writePair(makeKey(), 1min);
    EXPECT_THAT(failureOf([&] { checkCertificate(_files); }),
                testing::MatchesRegex(_files.certificate + ": expired on 20[0-9-]+ [0-9:]+ UTC"));
}

TEST_F(CertificateTest, ThatIsNotInForceYetIsRefused) {
    const Key key = makeKey();
    const X509Certificate certificate = makeCertificate(key, {"localhost"}, 90 * day);
    X509_gmtime_adj(X509_getm_notBefore(certificate.get()), 3600);
    ASSERT_GT(X509_sign(certificate.get(), key.get(), EVP_sha256()), 0);
    writeWhole(_files.key, toPem(key), 0600);
    writeWhole(_files.certificate, toPem(certificate), 0644);
    EXPECT_THAT(failureOf([&] { checkCertificate(_files); }),
                testing::StartsWith(_files.certificate + ": is not in force before 20"));
}

TEST_F(CertificateTest, WithAKeyThatOthersCanReadIsRefused) {
    writePair(makeKey(), 90 * day);
    for (const unsigned mode : {0600U, 0400U, 0640U}) {
        fs::permissions(_files.key, fs::perms(mode));
        EXPECT_EQ(failureOf([&] { checkCertificate(_files); }), "none") << mode;
    }
    fs::permissions(_files.key, fs::perms(0644));
    const std::string refusal = _files.key + ": a key of mode 0644 is not private; 0600 would do";
    EXPECT_EQ(failureOf([&] { checkCertificate(_files); }), refusal);
    EXPECT_EQ(failureOf([&] { ownCertificate(_directory.path()); }), refusal);
    for (const unsigned mode : {0660U, 0604U, 0602U, 0601U, 0700U}) {
        fs::permissions(_files.key, fs::perms(mode));
        EXPECT_THAT(failureOf([&] { checkCertificate(_files); }), HasSubstr("is not private")) << mode;
    }
}

TEST_F(CertificateTest, WithAKeyOfAnotherUserIsRefused) {
    if (geteuid() != 0) {
        GTEST_SKIP() << "only root can give a file away";
    }
    writePair(makeKey(), 90 * day);
    ASSERT_EQ(chown(_files.key.c_str(), 12345, 0), 0);
    EXPECT_EQ(failureOf([&] { checkCertificate(_files); }),
              _files.key + ": a key that belongs to user 12345 is not private");
}

TEST_F(CertificateTest, ThatIsNoneIsRefused) {
    EXPECT_THAT(failureOf([&] { checkCertificate(_files); }), HasSubstr(_files.certificate + ": cannot be opened"));
    writePair(makeKey(), 90 * day);
    writeWhole(_files.certificate, "certificate", 0644);
    EXPECT_THAT(failureOf([&] { checkCertificate(_files); }),
                testing::StartsWith(_files.certificate + ": holds no certificate: "));
    writePair(makeKey(), 90 * day);
    writeWhole(_files.key, "key", 0600);
    EXPECT_THAT(failureOf([&] { checkCertificate(_files); }),
                testing::StartsWith(_files.key + ": holds no key that can be used: "));
}

TEST_F(CertificateTest, WithAnEncryptedKeyIsRefusedAndNobodyIsAsked) {
    writePair(makeKey(), 90 * day);
    ASSERT_THAT(shell("openssl ec -aes128 -passout pass:secret -in " + _files.key + " -out " + _files.key + ".new"),
                Not(HasSubstr("exit")));
    writeWhole(_files.key, readWhole(_files.key + ".new"), 0600);
    EXPECT_THAT(failureOf([&] { checkCertificate(_files); }), HasSubstr("holds no key that can be used"));
}

TEST_F(CertificateTest, HasTheFingerprintThatOtherProgramsShow) {
    ownCertificate(_directory.path());
    const std::string shown = x509("-fingerprint -sha256"); // "sha256 Fingerprint=AB:CD...\n"
    const std::string bytes = shown.substr(shown.find('=') + 1, 95);
    EXPECT_EQ(fingerprint(_files.certificate), "SHA-256 " + bytes);
    EXPECT_THAT(failureOf([&] { fingerprint(_files.key); }),
                testing::StartsWith(_files.key + ": holds no certificate"));
}

} // namespace
