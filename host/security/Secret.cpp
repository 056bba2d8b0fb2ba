#include "host/security/Secret.h"

#include "host/security/Gatekeeper.h"

#include <cstdint>
#include <stdexcept>

#include <openssl/crypto.h>
#include <openssl/evp.h>
#include <openssl/hmac.h>
#include <openssl/rand.h>

namespace marlo::security {

namespace {

void fillRandom(unsigned char* bytes, std::size_t count) {
    if (RAND_bytes(bytes, static_cast<int>(count)) != 1) {
        throw std::runtime_error("the system has no random numbers");
    }
}

} // namespace

void wipe(std::string& text) {
    text.resize(text.capacity());
    OPENSSL_cleanse(text.data(), text.size());
    text.clear();
}

Digester::Digester() {
    fillRandom(_key.data(), _key.size());
}

Digester::~Digester() {
    OPENSSL_cleanse(_key.data(), _key.size());
}

Digest Digester::of(std::initializer_list<std::string_view> texts) const {
    std::string joined;
    std::size_t size = 0;
    for (const std::string_view text : texts) {
        size += text.size() + sizeof(std::uint64_t);
    }
    joined.reserve(size); // no copy is left behind by growing
    for (const std::string_view text : texts) {
        const std::uint64_t length = text.size();
        joined.append(reinterpret_cast<const char*>(&length), sizeof length).append(text);
    }
    Digest digest{};
    unsigned written = 0;
    const unsigned char* made =
        HMAC(EVP_sha256(), _key.data(), static_cast<int>(_key.size()),
             reinterpret_cast<const unsigned char*>(joined.data()), joined.size(), digest.data(), &written);
    wipe(joined);
    if (made == nullptr || written != digest.size()) {
        throw std::runtime_error("SHA-256 is not available");
    }
    return digest;
}

bool equal(const Digest& one, const Digest& other) {
    return CRYPTO_memcmp(one.data(), other.data(), one.size()) == 0;
}

std::string makePassword() {
    constexpr std::string_view characters = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789";
    constexpr std::size_t length = 22; // 62^22 > 2^128
    constexpr std::size_t fair = 256 / characters.size() * characters.size();
    std::string password;
    password.reserve(length);
    while (password.size() < length) {
        unsigned char byte = 0;
        fillRandom(&byte, 1);
        if (byte < fair) {
            password += characters[byte % characters.size()];
        }
    }
    return password;
}

} // namespace marlo::security
