#include "Plan/Operators/XQueryScalarBody.h"

#include "Context/XQueryContextInternal.h"

#include <algorithm>
#include <array>

namespace xquery {

// Which object an answer is can be told: an argument, which the frame holds, or a literal is
// answered itself.
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
    slots[index] = XQueryScalar::ofValue(dynamic.variableForID(_parameters[index]));
  }
  Value made;
  const XQueryScalar answered = answer(slots.data(), made);
  if (Value literal = literalAnswered(answered, context)) return literal;
  if (Value value = XQueryScalarValue(answered)) return value;
  return plain().evaluateWithContext(context);
}

XQueryScalar XQueryScalarBody::answer(XQueryScalar* arguments, Value& made) const {
  if (_failures.load(std::memory_order_relaxed) >= mostFailures) return {};
  const bool areKnown = std::all_of(
      arguments, arguments + _parameters.size(),
      [](const XQueryScalar& argument) { return argument.form != XQueryScalar::Unknown; });
  bool outOfStack = false;
  XQueryScalar answer;
  if (areKnown) answer = _program->scalars.answer(_function, arguments, made, outOfStack);
  if (answer.form == XQueryScalar::Unknown) {
    _failures.fetch_add(outOfStack ? mostFailures : 1, std::memory_order_relaxed);
  }
  return answer;
}

}  // namespace xquery
