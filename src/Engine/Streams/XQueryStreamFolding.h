// The value of a stream, as it is put together from those of its records.
//
// No arithmetic of its own: an aggregate is a fold from the left, so that it is carried on by the
// function itself, called with what it has answered so far in front of the items of the record.
// What is kept between records is a value apart from the document, which is gone by then.
#pragma once

#include "Engine/Streams/XQueryStreamProgram.h"
#include "Functions/XQueryValueSet.h"
#include "xquery/Error.h"
#include "xquery/XQuery.h"

#include <cstdint>
#include <functional>
#include <utility>
#include <vector>

namespace xquery {

class XQueryStreamFolding {
 public:
  // Takes an item of the result; false ends the stream.
  using Emit = std::function<bool(const Value& item)>;

  // Without a receiver of items all of them are in the result.
  XQueryStreamFolding(const XQueryStreamProgram::Part& part, XQueryContext& context, Emit emit)
      : _part(part), _context(context), _emit(std::move(emit)) {}

  const XQueryExpr& each() const { return *_part.each; }
  // What a record came to; never null. False where nothing behind it matters. After an error the
  // context is failing.
  bool add(const Value& value) { return !(_isDecided = !fold(value)); }
  bool isDecided() const { return _isDecided; }
  // It has failed, which is of no account unless somebody asks for the value.
  void setFailure(Ref<XQueryError> error) {
    _failure = std::move(error);
    _isDecided = true;
  }
  const Ref<XQueryError>& failure() const { return _failure; }
  bool isSure() const { return _part.isSure; }
  // At the end. Null after an error, and empty where all items have been emitted.
  Value result();

 private:
  bool fold(const Value& value);
  bool emitAll(const Value& value);
  bool emitPart(const Value& value);
  bool emitDistinct(const Value& value);
  Value allDistinct() const;
  Value withFormer(const Value& value) const;
  bool carryOn(const Value& value);
  bool addToAverage(const Value& value);
  bool count(const Value& value, bool endsAtFirst);
  bool decide(const Value& value, bool deciding);

  const XQueryStreamProgram::Part& _part;
  XQueryContext& _context;
  const Emit _emit;
  bool _isDecided = false;
  Ref<XQueryError> _failure;
  uint64_t _count = 0;  // of the items so far
  Value _value;         // that they come to; null before the first one
  XQueryValueSet _met;
  std::vector<Value> _distinct;
};

}  // namespace xquery
