#include "agent/config/TextFile.h"

#include "agent/config/Descriptor.h"

#include <cerrno>
#include <ctime>
#include <optional>
#include <system_error>
#include <utility>

#include <fcntl.h>
#include <sys/stat.h>

namespace Orv::Agent {

namespace {

constexpr std::int64_t nanosecondsPerSecond = 1'000'000'000;
constexpr std::int64_t stampStep = 100'000'000; ///< well above the steps in which any kernel's file times advance
constexpr int maximumAttempts = 10;

[[noreturn]] void fail(const std::string& path, int error) {
    throw std::system_error(error, std::generic_category(), path + ": cannot be read");
}

std::int64_t nanoseconds(const timespec& time) {
    return time.tv_sec * nanosecondsPerSecond + time.tv_nsec;
}

std::int64_t now() {
    timespec time{};
    ::clock_gettime(CLOCK_REALTIME, &time);
    return nanoseconds(time);
}

FileStamp stampFrom(const struct stat& status) {
    return {status.st_dev, status.st_ino, status.st_size, nanoseconds(status.st_mtim), nanoseconds(status.st_ctim)};
}

FileStamp stampOf(const Descriptor& file, const std::string& path) {
    struct stat status {};

    if (::fstat(file.number(), &status) != 0) {
        fail(path, errno);
    }
    if (!S_ISREG(status.st_mode)) {
        fail(path, S_ISDIR(status.st_mode) ? EISDIR : EINVAL);
    }
    return stampFrom(status);
}

std::string readAll(const Descriptor& file, std::size_t expected, const std::string& path) {
    std::string text(expected + 1, '\0'); // one more, so that the end is met without growing
    std::size_t length = 0;
    for (;;) {
        const ssize_t count =
            ::pread(file.number(), text.data() + length, text.size() - length, static_cast<off_t>(length));
        if (count < 0 && errno != EINTR) {
            fail(path, errno);
        }
        if (count == 0) {
            text.resize(length);
            return text;
        }
        length += count > 0 ? static_cast<std::size_t>(count) : 0;
        if (length == text.size()) {
            text.resize(2 * length);
        }
    }
}

/** None when the file was written meanwhile. */
std::optional<TextFile> tryRead(const Descriptor& file, const std::string& path) {
    const std::int64_t start = now();
    const FileStamp stamp = stampOf(file, path);
    std::string text = readAll(file, static_cast<std::size_t>(stamp.size), path);
    if (stampOf(file, path) != stamp || text.size() != static_cast<std::size_t>(stamp.size)) {
        return std::nullopt;
    }
    return TextFile{std::move(text), stamp, start - stamp.changed > stampStep};
}

} // namespace

FileStamp stampOf(const std::string& path) {
    struct stat status {};

    if (::stat(path.c_str(), &status) != 0) {
        fail(path, errno);
    }
    return stampFrom(status);
}

TextFile readTextFile(const std::string& path) {
    for (int attempt = 0; attempt < maximumAttempts; ++attempt) {
        // O_NONBLOCK: opening a FIFO must not wait for a writer. Opened anew each time: it may have been replaced.
        const Descriptor file(::open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK));
        if (!file) {
            fail(path, errno);
        }
        if (auto read = tryRead(file, path)) {
            return std::move(*read);
        }
    }
    fail(path, EBUSY);
}

} // namespace Orv::Agent
