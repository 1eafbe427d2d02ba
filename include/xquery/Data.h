// Immutable bytes.
#pragma once

#include "xquery/Object.h"

#include <algorithm>
#include <string>
#include <string_view>

namespace xquery {

class XQUERY_EXPORT NSData : public NSCounted {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::Data; }
  // Copies, or takes over, the bytes.
  [[nodiscard]] static Ref<NSData> dataWithBytes(std::string bytes) {
    return make<NSData>(std::move(bytes));
  }

  size_t length() const { return _bytes.size(); }
  std::string_view bytes() const { return _bytes; }
  // The bytes from `from`, at most `count` of them; none from behind the end.
  [[nodiscard]] Ref<NSData> subdataWithRange(size_t from, size_t count) const {
    return dataWithBytes(_bytes.substr(std::min(from, _bytes.size()), count));
  }
  bool isEqualToData(const NSData& other) const { return _bytes == other._bytes; }

 protected:
  explicit NSData(std::string bytes);
  ~NSData() override;
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  std::string _bytes;
};

}  // namespace xquery
