/**
 * @file
 * TLS for the server's side: OpenSSL behind an opaque context.
 */
#pragma once

#include "host/http/Server.h"

#include <memory>

using SSL_CTX = struct ssl_ctx_st;

namespace marlo::http {

/**
 * A certificate, its key and whom to trust, as of one reading of their files. TLS 1.2 and up, forward secrecy and
 * authenticated encryption only, no compression, no renegotiation. Any thread.
 */
class TlsContext {
  public:
    /** Throws std::runtime_error that names the file and what is wrong with it. */
    explicit TlsContext(const TlsOptions& options);
    ~TlsContext();
    TlsContext(const TlsContext&) = delete;
    TlsContext& operator=(const TlsContext&) = delete;

    [[nodiscard]] SSL_CTX* get() const { return _context.get(); }

  private:
    struct Free {
        void operator()(SSL_CTX* context) const;
    };

    std::unique_ptr<SSL_CTX, Free> _context;
};

/** The first entry of OpenSSL's error queue of this thread, which is the cause of others; the queue is emptied. */
std::string takeTlsError();

} // namespace marlo::http
