// Where the expressions of a program stand in its text.
//
// An expression remembers one number, that of its place; the places of all modules of a program lie
// in one table, eight bytes each, which is looked at when an error is told and never before:
//
//   module 0    text, no URL        places 1 .. 17
//   module 1    text, its URL       places 18 .. 40
//
// The text of a module is read to its end before that of the next one, so the modules follow each
// other. Places count characters from the start of the module's text, in which a carriage return
// with or without a line feed is one character and a byte order mark at the start is none. A table
// does not change once its program has been compiled; errors keep it alive.
#pragma once

#include "Platform/Base/WorkMeter.h"
#include "xquery/Error.h"
#include "xquery/Object.h"
#include "xquery/String.h"

#include <cstdint>
#include <optional>
#include <vector>

namespace xquery {

// The number of a place; 0 for none.
using XQueryPlaceNumber = uint32_t;

// Characters from the first one to behind the last one.
struct XQuerySpan {
  uint32_t start = 0;
  uint32_t end = 0;
  bool operator==(const XQuerySpan&) const = default;
};

class XQueryPlaces : public NSCounted {
 public:
  [[nodiscard]] static Ref<XQueryPlaces> places();

  // From here on places are those of this text; the URL may be null.
  void beginModule(Ref<NSString> text, Ref<NSString> URL);
  XQueryPlaceNumber add(XQuerySpan span);
  void change(XQueryPlaceNumber place, XQuerySpan span) { _spans[place - 1] = span; }
  // Nothing for 0.
  XQuerySpan span(XQueryPlaceNumber place) const;
  std::optional<XQuerySourcePlace> place(XQueryPlaceNumber place) const;

 protected:
  XQueryPlaces() : NSCounted(Kind::Internal) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  struct Module {
    XQueryPlaceNumber first;
    Ref<NSString> text;
    Ref<NSString> URL;
  };
  friend class XQueryPlaceCursor;

  // Of a place that there is.
  const Module* moduleOf(XQueryPlaceNumber place) const;

  std::vector<Module> _modules;
  std::vector<XQuerySpan, ValueAllocator<XQuerySpan>> _spans;
};

// Finds the lines of places. Asked for places of one text in the order in which they begin, it
// reads that text once.
class XQueryPlaceCursor {
 public:
  explicit XQueryPlaceCursor(const XQueryPlaces& places) : _places(places) {}

  // Goes to the start of the place. False for 0, and the cursor stays.
  bool goTo(XQueryPlaceNumber place);
  // Both from 1.
  int64_t line() const { return _line; }
  int64_t column() const { return _column; }
  // The text of the line, without its end.
  Ref<NSString> sourceLine() const;

 private:
  const XQueryPlaces& _places;
  const XQueryPlaces::Module* _module = nullptr;
  uint32_t _characters = 0;  // before it
  uint32_t _at = 0;          // the unit, and that in which its line begins
  uint32_t _lineStart = 0;
  int64_t _line = 1;
  int64_t _column = 1;
};

}  // namespace xquery
