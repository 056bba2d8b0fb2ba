#include "host/delivery/Trust.h"

#include "host/http/Tls.h"

#include <stdexcept>

#include <openssl/ssl.h>
#include <sys/stat.h>

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

/** All zeros for no file. */
Trust::Stamp Trust::stampOf(const std::string& file) {
    struct stat status {};

    if (file.empty() || ::stat(file.c_str(), &status) != 0) {
        return {};
    }
    return {static_cast<std::int64_t>(status.st_dev), static_cast<std::int64_t>(status.st_ino), status.st_size,
            status.st_mtim.tv_sec, status.st_mtim.tv_nsec};
}

TlsClient Trust::of(const Destination& destination) {
    const std::string file = destination.isVerified ? destination.authorityFile : "";
    const Stamp stamp = stampOf(file); // before it is read: a later one has another stamp
    const std::lock_guard lock(_mutex);
    Known& known = _known[{destination.isVerified, file}];
    TlsClient shared = known.client.lock();
    if (!shared || known.stamp != stamp) {
        shared = make(destination);
        known = {stamp, shared};
    }
    return shared;
}

} // namespace marlo::delivery
