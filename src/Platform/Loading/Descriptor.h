// A file descriptor that is closed when it goes.
#pragma once

#include <unistd.h>
#include <utility>

namespace xquery {

class Descriptor {
 public:
  Descriptor() = default;
  explicit Descriptor(int number) : _number(number) {}
  Descriptor(Descriptor&& other) noexcept : _number(std::exchange(other._number, -1)) {}
  Descriptor& operator=(Descriptor&& other) noexcept {
    std::swap(_number, other._number);
    return *this;
  }
  ~Descriptor() {
    if (_number >= 0) ::close(_number);
  }
  bool isOpen() const { return _number >= 0; }
  int number() const { return _number; }

 private:
  int _number = -1;
};

}  // namespace xquery
