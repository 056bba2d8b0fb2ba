#include "host/delivery/Trust.h"

#include "host/http/Tls.h"

#include <stdexcept>

#include <openssl/ssl.h>

namespace marlo::delivery {
namespace {

TlsClient make(const Destination& destination) {
    TlsClient made(SSL_CTX_new(TLS_client_method()), SSL_CTX_free);
    SSL_CTX* context = made.get();
    if (context == nullptr) {
        throw std::invalid_argument("TLS cannot be set up: " + http::takeTlsError());
    }
    SSL_CTX_set_min_proto_version(context, TLS1_2_VERSION);
    SSL_CTX_set_options(context, SSL_OP_NO_COMPRESSION | SSL_OP_NO_RENEGOTIATION);
    SSL_CTX_set_mode(context, SSL_MODE_RELEASE_BUFFERS);
    SSL_CTX_set_verify(context, destination.isVerified ? SSL_VERIFY_PEER : SSL_VERIFY_NONE, nullptr);
    const std::string& file = destination.authorityFile;
    const int result = !destination.isVerified ? 1
                       : file.empty()          ? SSL_CTX_set_default_verify_paths(context)
                                               : SSL_CTX_load_verify_locations(context, file.c_str(), nullptr);
    if (result != 1) {
        throw std::invalid_argument("cannot use the authorities in " +
                                    (file.empty() ? "the system's directory" : file) + ": " + http::takeTlsError());
    }
    return made;
}

} // namespace

TlsClient Trust::of(const Destination& destination) {
    const std::lock_guard lock(_mutex);
    auto& known = _known[{destination.isVerified, destination.isVerified ? destination.authorityFile : ""}];
    TlsClient shared = known.lock();
    if (!shared) {
        shared = make(destination);
        known = shared;
    }
    return shared;
}

} // namespace marlo::delivery
