/**
 * @file
 * Programs that check from outside what was made here.
 */
#pragma once

#include <array>
#include <cstdio>
#include <stdexcept>
#include <string>

#include <sys/wait.h>

namespace marlo::test {

/** What a command prints, on both streams, and "exit N" behind it unless it ends in success. */
inline std::string shell(const std::string& command) {
    const std::string line = "exec 2>&1; " + command;
    FILE* stream = popen(line.c_str(), "re");
    if (stream == nullptr) {
        throw std::runtime_error(command);
    }
    std::string output;
    std::array<char, 1024> piece{};
    while (const std::size_t count = fread(piece.data(), 1, piece.size(), stream)) {
        output.append(piece.data(), count);
    }
    const int status = pclose(stream);
    return status == 0 ? output : output + "exit " + std::to_string(WEXITSTATUS(status));
}

} // namespace marlo::test
