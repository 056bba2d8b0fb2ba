/**
 * @file
 * A process of a test's own, for what a process does to itself for good.
 */
#pragma once

#include <array>
#include <cerrno>
#include <exception>
#include <functional>
#include <string>
#include <system_error>

#include <sys/wait.h>
#include <unistd.h>

namespace marlo::test {

/** Runs `work` in a forked process and returns the text that it returns, or what it threw after "threw: ". */
inline std::string inChild(const std::function<std::string()>& work) {
    std::array<int, 2> ends{};
    if (pipe(ends.data()) != 0) {
        throw std::system_error(errno, std::generic_category(), "pipe");
    }
    const pid_t child = fork();
    if (child == 0) {
        std::string text;
        try {
            text = work();
        } catch (const std::exception& error) {
            text = std::string("threw: ") + error.what();
        }
        const ssize_t written = write(ends[1], text.data(), text.size());
        _exit(written == static_cast<ssize_t>(text.size()) ? 0 : 1);
    }
    close(ends[1]);
    std::string text;
    std::array<char, 1024> piece{};
    for (ssize_t count = 0; (count = read(ends[0], piece.data(), piece.size())) > 0;) {
        text.append(piece.data(), static_cast<std::size_t>(count));
    }
    close(ends[0]);
    int status = 0;
    waitpid(child, &status, 0);
    return WIFEXITED(status) && WEXITSTATUS(status) == 0 ? text : text + " (ended badly)";
}

} // namespace marlo::test
