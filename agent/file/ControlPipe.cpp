#include "agent/file/ControlPipe.h"

#include <array>
#include <cerrno>
#include <system_error>
#include <utility>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

namespace Orv::Agent {

namespace {

constexpr mode_t ownersAlone = 0600;

[[noreturn]] void fail(const std::string& path, int error, const char* what) {
    throw std::system_error(error, std::generic_category(), path + ": " + what);
}

bool isFifo(int descriptor) {
    struct stat status {};

    return ::fstat(descriptor, &status) == 0 && S_ISFIFO(status.st_mode);
}

} // namespace

ControlPipe::ControlPipe(const std::string& path) {
    if (::mkfifo(path.c_str(), ownersAlone) != 0 && errno != EEXIST) {
        fail(path, errno, "the control pipe cannot be made");
    }
    // For writing, too: a FIFO without a writer would be readable all the time.
    _descriptor = ::open(path.c_str(), O_RDWR | O_NONBLOCK | O_CLOEXEC | O_NOFOLLOW);
    if (_descriptor < 0) {
        fail(path, errno, "the control pipe cannot be opened");
    }
    if (!isFifo(_descriptor)) {
        ::close(_descriptor);
        fail(path, EEXIST, "the control pipe must be a FIFO");
    }
}

ControlPipe::~ControlPipe() {
    ::close(_descriptor);
}

std::vector<std::string> ControlPipe::lines() {
    std::vector<std::string> lines;
    std::array<char, 4096> buffer{};
    for (ssize_t length = 0; (length = ::read(_descriptor, buffer.data(), buffer.size())) > 0;) {
        for (ssize_t i = 0; i < length; ++i) {
            const char character = buffer.at(static_cast<std::size_t>(i));
            if (character == '\n') {
                lines.push_back(std::exchange(_rest, {}));
            } else if (_rest.size() < longestLine) {
                _rest += character;
            }
        }
    }
    return lines;
}

} // namespace Orv::Agent
