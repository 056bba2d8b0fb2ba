#include "host/cli/Output.h"

#include "host/cli/Text.h"

#include <cerrno>
#include <charconv>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

#include <sys/ioctl.h>
#include <unistd.h>

namespace marlo::cli {

OutputError::OutputError(int error)
    : std::runtime_error(std::string("cannot write the output: ") + strerror(error)), _readerIsGone(error == EPIPE) {}

void Output::write(std::string_view text) noexcept {
    if (_error == 0 && fwrite(text.data(), 1, text.size(), stdout) != text.size()) {
        _error = errno;
    }
}

void Output::finish() {
    if (_error == 0 && fflush(stdout) != 0) {
        _error = errno;
    }
    if (_error != 0) {
        throw OutputError(_error);
    }
}

std::size_t terminalWidth() {
    winsize size{};
    if (isatty(STDOUT_FILENO) == 0) {
        return 0;
    }
    if (ioctl(STDOUT_FILENO, TIOCGWINSZ, &size) == 0 && size.ws_col > 0) {
        return size.ws_col;
    }
    constexpr std::size_t Usual = 80; // a terminal that does not tell
    return Usual;
}

bool showsColours() {
    const char* const noColour = getenv("NO_COLOR");
    const char* const terminal = getenv("TERM");
    return isatty(STDOUT_FILENO) != 0 && (noColour == nullptr || *noColour == '\0') && terminal != nullptr &&
           strcmp(terminal, "dumb") != 0;
}

void complain(std::string_view text) {
    const std::string line = "marlo: " + makePrintable(text) + "\n";
    static_cast<void>(fwrite(line.data(), 1, line.size(), stderr)); // nowhere is left to say that it failed
}

} // namespace marlo::cli
