#include "tests/http/TlsClient.h"

#include <array>
#include <cstdlib>
#include <stdexcept>

#include <openssl/ssl.h>
#include <openssl/x509.h>
#include <sys/socket.h>
#include <sys/time.h>

namespace marlo::http {

Certificates::Certificates() {
    std::string name = (std::filesystem::temp_directory_path() / "certificates.XXXXXX").string();
    if (::mkdtemp(name.data()) == nullptr) {
        throw std::runtime_error("cannot make " + name);
    }
    _directory = name;
}

Certificates::~Certificates() {
    std::filesystem::remove_all(_directory);
}

void Certificates::openssl(const std::string& arguments) const {
    const std::string command = "cd " + _directory.string() + " && openssl " + arguments + " 2>> log";
    if (std::system(command.c_str()) != 0) {
        throw std::runtime_error(command);
    }
}

void Certificates::make(const std::string& name, const std::string& subject) {
    openssl("req -x509 -newkey ec -pkeyopt ec_paramgen_curve:P-256 -nodes -days 2 -subj '" + subject + "' -keyout " +
            name + ".key -out " + name + ".pem");
}

void Certificates::issue(const std::string& name, const std::string& subject, const std::string& issuer) {
    openssl("req -x509 -newkey ec -pkeyopt ec_paramgen_curve:P-256 -nodes -days 2 -subj '" + subject + "' -CA " +
            issuer + ".pem -CAkey " + issuer + ".key -keyout " + name + ".key -out " + name + ".pem");
}

void TlsClient::Free::operator()(SSL* ssl) const {
    SSL_free(ssl);
}

void TlsClient::Free::operator()(SSL_CTX* context) const {
    SSL_CTX_free(context);
}

TlsClient::TlsClient(const Endpoint& endpoint, const Certificates& certificates, const Options& options)
    : _socket(RawClient::connectTo(endpoint)), _context(SSL_CTX_new(TLS_client_method())) {
    const timeval patience{20, 0};
    ::setsockopt(_socket.descriptor(), SOL_SOCKET, SO_RCVTIMEO, &patience, sizeof(patience));
    SSL_CTX_set_security_level(_context.get(), 0); // so that what is refused is refused by the server
    if (options.newest != 0) {
        SSL_CTX_set_min_proto_version(_context.get(), TLS1_VERSION);
        SSL_CTX_set_max_proto_version(_context.get(), options.newest);
    }
    if (!options.ciphers.empty()) {
        SSL_CTX_set_cipher_list(_context.get(), options.ciphers.c_str());
    }
    if (!options.certificate.empty()) {
        const std::string name = certificates.file(options.certificate);
        SSL_CTX_use_certificate_file(_context.get(), (name + ".pem").c_str(), SSL_FILETYPE_PEM);
        SSL_CTX_use_PrivateKey_file(_context.get(), (name + ".key").c_str(), SSL_FILETYPE_PEM);
    }
    _ssl.reset(SSL_new(_context.get()));
    SSL_set_fd(_ssl.get(), _socket.descriptor());
    _isConnected = SSL_connect(_ssl.get()) == 1;
}

bool TlsClient::send(const std::string& bytes) {
    return SSL_write(_ssl.get(), bytes.data(), static_cast<int>(bytes.size())) == static_cast<int>(bytes.size());
}

std::string TlsClient::read(std::size_t atLeast) {
    std::string text;
    std::array<char, 16384> bytes{};
    while (text.size() < atLeast) {
        const int count = SSL_read(_ssl.get(), bytes.data(), static_cast<int>(bytes.size()));
        if (count <= 0) {
            break;
        }
        text.append(bytes.data(), static_cast<std::size_t>(count));
    }
    return text;
}

std::string TlsClient::version() const {
    return SSL_get_version(_ssl.get());
}

std::string TlsClient::cipher() const {
    return SSL_get_cipher_name(_ssl.get());
}

std::string TlsClient::serverName() const {
    X509* certificate = SSL_get0_peer_certificate(_ssl.get());
    std::array<char, 256> name{};
    X509_NAME_get_text_by_NID(X509_get_subject_name(certificate), NID_commonName, name.data(), name.size());
    return name.data();
}

bool TlsClient::renegotiate() {
    return SSL_renegotiate(_ssl.get()) == 1 && SSL_do_handshake(_ssl.get()) == 1;
}

} // namespace marlo::http
