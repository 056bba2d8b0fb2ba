/**
 * @file
 * The cables of the virtual machine's network cards.
 */
#pragma once

#include <fstream>
#include <stdexcept>
#include <string>

namespace Orv::Test {

/**
 * Has tests/vm/boot, which is at the other end of a serial line, carry out a request; returns when that has been
 * done. Throws std::runtime_error when there is nobody who does it. One at a time.
 */
inline void askMachine(const std::string& request) {
    std::fstream line("/dev/ttyS1", std::ios::in | std::ios::out);
    line << request << std::endl;
    std::string answer;
    if (!std::getline(line, answer) || answer != "done") {
        throw std::runtime_error(request + ": " + answer);
    }
}

inline void pullCable(const std::string& card) {
    askMachine("cable " + card + " off");
}

inline void plugCable(const std::string& card) {
    askMachine("cable " + card + " on");
}

} // namespace Orv::Test
