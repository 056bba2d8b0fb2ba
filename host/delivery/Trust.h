/**
 * @file
 * Whom to believe that a listener is who it says it is.
 */
#pragma once

#include "host/delivery/Delivery.h"

#include <array>
#include <cstdint>
#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <utility>

using SSL_CTX = struct ssl_ctx_st;

namespace marlo::delivery {

/** A client's TLS settings: TLS 1.2 and up, no compression, no renegotiation. */
using TlsClient = std::shared_ptr<SSL_CTX>;

/**
 * Shares what is read from one file of authorities among the destinations that use it, for as long as the file is
 * the same. Any thread.
 */
class Trust {
  public:
    /** Throws std::invalid_argument that names the file and what is wrong with it. */
    TlsClient of(const Destination& destination);

  private:
    /** Which file, where and of when: one that is written anew, or replaced, has another one. */
    using Stamp = std::array<std::int64_t, 5>;

    struct Known {
        Stamp stamp{};
        std::weak_ptr<SSL_CTX> client;
    };

    static Stamp stampOf(const std::string& file);

    std::mutex _mutex;
    std::map<std::pair<bool, std::string>, Known> _known;
};

} // namespace marlo::delivery
