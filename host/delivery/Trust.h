/**
 * @file
 * Whom to believe that a listener is who it says it is.
 */
#pragma once

#include "host/delivery/Delivery.h"

#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <utility>

using SSL_CTX = struct ssl_ctx_st;

namespace marlo::delivery {

/** A client's TLS settings: TLS 1.2 and up, no compression, no renegotiation. */
using TlsClient = std::shared_ptr<SSL_CTX>;

/** Shares what is read from one file of authorities among the destinations that use it. Any thread. */
class Trust {
  public:
    /** Throws std::invalid_argument that names the file and what is wrong with it. */
    TlsClient of(const Destination& destination);

  private:
    std::mutex _mutex;
    std::map<std::pair<bool, std::string>, std::weak_ptr<SSL_CTX>> _known;
};

} // namespace marlo::delivery
