// The value of a stream, as it is put together from those of its records.
//
// No arithmetic of its own: an aggregate is a fold from the left, so that it is carried on by the
// function itself, called with what it has answered so far in front of the items of the record.
// What is kept between records is a value apart from the document, which is gone by then.
#pragma once

#include "Engine/Streams/XQueryStreamProgram.h"
#include "Functions/XQueryValueSet.h"
#include "xquery/XQuery.h"

#include <cstdint>
#include <functional>
#include <vector>

namespace xquery {

class XQueryStreamFolding {
 public:
  // Takes an item of the result; false ends the stream.
  using Emit = std::function<bool(const Value& item)>;

  XQueryStreamFolding(const XQueryStreamProgram& program, XQueryContext& context, Emit emit)
      : _program(program), _context(context), _emit(std::move(emit)) {}

  // What a record came to; never null. False where nothing behind it matters. After an error the
  // context is failing.
  bool add(const Value& value);
  // At the end. Null after an error, and empty where all items have been emitted.
  Value result();

 private:
  bool emitAll(const Value& value);
  bool emitPart(const Value& value);
  bool emitDistinct(const Value& value);
  Value withFormer(const Value& value) const;
  bool carryOn(const Value& value);
  bool addToAverage(const Value& value);
  bool count(const Value& value, bool endsAtFirst);
  bool decide(const Value& value, bool deciding);

  const XQueryStreamProgram& _program;
  XQueryContext& _context;
  const Emit _emit;
  uint64_t _count = 0;  // of the items so far
  Value _value;         // that they come to; null before the first one
  XQueryValueSet _met;
  std::vector<Value> _distinct;
};

}  // namespace xquery
