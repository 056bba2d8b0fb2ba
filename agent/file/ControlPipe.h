/**
 * @file
 * A FIFO through which a described host is told what shall happen to it.
 */
#pragma once

#include <string>
#include <vector>

namespace Orv::Agent {

/** Reads lines of text from a FIFO. One thread at a time. */
class ControlPipe {
  public:
    static constexpr std::size_t longestLine = 4096;

    /**
     * Makes the FIFO at `path`, for this user alone, where there is none, and opens it; it is left there in the end,
     * so that who writes waits for the next reader. Throws std::system_error that names it, also when there is
     * something else at the path.
     */
    explicit ControlPipe(const std::string& path);
    ~ControlPipe();
    ControlPipe(const ControlPipe&) = delete;
    ControlPipe& operator=(const ControlPipe&) = delete;

    /** Becomes readable when there is something to read. */
    [[nodiscard]] int descriptor() const { return _descriptor; }

    /** The lines that have come so far, without their ends; of a line that is too long the rest is dropped. */
    std::vector<std::string> lines();

  private:
    int _descriptor = -1;
    std::string _rest; ///< of a line whose end has not come
};

} // namespace Orv::Agent
