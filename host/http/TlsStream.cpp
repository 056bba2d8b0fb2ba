#include "host/http/Stream.h"
#include "host/http/Tls.h"

#include <algorithm>
#include <cerrno>
#include <climits>
#include <new>
#include <utility>

#include <openssl/bio.h>
#include <openssl/err.h>
#include <openssl/ssl.h>
#include <openssl/x509.h>
#include <sys/socket.h>

namespace marlo::http {
namespace {

/** OpenSSL's own socket BIO writes with write(2), which raises SIGPIPE when the client has gone. */
namespace socketBio {

int descriptorOf(BIO* bio) {
    return static_cast<int>(reinterpret_cast<std::intptr_t>(BIO_get_data(bio))); // NOLINT: a number in a pointer
}

bool isBlocked() {
    return errno == EAGAIN || errno == EWOULDBLOCK || errno == EINTR;
}

int read(BIO* bio, char* into, int size) {
    BIO_clear_retry_flags(bio);
    const ssize_t count = ::recv(descriptorOf(bio), into, static_cast<std::size_t>(size), MSG_DONTWAIT);
    if (count < 0 && isBlocked()) {
        BIO_set_retry_read(bio);
    }
    return static_cast<int>(count);
}

int write(BIO* bio, const char* bytes, int size) {
    BIO_clear_retry_flags(bio);
    const ssize_t count =
        ::send(descriptorOf(bio), bytes, static_cast<std::size_t>(size), MSG_DONTWAIT | MSG_NOSIGNAL);
    if (count < 0 && isBlocked()) {
        BIO_set_retry_write(bio);
    }
    return static_cast<int>(count);
}

long control(BIO* /*bio*/, int command, long /*number*/, void* /*pointer*/) {
    return command == BIO_CTRL_FLUSH ? 1 : 0;
}

struct FreeMethod {
    void operator()(BIO_METHOD* method) const { BIO_meth_free(method); }
};

BIO_METHOD* method() {
    static const std::unique_ptr<BIO_METHOD, FreeMethod> made = [] {
        std::unique_ptr<BIO_METHOD, FreeMethod> fresh(
            BIO_meth_new(BIO_get_new_index() | BIO_TYPE_SOURCE_SINK, "socket without signals"));
        BIO_meth_set_read(fresh.get(), read);
        BIO_meth_set_write(fresh.get(), write);
        BIO_meth_set_ctrl(fresh.get(), control);
        return fresh;
    }();
    return made.get();
}

BIO* make(int descriptor) {
    BIO* bio = BIO_new(method());
    if (bio == nullptr) {
        throw std::bad_alloc();
    }
    BIO_set_data(bio, reinterpret_cast<void*>(static_cast<std::intptr_t>(descriptor))); // NOLINT: as read back above
    BIO_set_init(bio, 1);
    return bio;
}

} // namespace socketBio

struct FreeSsl {
    void operator()(SSL* ssl) const { SSL_free(ssl); }
};

struct FreeCertificate {
    void operator()(X509* certificate) const { X509_free(certificate); }
};

/** Nothing where there is none, or where it hides a NUL that would cut it short for others. */
std::optional<std::string> commonNameOf(const X509* certificate) {
    X509_NAME* subject = X509_get_subject_name(certificate);
    const int index = X509_NAME_get_index_by_NID(subject, NID_commonName, -1);
    if (index < 0 || X509_NAME_get_index_by_NID(subject, NID_commonName, index) >= 0) {
        return std::nullopt; // two of them would be a matter of choice
    }
    unsigned char* text = nullptr;
    const int size = ASN1_STRING_to_UTF8(&text, X509_NAME_ENTRY_get_data(X509_NAME_get_entry(subject, index)));
    if (size < 0) {
        return std::nullopt;
    }
    std::string name(reinterpret_cast<const char*>(text), static_cast<std::size_t>(size)); // NOLINT: UTF-8
    OPENSSL_free(text);
    const bool isGood = !name.empty() && name.find('\0') == std::string::npos;
    return isGood ? std::optional(std::move(name)) : std::nullopt;
}

class TlsStream : public Stream {
  public:
    TlsStream(int descriptor, std::shared_ptr<const TlsContext> context)
        : _descriptor(descriptor), _context(std::move(context)), _ssl(SSL_new(_context->get())) {
        if (!_ssl) {
            throw std::bad_alloc();
        }
        BIO* bio = socketBio::make(descriptor);
        SSL_set_bio(_ssl.get(), bio, bio);
        SSL_set_accept_state(_ssl.get());
    }

    Progress handshake() override {
        ERR_clear_error();
        const int result = SSL_do_handshake(_ssl.get());
        return result == 1 ? Progress::done : progressOf(result);
    }

    Transfer read(char* into, std::size_t size) override {
        ERR_clear_error();
        const int result = SSL_read(_ssl.get(), into, clamp(size));
        return result > 0 ? Transfer{Progress::done, static_cast<std::size_t>(result)}
                          : Transfer{progressOf(result), 0};
    }

    Transfer write(std::string_view bytes) override {
        ERR_clear_error();
        const int result = SSL_write(_ssl.get(), bytes.data(), clamp(bytes.size()));
        return result > 0 ? Transfer{Progress::done, static_cast<std::size_t>(result)}
                          : Transfer{progressOf(result), 0};
    }

    [[nodiscard]] bool hasPending() const override { return SSL_pending(_ssl.get()) > 0; }

    void finish() override {
        if (!_isBroken && SSL_is_init_finished(_ssl.get()) != 0) {
            ERR_clear_error();
            SSL_shutdown(_ssl.get());
        }
        ::shutdown(_descriptor, SHUT_WR);
    }

    [[nodiscard]] std::optional<std::string> commonName() const override {
        const std::unique_ptr<X509, FreeCertificate> certificate(SSL_get1_peer_certificate(_ssl.get()));
        if (!certificate || SSL_get_verify_result(_ssl.get()) != X509_V_OK) {
            return std::nullopt;
        }
        return commonNameOf(certificate.get());
    }

    [[nodiscard]] std::string problem() const override { return _problem; }

  private:
    static int clamp(std::size_t size) { return static_cast<int>(std::min<std::size_t>(size, INT_MAX)); }

    Progress progressOf(int result) {
        switch (SSL_get_error(_ssl.get(), result)) {
        case SSL_ERROR_WANT_READ:
            return Progress::wantRead;
        case SSL_ERROR_WANT_WRITE:
            return Progress::wantWrite;
        case SSL_ERROR_ZERO_RETURN:
            return Progress::ended;
        default: // and nothing may be asked of the connection any more, not even its end
            _isBroken = true;
            _problem = takeTlsError();
            return Progress::failed;
        }
    }

    int _descriptor;
    std::shared_ptr<const TlsContext> _context;
    std::unique_ptr<SSL, FreeSsl> _ssl;
    std::string _problem;
    bool _isBroken = false;
};

} // namespace

std::unique_ptr<Stream> makeTlsStream(int descriptor, std::shared_ptr<const TlsContext> context) {
    return std::make_unique<TlsStream>(descriptor, std::move(context));
}

} // namespace marlo::http
