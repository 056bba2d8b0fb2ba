/**
 * @file
 * The owner of a file descriptor.
 */
#pragma once

#include <utility>

#include <unistd.h>

namespace Orv::Agent {

/** Closes its descriptor when it ends. A number below 0, what a failed call gave, owns nothing. */
class Descriptor {
  public:
    Descriptor() = default;

    explicit Descriptor(int number) : _number(number) {}

    Descriptor(Descriptor&& other) noexcept : _number(std::exchange(other._number, -1)) {}

    Descriptor& operator=(Descriptor&& other) noexcept {
        std::swap(_number, other._number);
        return *this;
    }

    Descriptor(const Descriptor&) = delete;
    Descriptor& operator=(const Descriptor&) = delete;

    ~Descriptor() {
        if (_number >= 0) {
            ::close(_number);
        }
    }

    [[nodiscard]] int number() const { return _number; }

    explicit operator bool() const { return _number >= 0; }

    /** Closes now; false with errno when the kernel reports that something written has been lost. */
    bool close() { return ::close(std::exchange(_number, -1)) == 0; }

  private:
    int _number = -1;
};

} // namespace Orv::Agent
