/**
 * @file
 * An open descriptor that has one owner.
 */
#pragma once

#include <utility>

#include <unistd.h>

namespace marlo::http {

class Descriptor {
  public:
    Descriptor() = default;

    explicit Descriptor(int number) : _number(number) {}

    ~Descriptor() { reset(); }

    Descriptor(Descriptor&& other) noexcept : _number(std::exchange(other._number, -1)) {}

    Descriptor& operator=(Descriptor&& other) noexcept {
        reset();
        _number = std::exchange(other._number, -1);
        return *this;
    }

    Descriptor(const Descriptor&) = delete;
    Descriptor& operator=(const Descriptor&) = delete;

    [[nodiscard]] int get() const { return _number; }

    [[nodiscard]] int release() { return std::exchange(_number, -1); }

  private:
    void reset() {
        if (_number >= 0) {
            ::close(std::exchange(_number, -1));
        }
    }

    int _number = -1;
};

} // namespace marlo::http
