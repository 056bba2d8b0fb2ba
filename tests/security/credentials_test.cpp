#include "host/security/Credentials.h"

#include <string>

#include <gtest/gtest.h>

namespace {

using marlo::security::Credentials;
using marlo::security::longestAuthorization;
using marlo::security::longestUserName;
using marlo::security::readBasic;

std::string encode(const std::string& text) {
    constexpr char alphabet[] = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
    std::string encoded;
    for (std::size_t at = 0; at < text.size(); at += 3) {
        unsigned bits = 0;
        for (std::size_t offset = 0; offset < 3; ++offset) {
            const std::size_t index = at + offset;
            bits = bits << 8U | (index < text.size() ? static_cast<unsigned char>(text[index]) : 0U);
        }
        for (std::size_t digit = 0; digit < 4; ++digit) {
            encoded += at + digit <= text.size() ? alphabet[bits >> (18 - 6 * digit) & 63U] : '=';
        }
    }
    return encoded;
}

std::string reasonFor(const std::string& value) {
    Credentials credentials;
    return std::string(readBasic(value, credentials));
}

TEST(BasicCredentials, AreANameAndAPassword) {
    Credentials credentials;
    EXPECT_EQ(readBasic("Basic QWxhZGRpbjpvcGVuIHNlc2FtZQ==", credentials), "");
    EXPECT_EQ(credentials.user, "Aladdin");
    EXPECT_EQ(credentials.password, "open sesame");
}

TEST(BasicCredentials, MayHaveColonsInThePassword) {
    Credentials credentials;
    EXPECT_EQ(readBasic("Basic " + encode("u:p:q:"), credentials), "");
    EXPECT_EQ(credentials.user, "u");
    EXPECT_EQ(credentials.password, "p:q:");
}

TEST(BasicCredentials, AreUtf8) {
    Credentials credentials;
    EXPECT_EQ(readBasic("Basic dGVzdDoxMjPCow==", credentials), "");
    EXPECT_EQ(credentials.password, "123\xC2\xA3");
    EXPECT_NE(reasonFor("Basic " + encode("test:123\xA3")), "");
    EXPECT_NE(reasonFor("Basic " + encode("te\xC0\xAFst:123")), "");
}

TEST(BasicCredentials, HaveASchemeInAnyCaseAndAnySpaces) {
    EXPECT_EQ(reasonFor("bAsIc " + encode("u:p")), "");
    EXPECT_EQ(reasonFor("Basic   " + encode("u:p")), "");
}

TEST(BasicCredentials, AreOfNoOtherScheme) {
    const std::string encoded = encode("u:p");
    for (const char* scheme : {"", "Basi", "Basics", "Digest", "Bearer", "Negotiate", "Basic\t"}) {
        EXPECT_EQ(reasonFor(scheme + std::string(" ") + encoded), "a scheme other than Basic") << scheme;
    }
    EXPECT_EQ(reasonFor(""), "a scheme other than Basic");
    EXPECT_EQ(reasonFor(encoded), "a scheme other than Basic");
}

TEST(BasicCredentials, AreStrictBase64) {
    EXPECT_EQ(reasonFor("Basic dTpw"), "");
    for (const char* encoded : {"", "=", "====", "dTpw=", "dTpw====", "dTp", "dTpwd", "dT=w", "dTp w", "dTpw ",
                                "dTp\n", "dT-_", "dTpwZR==", "dTpwZWU", "dTpwZWV=", "dTpw\xFF\xFF\xFF\xFF"}) {
        EXPECT_EQ(reasonFor(std::string("Basic ") + encoded), "credentials that are no Base64") << encoded;
    }
    EXPECT_EQ(reasonFor("Basic"), "credentials that are no Base64");
    EXPECT_EQ(reasonFor("Basic " + encode(std::string("u:p")) + ", realm=x"), "credentials that are no Base64");
}

TEST(BasicCredentials, HaveNoControlCharacters) {
    for (const std::string& text : {std::string("u\0:p", 4), std::string("u:p\0q", 5), std::string("u:p\n"),
                                    std::string("u\x7F:p"), std::string("u:\xC2\x85"), std::string("u\r\n:p")}) {
        EXPECT_EQ(reasonFor("Basic " + encode(text)), "credentials that are no UTF-8 or hold control characters");
    }
}

TEST(BasicCredentials, AreBothThere) {
    EXPECT_EQ(reasonFor("Basic " + encode("up")), "credentials without a colon");
    EXPECT_EQ(reasonFor("Basic " + encode(":p")), "a user name that is empty or too long");
    EXPECT_EQ(reasonFor("Basic " + encode("u:")), "an empty password");
}

TEST(BasicCredentials, HaveANameOfLimitedLength) {
    EXPECT_EQ(reasonFor("Basic " + encode(std::string(longestUserName, 'u') + ":p")), "");
    EXPECT_EQ(reasonFor("Basic " + encode(std::string(longestUserName + 1, 'u') + ":p")),
              "a user name that is empty or too long");
}

TEST(BasicCredentials, StandInAFieldOfLimitedLength) {
    const std::string encoded = encode("user:" + std::string(300, 'p') + "x");
    const std::string spaces(longestAuthorization - encoded.size() - 5, ' ');
    EXPECT_EQ(reasonFor("Basic" + spaces + encoded), "");
    EXPECT_EQ(reasonFor("Basic " + spaces + encoded), "an Authorization field that is too long");
}

} // namespace
