#include "agent/linux/HostFiles.h"

#include <algorithm>
#include <ctime>
#include <iterator>
#include <memory>
#include <system_error>

#include <dirent.h>
#include <glob.h>
#include <sys/stat.h>

namespace Orv::Agent::Linux {

namespace {

constexpr std::int64_t nanosecondsPerSecond = 1'000'000'000;

/** File times advance in steps; two changes within one step may look the same. */
constexpr std::int64_t timeStep = nanosecondsPerSecond / 10;

std::int64_t nanoseconds(const timespec& time) {
    return time.tv_sec * nanosecondsPerSecond + time.tv_nsec;
}

/** As stampOf, but what is absent is no exception: most of the files that are looked for do not exist. */
std::optional<FileStamp> stampIfThere(const std::string& path) {
    struct stat status {};

    if (stat(path.c_str(), &status) != 0) {
        return std::nullopt;
    }
    return FileStamp{status.st_dev, status.st_ino, status.st_size, nanoseconds(status.st_mtim),
                     nanoseconds(status.st_ctim)};
}

bool isSettled(const FileStamp& stamp) {
    timespec now{};
    clock_gettime(CLOCK_REALTIME, &now);
    return nanoseconds(now) - std::max(stamp.modified, stamp.changed) > timeStep;
}

std::optional<std::string> contentOf(const std::string& path, const std::optional<FileStamp>& stamp) {
    if (!stamp || stamp->size > static_cast<off_t>(HostFiles::largestFile)) {
        return std::nullopt;
    }
    try {
        return readTextFile(path).text;
    } catch (const std::system_error&) {
        return std::nullopt;
    }
}

} // namespace

std::string pathIn(std::string directory, const std::string& name) {
    directory += '/';
    directory += name;
    return directory;
}

std::optional<FileStamp> HostFiles::look(const std::string& path) {
    // Before the reading, so that a change during it shows.
    std::string place = _root + path;
    const std::optional<FileStamp> stamp = stampIfThere(place);
    _seen.try_emplace(std::move(place), Sight{stamp, !stamp || isSettled(*stamp)});
    return stamp;
}

std::optional<std::string> HostFiles::read(const std::string& path) {
    const std::optional<FileStamp> stamp = look(path);
    return contentOf(_root + path, stamp);
}

std::string HostFiles::peek(const std::string& path) const {
    return contentOf(_root + path, stampIfThere(_root + path)).value_or("");
}

std::vector<std::string> HostFiles::list(const std::string& path) {
    look(path);
    std::vector<std::string> names;
    const std::unique_ptr<DIR, int (*)(DIR*)> directory(opendir((_root + path).c_str()), closedir);
    while (directory && names.size() < mostEntries) {
        const dirent* entry = readdir(directory.get());
        if (entry == nullptr) {
            break;
        }
        const std::string name = entry->d_name;
        if (name != "." && name != "..") {
            names.push_back(name);
        }
    }
    std::sort(names.begin(), names.end());
    return names;
}

std::vector<std::string> HostFiles::expand(const std::string& pattern) {
    // A file that comes into being changes the directory in which it lies.
    look(pattern.substr(0, pattern.rfind('/')));
    std::vector<std::string> paths;
    glob_t found{};
    if (glob((_root + pattern).c_str(), 0, nullptr, &found) == 0) {
        const std::size_t count = std::min<std::size_t>(found.gl_pathc, mostEntries);
        std::transform(found.gl_pathv, found.gl_pathv + count, std::back_inserter(paths),
                       [&](const char* path) { return std::string(path).substr(_root.size()); });
    }
    globfree(&found);
    return paths;
}

bool HostFiles::isMask(const std::string& path) {
    look(path);

    struct stat status {};

    return stat((_root + path).c_str(), &status) == 0 && (S_ISCHR(status.st_mode) || status.st_size == 0);
}

bool HostFiles::changed() const {
    return std::any_of(_seen.begin(), _seen.end(), [](const auto& entry) {
        const auto& [path, sight] = entry;
        return !sight.settled || stampIfThere(path) != sight.stamp;
    });
}

} // namespace Orv::Agent::Linux
