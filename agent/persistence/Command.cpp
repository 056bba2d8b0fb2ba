#include "agent/persistence/Command.h"

#include "agent/config/Descriptor.h"
#include "agent/persistence/ProcessHandle.h"
#include "agent/text/Text.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <csignal>
#include <stdexcept>
#include <system_error>

#include <fcntl.h>
#include <spawn.h>
#include <sys/mman.h>
#include <sys/wait.h>
#include <unistd.h>

namespace Orv::Agent::Persistence {

namespace {

constexpr std::size_t keptOutput = 4096;
constexpr int firstInherited = 3; ///< descriptors from here on stay with this process

[[noreturn]] void fail(const std::string& what, int error) {
    throw std::system_error(error, std::generic_category(), what);
}

void require(int error, const std::string& what) {
    if (error != 0) {
        fail(what, error);
    }
}

/** What the child starts with. */
class SpawnSettings {
  public:
    SpawnSettings(int input, int output) {
        require(posix_spawn_file_actions_init(&_actions), "file actions");
        require(posix_spawnattr_init(&_attributes), "attributes");
        for (const auto& [from, to] : {std::pair{input, 0}, std::pair{output, 1}, std::pair{output, 2}}) {
            require(posix_spawn_file_actions_adddup2(&_actions, from, to), "file actions");
        }
        require(posix_spawn_file_actions_addclosefrom_np(&_actions, firstInherited), "file actions");
        sigset_t none;
        sigset_t all;
        sigemptyset(&none);
        sigfillset(&all);
        posix_spawnattr_setsigmask(&_attributes, &none);
        posix_spawnattr_setsigdefault(&_attributes, &all);
        posix_spawnattr_setpgroup(&_attributes, 0);
        posix_spawnattr_setflags(&_attributes,
                                 POSIX_SPAWN_SETSIGMASK | POSIX_SPAWN_SETSIGDEF | POSIX_SPAWN_SETPGROUP);
    }

    ~SpawnSettings() {
        posix_spawn_file_actions_destroy(&_actions);
        posix_spawnattr_destroy(&_attributes);
    }

    SpawnSettings(const SpawnSettings&) = delete;
    SpawnSettings& operator=(const SpawnSettings&) = delete;

    pid_t spawn(const std::vector<std::string>& arguments) const {
        std::vector<char*> vector;
        for (const std::string& argument : arguments) {
            vector.push_back(const_cast<char*>(argument.c_str())); // NOLINT: execve(2) does not write to them
        }
        vector.push_back(nullptr);
        std::string path = "PATH=/usr/local/sbin:/usr/local/bin:/usr/sbin:/usr/bin:/sbin:/bin";
        std::string language = "LC_ALL=C";
        const std::array<char*, 3> environment{path.data(), language.data(), nullptr};
        pid_t process = -1;
        require(posix_spawn(&process, vector.front(), &_actions, &_attributes, vector.data(), environment.data()),
                arguments.front() + ": cannot be run");
        return process;
    }

  private:
    posix_spawn_file_actions_t _actions{};
    posix_spawnattr_t _attributes{};
};

/** A descriptor to read the text from; memory, so that no reader is waited for. */
Descriptor inputOf(const std::string& text) {
    Descriptor input(::memfd_create("input", MFD_CLOEXEC));
    if (!input || ::pwrite(input.number(), text.data(), text.size(), 0) != static_cast<ssize_t>(text.size())) {
        fail("input of a command", errno);
    }
    return input;
}

/** The child's output is a file in memory, too: a daemon that keeps it open holds nobody up. */
std::string outputIn(const Descriptor& file) {
    const off_t size = ::lseek(file.number(), 0, SEEK_END);
    const off_t begin = std::max<off_t>(0, size - static_cast<off_t>(keptOutput));
    std::string text(static_cast<std::size_t>(std::max<off_t>(size, 0) - begin), '\0');
    const ssize_t count = ::pread(file.number(), text.data(), text.size(), begin);
    text.resize(static_cast<std::size_t>(std::max<ssize_t>(count, 0)));
    return text;
}

/** The exit status; 0 where the process that loads us takes its children's statuses for itself. */
int reap(pid_t process) {
    int status = 0;
    while (::waitpid(process, &status, 0) < 0) {
        if (errno != EINTR) {
            return 0;
        }
    }
    return WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
}

} // namespace

std::string CommandResult::lastLine() const {
    const std::size_t end = output.find_last_not_of(" \r\n");
    if (end == std::string::npos) {
        return {};
    }
    const std::size_t before = output.rfind('\n', end);
    const std::size_t begin = before == std::string::npos ? 0 : before + 1;
    return cleanText(output.substr(begin, end + 1 - begin));
}

CommandResult runCommand(const std::vector<std::string>& arguments, std::chrono::milliseconds patience,
                         const std::string& input) {
    const Descriptor in = inputOf(input);
    // O_APPEND, so that the two streams, and a daemon's later lines, do not write over each other.
    const Descriptor out = inputOf("");
    if (::fcntl(out.number(), F_SETFL, O_APPEND) != 0) {
        fail("output of a command", errno);
    }
    const pid_t process = SpawnSettings(in.number(), out.number()).spawn(arguments);
    const ProcessHandle handle(process);
    if (handle && !handle.awaitEnd(patience)) {
        ::kill(-process, SIGKILL);
        reap(process);
        throw std::runtime_error(arguments.front() + ": has not ended within " + std::to_string(patience.count()) +
                                 " ms: " + CommandResult{0, outputIn(out)}.lastLine());
    }
    const int status = reap(process);
    return {status, outputIn(out)};
}

void runOrThrow(const std::vector<std::string>& arguments, std::chrono::milliseconds patience,
                const std::string& input) {
    const CommandResult result = runCommand(arguments, patience, input);
    if (result.status != 0) {
        throw std::runtime_error(arguments.front() + ": failed with status " + std::to_string(result.status) + ": " +
                                 result.lastLine());
    }
}

} // namespace Orv::Agent::Persistence
