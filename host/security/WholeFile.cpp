#include "host/security/WholeFile.h"

#include <array>
#include <cerrno>
#include <cstdlib>
#include <filesystem>
#include <system_error>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

namespace marlo::security {

namespace {

constexpr std::size_t largestFile = std::size_t{1} << 20;

[[noreturn]] void fail(const std::string& path, const char* what, int error = errno) {
    throw std::system_error(error, std::generic_category(), path + ": " + what);
}

class Descriptor {
  public:
    explicit Descriptor(int number) : _number(number) {}

    ~Descriptor() {
        if (_number >= 0) {
            ::close(_number);
        }
    }

    Descriptor(const Descriptor&) = delete;
    Descriptor& operator=(const Descriptor&) = delete;

    [[nodiscard]] int number() const { return _number; }

    [[nodiscard]] bool isOpen() const { return _number >= 0; }

  private:
    int _number;
};

/** Removes the temporary file unless it has got its name. */
class Temporary {
  public:
    explicit Temporary(const std::string& path) : _path(path), _name(path + ".XXXXXX") {}

    ~Temporary() {
        if (!_name.empty()) {
            ::unlink(_name.c_str());
        }
    }

    Temporary(const Temporary&) = delete;
    Temporary& operator=(const Temporary&) = delete;

    int make() {
        const int number = ::mkostemp(_name.data(), O_CLOEXEC); // mode 0600
        if (number < 0) {
            _name.clear();
            fail(_path, "no file can be made beside it");
        }
        return number;
    }

    void takePlace() {
        if (::rename(_name.c_str(), _path.c_str()) != 0) {
            fail(_path, "cannot be replaced");
        }
        _name.clear();
    }

  private:
    const std::string& _path;
    std::string _name;
};

void write(int file, std::string_view content, const std::string& path) {
    while (!content.empty()) {
        const ssize_t count = ::write(file, content.data(), content.size());
        if (count < 0 && errno != EINTR) {
            fail(path, "cannot be written");
        }
        content.remove_prefix(count > 0 ? static_cast<std::size_t>(count) : 0);
    }
}

void synchronise(int file, const std::string& path) {
    if (::fsync(file) != 0) {
        fail(path, "cannot be synchronised");
    }
}

} // namespace

void writeWhole(const std::string& path, std::string_view content, mode_t mode) {
    Temporary temporary(path);
    {
        const Descriptor file(temporary.make());
        write(file.number(), content, path);
        if (::fchmod(file.number(), mode) != 0) {
            fail(path, "its mode cannot be set");
        }
        synchronise(file.number(), path);
    }
    temporary.takePlace();
    const std::string parent = std::filesystem::path(path).parent_path().string();
    const Descriptor directory(::open(parent.empty() ? "." : parent.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (!directory.isOpen()) {
        fail(parent, "cannot be opened");
    }
    synchronise(directory.number(), parent);
}

void makeDirectory(const std::string& path) {
    const std::filesystem::path parent = std::filesystem::path(path).parent_path();
    if (::mkdir(path.c_str(), 0700) == 0 || errno == EEXIST) {
        return;
    }
    if (errno != ENOENT || parent.empty() || parent == path) {
        fail(path, "cannot be made");
    }
    makeDirectory(parent.string());
    if (::mkdir(path.c_str(), 0700) != 0 && errno != EEXIST) {
        fail(path, "cannot be made");
    }
}

std::string readWhole(const std::string& path) {
    // Not to wait for a writer, should it be a pipe.
    const Descriptor file(::open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK | O_NOCTTY));
    if (!file.isOpen()) {
        fail(path, "cannot be opened");
    }

    struct stat status {};

    if (::fstat(file.number(), &status) != 0) {
        fail(path, "cannot be examined");
    }
    if (!S_ISREG(status.st_mode)) {
        fail(path, "is no regular file", EINVAL);
    }
    std::string content;
    std::array<char, 4096> piece{};
    for (;;) {
        const ssize_t count = ::read(file.number(), piece.data(), piece.size());
        if (count < 0 && errno != EINTR) {
            fail(path, "cannot be read");
        }
        if (count == 0) {
            return content;
        }
        content.append(piece.data(), count > 0 ? static_cast<std::size_t>(count) : 0);
        if (content.size() > largestFile) {
            fail(path, "is too long", EFBIG);
        }
    }
}

} // namespace marlo::security
