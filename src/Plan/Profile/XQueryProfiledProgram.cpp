#include "Plan/Profile/XQueryProfiledProgram.h"

#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Plan/Planning.h"
#include "Plan/Profile/XQueryProfiledExpr.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Base/XQueryPlaceColumns.h"
#include "Prolog/XQueryModules.h"
#include "Prolog/XQueryProlog.h"

#include <utility>

namespace xquery {
namespace {

bool isThereAlready(const XQueryExpr& expr) {
  switch (expr.kind()) {
    case Kind::Literal:
    case Kind::Variable:
    case Kind::ContextItemExpr:
    case Kind::RootStepExpr:
    case Kind::QNameReference:
      return true;
    default:
      return false;
  }
}

class Profiling {
 public:
  Profiling(XQueryPlanning& planning, const XQueryProlog& main, XQueryProfiledProgram& profiled)
      : _planning(planning),
        _program(planning.program),
        _places(*main.modules().places()),
        _profiled(profiled),
        _isInside(_program.placeCount()) {
    for (XQueryPlaceID place = 0; place < _program.placeCount(); ++place) {
      const XQueryPlaceID whole = _program[place].parent;
      _isInside[place] = isGone(place) || (whole != XQueryNoPlace &&
                                           (_isInside[whole] || _planning.isWrapped(whole)));
    }
  }

  void run(const std::vector<XQueryPlanReport::Entry>& entries) {
    WorkPacer pacer;
    for (const XQueryPlanReport::Entry& entry : entries) {
      pacer.turn();
      if (entry.isBody) {
        addBody(entry);
      } else {
        add(entry);
      }
    }
    XQueryFindColumns(_places, _written, [&](const Written& each, const XQueryPlaceColumn& at) {
      XQueryProfilePlace& place = _profiled.expressions[each.index].place;
      place.line = at.line;
      place.column = at.column;
      place.length = at.length;
    });
  }

 private:
  bool isGone(XQueryPlaceID place) const {
    return _program[place].slot && !_planning.isOpen(place) && !_planning.isWrapped(place);
  }

  // Where it has a place, the text tells the line better.
  static XQueryProfilePlace placeOf(const XQueryPlanReport::Entry& entry) {
    return {entry.module, entry.line};
  }

  // What the expression at the place is told as.
  void write(XQueryPlaceID place, size_t index) {
    _written.push_back({_program.bodyOf(place).prolog, _program[place].expr->exprPlace(), index});
  }

  void addBody(const XQueryPlanReport::Entry& entry) {
    _inBody = _program.withoutParentheses(entry.place);
    _levelsLess = 0;
    const size_t index = _profiled.expressions.size();
    _profiled.expressions.push_back({0, entry.label, {}, placeOf(entry), {}});
    const XQueryProgramBody& body = _program.bodyOf(entry.place);
    if (body.function || !isThereAlready(*_planning.exprAt(entry.place))) count(entry.place, index);
  }

  // What a body consists of has its line together with it. Values that are there already have one
  // only where there is something to say of them.
  void add(const XQueryPlanReport::Entry& entry) {
    if (entry.place == _inBody) {
      XQueryProfiledExpression& body = _profiled.expressions.back();
      body.label = entry.label;
      body.place = placeOf(entry);
      body.notes = entry.notes;
      write(entry.place, _profiled.expressions.size() - 1);
      _levelsLess = 1;
      return;
    }
    if (entry.notes.empty() && isThereAlready(*_program[entry.place].expr)) return;
    const size_t index = _profiled.expressions.size();
    _profiled.expressions.push_back({entry.depth - _levelsLess, std::string(entry.role),
                                     entry.label, placeOf(entry), entry.notes});
    write(entry.place, index);
    if (isCounted(entry.place)) count(entry.place, index);
  }

  bool isCounted(XQueryPlaceID place) const {
    const XQueryPlace& at = _program[place];
    if (!at.slot || XQueryTraitsOf(at.role).isNoValue) return false;
    const Ref<XQueryExpr> expr = _planning.exprAt(place);
    if (isThereAlready(*expr)) return false;
    const auto* operation = dyn_cast<XQueryOperatorExpr>(expr.get());
    if (!operation) return true;
    return operation->operatorType() != XQueryOperatorTo && !isLeftOfOperator(place);
  }

  bool isLeftOfOperator(XQueryPlaceID place) const {
    const XQueryPlaceID whole = _program[place].parent;
    return whole != XQueryNoPlace && isa<XQueryOperatorExpr>(_program[whole].expr) &&
           _program.firstPart(whole) == place;
  }

  void count(XQueryPlaceID place, size_t index) {
    const auto counter = static_cast<XQueryCounterID>(_profiled.counted.size());
    _profiled.counted.push_back(static_cast<uint32_t>(index));
    _profiled.expressions[index].counter = counter;
    _profiled.expressions[index].mayBeInside = _isInside[place];
    _program.replace(place, XQueryProfiledExpr::exprWithPlain(_planning.exprAt(place), counter));
  }

  struct Written {
    const XQueryProlog* module;
    XQueryPlaceNumber number;
    size_t index;  // of the expression
  };

  XQueryPlanning& _planning;
  XQueryProgram& _program;
  const XQueryPlaces& _places;
  XQueryProfiledProgram& _profiled;
  std::vector<Written> _written;
  std::vector<bool> _isInside;
  XQueryPlaceID _inBody = XQueryNoPlace;  // what the body at hand consists of
  size_t _levelsLess = 0;                 // that the parts of the body stand below it
};

}  // namespace

void XQueryProfileProgram(XQueryPlanning& planning, const XQueryPlanReport& report,
                          const XQueryProlog& main, XQueryProfiledProgram& profiled) {
  Profiling(planning, main, profiled).run(report.entries());
}

}  // namespace xquery
