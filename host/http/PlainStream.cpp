#include "host/http/Stream.h"

#include <cerrno>

#include <sys/socket.h>

namespace marlo::http {
namespace {

Transfer outcome(ssize_t count, Progress blocked) {
    if (count >= 0) {
        return {Progress::done, static_cast<std::size_t>(count)};
    }
    const bool isBlocked = errno == EAGAIN || errno == EWOULDBLOCK || errno == EINTR;
    return {isBlocked ? blocked : Progress::failed, 0};
}

class PlainStream : public Stream {
  public:
    explicit PlainStream(int descriptor) : _descriptor(descriptor) {}

    Progress handshake() override { return Progress::done; }

    Transfer read(char* into, std::size_t size) override {
        const ssize_t count = ::recv(_descriptor, into, size, MSG_DONTWAIT);
        return count == 0 ? Transfer{Progress::ended, 0} : outcome(count, Progress::wantRead);
    }

    Transfer write(std::string_view bytes) override {
        return outcome(::send(_descriptor, bytes.data(), bytes.size(), MSG_DONTWAIT | MSG_NOSIGNAL),
                       Progress::wantWrite);
    }

    [[nodiscard]] bool hasPending() const override { return false; }

    void finish() override { ::shutdown(_descriptor, SHUT_WR); }

    [[nodiscard]] std::optional<std::string> commonName() const override { return std::nullopt; }

    [[nodiscard]] std::string problem() const override { return {}; }

  private:
    int _descriptor;
};

} // namespace

std::unique_ptr<Stream> makePlainStream(int descriptor) {
    return std::make_unique<PlainStream>(descriptor);
}

} // namespace marlo::http
