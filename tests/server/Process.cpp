#include "tests/server/Process.h"

#include <array>
#include <csignal>
#include <stdexcept>
#include <thread>

#include <fcntl.h>
#include <sys/wait.h>
#include <unistd.h>

namespace marlo::test {

namespace {

constexpr int CannotStart = 127;

std::vector<char*> pointers(const std::vector<std::string>& texts) {
    std::vector<char*> result;
    result.reserve(texts.size() + 1);
    for (const std::string& text : texts) {
        result.push_back(const_cast<char*>(text.c_str()));
    }
    result.push_back(nullptr);
    return result;
}

/** This process's environment with some variables more. */
std::vector<std::string> environmentWith(std::map<std::string, std::string> more) {
    std::vector<std::string> result;
    for (char** entry = environ; *entry != nullptr; ++entry) {
        const std::string text = *entry;
        if (more.find(text.substr(0, text.find('='))) == more.end()) {
            result.push_back(text);
        }
    }
    for (const auto& [name, value] : more) {
        result.push_back(name + "=" + value);
    }
    return result;
}

} // namespace

Process::Process(const std::vector<std::string>& arguments, const std::map<std::string, std::string>& environment,
                 const std::string& directory, const std::string& errorFile, void (*prepare)()) {
    const std::vector<std::string> variables = environmentWith(environment);
    const std::vector<char*> argv = pointers(arguments);
    const std::vector<char*> envp = pointers(variables);
    std::array<int, 2> ends{};
    const int errors = ::open(errorFile.c_str(), O_WRONLY | O_CREAT | O_APPEND | O_CLOEXEC, 0600);
    if (::pipe2(ends.data(), O_CLOEXEC) != 0 || errors < 0) {
        throw std::runtime_error("no pipe, or no file for errors");
    }
    _output = ends[0];
    _id = ::fork();
    if (_id == 0) {
        const bool ready = ::dup2(ends[1], STDOUT_FILENO) >= 0 && ::dup2(errors, STDERR_FILENO) >= 0 &&
                           ::chdir(directory.c_str()) == 0;
        if (prepare != nullptr) {
            prepare();
        }
        if (ready) {
            ::execvpe(argv[0], argv.data(), envp.data());
        }
        ::_exit(CannotStart);
    }
    ::close(ends[1]);
    ::close(errors);
}

Process::~Process() {
    if (isRunning()) {
        ::kill(_id, SIGKILL);
        ::waitpid(_id, nullptr, 0);
    }
    ::close(_output);
}

std::string Process::readUntil(const std::string& text) {
    std::array<char, 4096> buffer{};
    for (;;) {
        const std::size_t found = _read.find(text);
        if (found != std::string::npos && _read.find('\n', found) != std::string::npos) {
            return _read;
        }
        const ssize_t count = ::read(_output, buffer.data(), buffer.size());
        if (count <= 0) {
            return _read;
        }
        _read.append(buffer.data(), static_cast<std::size_t>(count));
    }
}

void Process::signal(int number) const {
    ::kill(_id, number);
}

int Process::wait(std::chrono::milliseconds patience) {
    constexpr std::chrono::milliseconds step(5);
    constexpr int signalBase = 128;
    const auto end = std::chrono::steady_clock::now() + patience;
    while (!_hasEnded) {
        int status = 0;
        if (::waitpid(_id, &status, WNOHANG) == _id) {
            _hasEnded = true;
            _status = WIFEXITED(status) ? WEXITSTATUS(status) : signalBase + WTERMSIG(status);
        } else if (std::chrono::steady_clock::now() > end) {
            return -1;
        } else {
            std::this_thread::sleep_for(step);
        }
    }
    return _status;
}

bool Process::isRunning() {
    return wait(std::chrono::milliseconds(0)) == -1;
}

} // namespace marlo::test
