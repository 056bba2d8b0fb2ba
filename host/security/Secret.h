/**
 * @file
 * Handling of passwords in memory: what is kept of them, how they are compared, how they go away.
 */
#pragma once

#include <array>
#include <cstddef>
#include <initializer_list>
#include <string>
#include <string_view>

namespace marlo::security {

/** Overwrites a text that held a secret, its spare capacity included, and leaves it empty. */
void wipe(std::string& text);

/** What is kept of a secret: worthless without the key of the process that it was made with. */
using Digest = std::array<unsigned char, 32>;

/**
 * Makes digests with a random key of its own (HMAC-SHA-256). All digests have one length, and comparing them takes
 * the same time wherever they differ.
 */
class Digester {
  public:
    /** Throws std::runtime_error when the system has no random numbers. */
    Digester();
    ~Digester();
    Digester(const Digester&) = delete;
    Digester& operator=(const Digester&) = delete;

    /** Of several texts; what belongs to which of them makes a difference. */
    [[nodiscard]] Digest of(std::initializer_list<std::string_view> texts) const;

  private:
    Digest _key{};
};

/** In a time that does not depend on what they hold. */
bool equal(const Digest& one, const Digest& other);

} // namespace marlo::security
