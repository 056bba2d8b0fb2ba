/**
 * @file
 * A client of TLS, and certificates to try it with.
 */
#pragma once

#include "host/http/Server.h"
#include "tests/http/RawClient.h"

#include <filesystem>
#include <memory>
#include <string>

using SSL = struct ssl_st;
using SSL_CTX = struct ssl_ctx_st;

namespace marlo::http {

/** Certificates in files, made by openssl(1) for as long as this exists. */
class Certificates {
  public:
    Certificates();
    ~Certificates();
    Certificates(const Certificates&) = delete;
    Certificates& operator=(const Certificates&) = delete;

    /** A certificate that vouches for itself, as "<name>.pem" and "<name>.key". */
    void make(const std::string& name, const std::string& subject);
    /** One that `issuer`, made before, vouches for. */
    void issue(const std::string& name, const std::string& subject, const std::string& issuer);

    [[nodiscard]] std::string file(const std::string& name) const { return (_directory / name).string(); }

    /** A server's, of this name. */
    [[nodiscard]] TlsOptions server(const std::string& name) const {
        return {file(name + ".pem"), file(name + ".key"), "", false};
    }

  private:
    void openssl(const std::string& arguments) const;

    std::filesystem::path _directory;
};

class TlsClient {
  public:
    struct Options {
        int newest = 0;          ///< version of TLS; 0: any
        std::string ciphers;     ///< of TLS 1.2
        std::string certificate; ///< name of one in `certificates`
        bool mayRenegotiate = false;
    };

    TlsClient(const Endpoint& endpoint, const Certificates& certificates, const Options& options);

    /** Whether the server accepts: in TLS 1.3 a refusal of the client's certificate comes with the first read. */
    [[nodiscard]] bool isConnected() const { return _isConnected; }

    bool send(const std::string& bytes);
    /** All that comes until the server ends, or so many bytes have come. */
    std::string read(std::size_t atLeast);
    [[nodiscard]] std::string version() const;
    [[nodiscard]] std::string cipher() const;
    /** Of the certificate that the server showed. */
    [[nodiscard]] std::string serverName() const;
    bool renegotiate();

  private:
    struct Free {
        void operator()(SSL* ssl) const;
        void operator()(SSL_CTX* context) const;
    };

    RawClient _socket;
    std::unique_ptr<SSL_CTX, Free> _context;
    std::unique_ptr<SSL, Free> _ssl;
    bool _isConnected = false;
};

} // namespace marlo::http
