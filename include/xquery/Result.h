// What an operation answers that can fail: a value, or the error that says why there is none.
//
//   const auto price = XQueryMakeDecimal(text);
//   if (!price) return report(price.error()->description()->utf8());
//   use(*price);
#pragma once

#include "xquery/Error.h"
#include "xquery/Object.h"

#include <concepts>
#include <cstdlib>
#include <optional>
#include <type_traits>
#include <utility>

namespace xquery {

// Owns its value, or a share of its error. Whoever calls such an operation looks at the result:
// leaving it lie is a warning of the compiler.
template <class T>
class [[nodiscard]] XQueryResult {
 public:
  template <class U = T>
  requires(std::convertible_to<U, T> && !std::same_as<std::remove_cvref_t<U>, XQueryResult> &&
           !std::convertible_to<U, Ref<XQueryError>>) XQueryResult(U&& value)
      : _value(std::forward<U>(value)) {}
  // `error` must not be null.
  XQueryResult(Ref<XQueryError> error) : _error(std::move(error)) {}

  // Whether there is a value.
  explicit operator bool() const { return _value.has_value(); }
  // The value. Only where there is one: asking a failure for it ends the program.
  const T& operator*() const& { return held(*this); }
  T& operator*() & { return held(*this); }
  T&& operator*() && { return std::move(held(*this)); }
  const T* operator->() const { return &held(*this); }
  T* operator->() { return &held(*this); }
  // The value, or the one given where there is none.
  T valueOr(T other) const& { return _value ? *_value : std::move(other); }
  T valueOr(T other) && { return _value ? *std::move(_value) : std::move(other); }
  // Null where there is a value.
  const Ref<XQueryError>& error() const { return _error; }

 private:
  template <class Self>
  static auto& held(Self& self) {
    if (!self._value) std::abort();
    return *self._value;
  }

  std::optional<T> _value;
  Ref<XQueryError> _error;
};

// Of an operation that answers nothing but whether it was done.
template <>
class [[nodiscard]] XQueryResult<void> {
 public:
  XQueryResult() = default;
  // `error` must not be null.
  XQueryResult(Ref<XQueryError> error) : _error(std::move(error)) {}

  explicit operator bool() const { return !_error; }
  // Null where it was done.
  const Ref<XQueryError>& error() const { return _error; }

 private:
  Ref<XQueryError> _error;
};

}  // namespace xquery
