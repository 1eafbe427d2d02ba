#include "Plan/Profile/XQueryProfiledExpr.h"

#include "Context/XQueryContextInternal.h"
#include "Expr/XQuerySequence.h"
#include "xquery/XQuery.h"

namespace xquery {
namespace {

// From where the expression begins to where it is done, on every way out.
class Measured {
 public:
  Measured(XQueryProfileRecorder& profile, XQueryCounterID counter)
      : _profile(profile), _before(profile.enter(counter)) {}
  Measured(const Measured&) = delete;
  Measured& operator=(const Measured&) = delete;
  ~Measured() {
    if (!_isDone) _profile.leave(_before, 0, true);
  }

  void leave(uint64_t items, bool hasFailed) {
    _isDone = true;
    _profile.leave(_before, items, hasFailed);
  }
  void leaveUncounted() {
    _isDone = true;
    _profile.leaveUncounted(_before);
  }

 private:
  XQueryProfileRecorder& _profile;
  const XQueryProfileRecorder::Position _before;
  bool _isDone = false;
};

}  // namespace

XQueryProfiledExpr::XQueryProfiledExpr(Ref<XQueryExpr> plain, XQueryCounterID counter)
    : XQueryPlannedExpr(plain),
      _operator(dyn_cast<XQueryPlannedExpr>(plain.get())),
      _question(_operator ? _operator->nodeQuestion() : nullptr),
      _counter(counter) {}

Value XQueryProfiledExpr::computeValue(XQueryContext& context) const {
  Measured measured(*_internal(context).profile(), _counter);
  Value value = plain().evaluateWithContext(context);
  measured.leave(XQueryItemList(value.get()).count(), XQueryHasFailed(value, context));
  return value;
}

// Where there is no answer the expression is evaluated, which counts then.
std::optional<bool> XQueryProfiledExpr::holdsFor(NSXMLNode* node,
                                                 const XQueryContext& context) const {
  Measured measured(*_internal(context).profile(), _counter);
  const std::optional<bool> answer = _question->holdsFor(node, context);
  if (answer) {
    measured.leave(1, false);
  } else {
    measured.leaveUncounted();
  }
  return answer;
}

}  // namespace xquery
