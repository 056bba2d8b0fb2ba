#include "host/http/Tls.h"

#include <array>
#include <stdexcept>
#include <system_error>

#include <openssl/err.h>
#include <openssl/ssl.h>

namespace marlo::http {
namespace {

/** Of TLS 1.2; those of 1.3 are good as they are. */
constexpr const char* ciphers = "ECDHE+AESGCM:ECDHE+CHACHA20:!aNULL";

[[noreturn]] void refuse(const std::string& what, const std::string& file) {
    const std::string reason = takeTlsError();
    throw std::runtime_error("TLS: " + what + " " + file + ": " + (reason.empty() ? "unknown reason" : reason));
}

void loadIdentity(SSL_CTX* context, const TlsOptions& options) {
    if (SSL_CTX_use_certificate_chain_file(context, options.certificateFile.c_str()) != 1) {
        refuse("cannot use the certificate", options.certificateFile);
    }
    if (SSL_CTX_use_PrivateKey_file(context, options.keyFile.c_str(), SSL_FILETYPE_PEM) != 1) {
        refuse("cannot use the private key", options.keyFile);
    }
    if (SSL_CTX_check_private_key(context) != 1) {
        refuse("another certificate than " + options.certificateFile + " belongs to the key", options.keyFile);
    }
}

void loadTrust(SSL_CTX* context, const TlsOptions& options) {
    if (options.clientCaFile.empty()) {
        if (options.clientCertificate) {
            throw std::runtime_error("TLS: client certificates are required, and no file says whose are good");
        }
        return;
    }
    const char* file = options.clientCaFile.c_str();
    if (SSL_CTX_load_verify_locations(context, file, nullptr) != 1) {
        refuse("cannot use the client authorities", options.clientCaFile);
    }
    SSL_CTX_set_client_CA_list(context, SSL_load_client_CA_file(file));
    SSL_CTX_set_verify(context, SSL_VERIFY_PEER | (options.clientCertificate ? SSL_VERIFY_FAIL_IF_NO_PEER_CERT : 0),
                       nullptr);
}

} // namespace

std::string takeTlsError() {
    const unsigned long code = ERR_peek_error();
    ERR_clear_error();
    if (code == 0) {
        return {};
    }
    if (ERR_SYSTEM_ERROR(code)) { // for which there is no text since OpenSSL 3
        return std::generic_category().message(ERR_GET_REASON(code));
    }
    const char* reason = ERR_reason_error_string(code);
    if (reason != nullptr) {
        return reason;
    }
    std::array<char, 256> text{};
    ERR_error_string_n(code, text.data(), text.size());
    return text.data();
}

void TlsContext::Free::operator()(SSL_CTX* context) const {
    SSL_CTX_free(context);
}

TlsContext::TlsContext(const TlsOptions& options) : _context(SSL_CTX_new(TLS_server_method())) {
    SSL_CTX* context = _context.get();
    if (context == nullptr) {
        refuse("cannot be set up with", "this OpenSSL");
    }
    SSL_CTX_set_min_proto_version(context, TLS1_2_VERSION);
    SSL_CTX_set_cipher_list(context, ciphers);
    SSL_CTX_set_options(context, SSL_OP_NO_COMPRESSION | SSL_OP_NO_RENEGOTIATION | SSL_OP_CIPHER_SERVER_PREFERENCE);
    SSL_CTX_set_mode(context,
                     SSL_MODE_ENABLE_PARTIAL_WRITE | SSL_MODE_ACCEPT_MOVING_WRITE_BUFFER | SSL_MODE_RELEASE_BUFFERS);
    // Sessions with client certificates are resumed only where they were made.
    static constexpr std::array<unsigned char, 5> name{'m', 'a', 'r', 'l', 'o'};
    SSL_CTX_set_session_id_context(context, name.data(), name.size());
    loadIdentity(context, options);
    loadTrust(context, options);
}

TlsContext::~TlsContext() = default;

} // namespace marlo::http
