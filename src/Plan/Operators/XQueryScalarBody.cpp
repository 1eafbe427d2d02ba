#include "Plan/Operators/XQueryScalarBody.h"

#include "Context/XQueryContextInternal.h"
#include "Types/XQueryNumber.h"

#include <algorithm>
#include <array>

namespace xquery {

// An object unless there is no more to it than whether it is true.
XQueryScalar XQueryScalarBody::scalarOf(const NSObject* argument) {
  if (argument == NSNumber::trueValue()) return XQueryScalar::ofTruth(true);
  if (argument == NSNumber::falseValue()) return XQueryScalar::ofTruth(false);
  return isa<XQueryNumber>(argument) ? XQueryScalar::ofObject(argument) : XQueryScalar();
}

// Null where it is not known. Which object an answer is can be told: an argument, which the frame
// holds, or a literal is answered itself.
Value XQueryScalarBody::valueOf(const XQueryScalar& answer, XQueryContext& context) const {
  switch (answer.form) {
    case XQueryScalar::Integer:
      return XQueryNumber::integerWithInt64(answer.integer);
    case XQueryScalar::Double:
      return XQueryNumber::numberWithDouble(answer.number);
    case XQueryScalar::Truth:
      return NSNumber::numberWithBool(answer.truth);
    case XQueryScalar::Object:
      if (Value literal = literalAnswered(answer, context)) return literal;
      return const_cast<NSObject*>(answer.object);
    case XQueryScalar::Unknown:
      break;
  }
  return {};
}

Value XQueryScalarBody::literalAnswered(const XQueryScalar& answer, XQueryContext& context) const {
  if (answer.form != XQueryScalar::Object) return {};
  for (const auto& literal : _program->literals) {
    if (literal->literalValue() == answer.object) return literal->computeValue(context);
  }
  return {};
}

Value XQueryScalarBody::computeValue(XQueryContext& context) const {
  auto& dynamic = _internal(context);
  // A profile counts what is evaluated.
  if (dynamic.profile()) return plain().evaluateWithContext(context);
  std::array<XQueryScalar, XQueryScalarProgram::mostSlots> slots;
  for (size_t index = 0; index < _parameters.size(); ++index) {
    slots[index] = scalarOf(dynamic.variableForID(_parameters[index]));
  }
  if (Value value = valueOf(answer(slots.data()), context)) return value;
  return plain().evaluateWithContext(context);
}

XQueryScalar XQueryScalarBody::answer(XQueryScalar* arguments) const {
  if (_failures.load(std::memory_order_relaxed) >= mostFailures) return {};
  const bool areKnown = std::all_of(
      arguments, arguments + _parameters.size(),
      [](const XQueryScalar& argument) { return argument.form != XQueryScalar::Unknown; });
  bool outOfStack = false;
  XQueryScalar answer;
  if (areKnown) answer = _program->scalars.answer(_function, arguments, outOfStack);
  if (answer.form == XQueryScalar::Unknown) {
    _failures.fetch_add(outOfStack ? mostFailures : 1, std::memory_order_relaxed);
  }
  return answer;
}

}  // namespace xquery
