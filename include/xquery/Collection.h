// Arrays and the shared null object.
#pragma once

#include "xquery/Object.h"

#include <vector>

namespace xquery {

// The empty sequence: one shared object.
class XQUERY_EXPORT NSNull : public NSCounted {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::Null; }
  static NSNull* null();

 private:
  NSNull() : NSCounted(Kind::Null) {}
};

// An ordered list of objects; owns a reference to each element.
//
//   auto names = NSArray::arrayWithObjects({NSString::stringWithASCII("a")});
//   for (const Value& name : names->objects()) use(*cast<NSString>(name));
class XQUERY_EXPORT NSArray : public NSCounted {
 public:
  static bool classof(const NSObject& object) {
    return object.kind() == Kind::Array || object.kind() == Kind::Sequence;
  }

  [[nodiscard]] static Ref<NSArray> array() { return make<NSArray>(); }
  [[nodiscard]] static Ref<NSArray> arrayWithObjects(std::vector<Value> objects) {
    return make<NSArray>(std::move(objects));
  }

  size_t count() const { return _objects.size(); }
  // Null for an index at or past the end.
  NSObject* objectAtIndex(size_t index) const {
    return index < _objects.size() ? _objects[index].get() : nullptr;
  }
  const std::vector<Value>& objects() const { return _objects; }
  std::vector<Value>& objects() { return _objects; }

 protected:
  NSArray() : NSCounted(Kind::Array) {}
  explicit NSArray(std::vector<Value> objects)
      : NSCounted(Kind::Array), _objects(std::move(objects)) {}
  explicit NSArray(Kind kind) : NSCounted(kind) {}
  ~NSArray() override;
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

  std::vector<Value> _objects;
};

}  // namespace xquery
