// The host's callbacks and what they are given.
#pragma once

#include "xquery/capi/basics.h"

#include <memory>
#include <utility>

namespace xquery::capi {

// A pointer of the host's, with what is to be called when nobody will use it again.
class HostData {
 public:
  HostData(void* data, xq_destroy destroy) : _data(data), _destroy(destroy) {}
  HostData(HostData&& other) noexcept
      : _data(other._data), _destroy(std::exchange(other._destroy, nullptr)) {}
  HostData& operator=(HostData&& other) noexcept {
    std::swap(_data, other._data);
    std::swap(_destroy, other._destroy);
    return *this;
  }
  ~HostData() {
    if (_destroy) _destroy(_data);
  }

  void* get() const { return _data; }

 private:
  void* _data;
  xq_destroy _destroy;
};

}  // namespace xquery::capi
