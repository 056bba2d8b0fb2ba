#include "agent/persistence/FileTransaction.h"

#include "agent/config/Descriptor.h"
#include "agent/config/TextFile.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdio>
#include <filesystem>
#include <iterator>
#include <stdexcept>
#include <system_error>
#include <utility>

#include <fcntl.h>
#include <sys/stat.h>
#include <sys/xattr.h>
#include <unistd.h>

namespace Orv::Agent::Persistence {

namespace {

constexpr int mostLinks = 40; ///< as the kernel follows them

[[noreturn]] void fail(const std::string& path, const std::string& what, int error = errno) {
    throw std::system_error(error, std::generic_category(), path + ": " + what);
}

/** The file behind a name: where its symbolic links lead, there or not. */
std::string targetOf(const std::string& path) {
    std::filesystem::path target = path;
    for (int links = 0; links < mostLinks; ++links) {
        std::error_code notALink;
        const std::filesystem::path next = std::filesystem::read_symlink(target, notALink);
        if (notALink) {
            return target.string();
        }
        target = target.parent_path() / next;
    }
    fail(path, "cannot be followed", ELOOP);
}

std::string directoryOf(const std::string& path) {
    const std::string directory = std::filesystem::path(path).parent_path();
    return directory.empty() ? "." : directory;
}

void requireContent(const std::string& path, const std::optional<std::string>& expected) {
    if (contentOf(path) != expected) {
        throw std::runtime_error(path + ": has been changed by somebody else meanwhile");
    }
}

/** Names in directories are files, too: they are safe only when the directory is. */
void syncDirectory(const std::string& path) {
    const Descriptor directory(::open(path.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (!directory || ::fsync(directory.number()) != 0) {
        fail(path, "cannot be synchronised");
    }
}

/** A file beside its target that is gone when this ends, unless it has taken the target's place. */
class TemporaryFile {
  public:
    explicit TemporaryFile(std::string target) : _target(std::move(target)) {
        // Neither a pattern of interfaces(5) nor a unit directory takes up a name with a dot in front.
        const std::filesystem::path path = _target;
        _name = directoryOf(_target) + "/." + path.filename().string() + ".XXXXXX";
        _file = Descriptor(::mkostemp(_name.data(), O_CLOEXEC));
        if (!_file) {
            const int error = errno;
            _name.clear();
            fail(_target, "cannot be written", error);
        }
    }

    ~TemporaryFile() {
        if (!_name.empty()) {
            ::unlink(_name.c_str());
        }
    }

    TemporaryFile(const TemporaryFile&) = delete;
    TemporaryFile& operator=(const TemporaryFile&) = delete;

    void write(std::string_view content) {
        while (!content.empty()) {
            const ssize_t count = ::write(_file.number(), content.data(), content.size());
            if (count < 0 && errno != EINTR) {
                fail(_target, "cannot be written");
            }
            content.remove_prefix(count > 0 ? static_cast<std::size_t>(count) : 0);
        }
    }

    /** Takes over owner, mode and extended attributes, access control lists among them, of a file that is there. */
    void resemble(const std::string& path) {
        struct stat status {};

        if (::stat(path.c_str(), &status) != 0) {
            fail(path, "cannot be examined");
        }
        // The owner first: a change of it clears bits of the mode.
        if (::fchown(_file.number(), status.st_uid, status.st_gid) != 0) {
            fail(path, "its owner cannot be kept");
        }
        setMode(status.st_mode & 07777U);
        copyAttributes(path);
    }

    void setMode(mode_t mode) {
        if (::fchmod(_file.number(), mode) != 0) {
            fail(_target, "its mode cannot be set");
        }
    }

    void sync() {
        if (::fsync(_file.number()) != 0 || !_file.close()) {
            fail(_target, "cannot be synchronised");
        }
    }

    void takePlace(bool ofNothing) {
        const unsigned flags = ofNothing ? RENAME_NOREPLACE : 0;
        if (::renameat2(AT_FDCWD, _name.c_str(), AT_FDCWD, _target.c_str(), flags) != 0) {
            fail(_target, "cannot be replaced");
        }
        _name.clear();
    }

  private:
    void copyAttributes(const std::string& path) const {
        std::array<char, 4096> names{};
        const ssize_t length = ::listxattr(path.c_str(), names.data(), names.size());
        const char* const end = names.data() + std::max<ssize_t>(length, 0);
        for (const char* name = names.data(); name < end; name += std::string_view(name).size() + 1) {
            std::array<char, 4096> value{};
            const ssize_t size = ::getxattr(path.c_str(), name, value.data(), value.size());
            // What the kernel labels by itself may not be for us to set.
            if (size >= 0 &&
                ::fsetxattr(_file.number(), name, value.data(), static_cast<std::size_t>(size), 0) != 0 &&
                std::string_view(name).starts_with("system.")) {
                fail(path, std::string("its ") + name + " cannot be kept");
            }
        }
    }

    std::string _target;
    std::string _name;
    Descriptor _file;
};

void removeFile(const std::string& target) {
    if (::unlink(target.c_str()) != 0) {
        fail(target, "cannot be removed");
    }
}

void writeFile(const std::string& target, const FileEdit& edit) {
    TemporaryFile file(target);
    file.write(*edit.after);
    if (edit.before) {
        file.resemble(target);
    } else {
        file.setMode(edit.mode);
    }
    file.sync();
    requireContent(target, edit.before);
    file.takePlace(!edit.before);
}

mode_t modeOf(const std::string& path, mode_t otherwise) {
    struct stat status {};

    return ::stat(path.c_str(), &status) == 0 ? status.st_mode & 07777U : otherwise;
}

/** Makes the edit; returns it as it is to be taken back from. */
FileEdit make(const FileEdit& edit) {
    FileEdit made = edit;
    made.path = targetOf(edit.path);
    made.mode = modeOf(made.path, edit.mode);
    if (edit.after) {
        writeFile(made.path, edit);
    } else {
        requireContent(made.path, edit.before);
        removeFile(made.path);
    }
    return made;
}

/** Makes the directories on the way to a path that are not there; appends them. */
void makeDirectories(const std::string& directory, std::vector<std::string>& made) {
    if (std::filesystem::is_directory(directory)) {
        return;
    }
    makeDirectories(directoryOf(directory), made);
    if (::mkdir(directory.c_str(), 0755) == 0) {
        made.push_back(directory);
        syncDirectory(directoryOf(directory));
    } else if (errno != EEXIST) {
        fail(directory, "cannot be made");
    }
}

FileEdit opposite(const FileEdit& edit) {
    return {edit.path, edit.after, edit.before, edit.mode};
}

} // namespace

std::optional<std::string> contentOf(const std::string& path) {
    try {
        return readTextFile(path).text;
    } catch (const std::system_error& error) {
        if (error.code() == std::errc::no_such_file_or_directory) {
            return std::nullopt;
        }
        throw;
    }
}

FileTransaction::~FileTransaction() {
    try {
        revert();
    } catch (const std::exception&) {
        // Whoever needs to know calls revert().
    }
}

void FileTransaction::apply(const FileEdits& edits) {
    const std::size_t files = _applied.size();
    const std::size_t directories = _directories.size();
    try {
        for (const FileEdit& edit : edits) {
            if (edit.before == edit.after) {
                continue;
            }
            if (edit.after) {
                makeDirectories(directoryOf(targetOf(edit.path)), _directories);
            }
            _applied.push_back(make(edit));
            syncDirectory(directoryOf(_applied.back().path));
        }
    } catch (const std::exception&) {
        std::string ignored;
        takeBack(files, directories, ignored);
        throw;
    }
}

void FileTransaction::takeBack(std::size_t files, std::size_t directories, std::string& failures) {
    while (_applied.size() > files) {
        try {
            make(opposite(_applied.back()));
            syncDirectory(directoryOf(_applied.back().path));
        } catch (const std::exception& failure) {
            failures += (failures.empty() ? "" : "; ") + std::string(failure.what());
        }
        _applied.pop_back();
    }
    while (_directories.size() > directories) {
        ::rmdir(_directories.back().c_str()); // what somebody has put something into stays
        _directories.pop_back();
    }
}

void FileTransaction::revert() {
    std::string failures;
    takeBack(0, 0, failures);
    if (!failures.empty()) {
        throw std::runtime_error(failures);
    }
}

} // namespace Orv::Agent::Persistence
