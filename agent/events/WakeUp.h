/**
 * @file
 * Waking a thread that polls.
 */
#pragma once

namespace Orv::Agent {

/** An eventfd(2). Every operation from any thread. Throws std::system_error when there is none to be had. */
class WakeUp {
  public:
    WakeUp();
    ~WakeUp();
    WakeUp(const WakeUp&) = delete;
    WakeUp& operator=(const WakeUp&) = delete;

    /** Readable from a signal() until the next clear(). */
    [[nodiscard]] int descriptor() const { return _descriptor; }

    void signal() const noexcept;
    void clear() const noexcept;

  private:
    int _descriptor;
};

} // namespace Orv::Agent
