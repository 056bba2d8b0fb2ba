/**
 * @file
 * Running programs of the host.
 */
#pragma once

#include <chrono>
#include <string>
#include <vector>

namespace Orv::Agent::Persistence {

/** What a command came to. */
struct CommandResult {
    int status = 0;     ///< exit status; 128 and the signal's number when a signal ended it
    std::string output; ///< the end of what it wrote to its standard output and error streams, as it is

    /** The last line of the output, clean. */
    [[nodiscard]] std::string lastLine() const;
};

/**
 * Runs a program and waits for its end; a daemon that it leaves behind is not waited for. `arguments` begins with the
 * path; no shell is involved. The program gets `input` to read, a bare environment, no signals blocked, and none of
 * this process's descriptors. It runs in the calling thread's network namespace, as a process group of its own, all
 * of which is killed when it has not ended in time.
 *
 * Throws std::system_error when it cannot be started, std::runtime_error when it takes longer than `patience`.
 */
CommandResult runCommand(const std::vector<std::string>& arguments, std::chrono::milliseconds patience,
                         const std::string& input = {});

/** As above, but throws std::runtime_error with the last line that it wrote when it does not exit with 0. */
void runOrThrow(const std::vector<std::string>& arguments, std::chrono::milliseconds patience,
                const std::string& input = {});

} // namespace Orv::Agent::Persistence
