/**
 * @file
 * A program that runs beside the test.
 */
#pragma once

#include <chrono>
#include <map>
#include <string>
#include <vector>

#include <sys/types.h>

namespace marlo::test {

/** Killed at the end, where it still runs. */
class Process {
  public:
    /**
     * Starts a program in a directory; `environment` adds to this process's. Its standard error goes to `errorFile`.
     * `prepare` runs in the child before the program does, with nothing but what is safe after fork.
     */
    Process(const std::vector<std::string>& arguments, const std::map<std::string, std::string>& environment,
            const std::string& directory, const std::string& errorFile, void (*prepare)() = nullptr);
    ~Process();
    Process(const Process&) = delete;
    Process& operator=(const Process&) = delete;

    [[nodiscard]] pid_t id() const { return _id; }

    /** Reads standard output up to the end of a line that contains `text`, or of all; all that was read so far. */
    std::string readUntil(const std::string& text);

    void signal(int number) const;

    /** Its exit status, 128 plus the signal that ended it, or -1 when it still runs after that time. */
    int wait(std::chrono::milliseconds patience);

    [[nodiscard]] bool isRunning();

  private:
    pid_t _id = -1;
    int _output = -1;
    int _status = -1;
    bool _hasEnded = false;
    std::string _read;
};

} // namespace marlo::test
