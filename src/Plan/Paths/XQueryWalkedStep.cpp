#include "Plan/Paths/XQueryWalkedStep.h"

namespace xquery {

// The test accepts nodes by their kind alone where there is a choice.
XQueryStepTest::XQueryStepTest(const XQueryWalkedStep& step, XQueryPathRun& run)
    : _test(step.test, run), _choice(step.choice.get()) {
  if (!_choice) return;
  if (_choice->isOfElements()) _test.restrictTo(XQueryKindBit(Kind::Element));
  if (const XQueryNameTest* only = _choice->onlyTest()) {
    const uint32_t kinds = _test.kinds();
    _test = XQueryNodeTest(only, run);
    _test.restrictTo(kinds);
    _choice = nullptr;
    const bool meetsAttributes = step.axis == XQueryAxisAttribute || step.axis == XQueryAxisSelf ||
                                 step.axis == XQueryAxisDescendantOrSelf ||
                                 step.axis == XQueryAxisAncestorOrSelf;
    _isOfName = !meetsAttributes || (kinds & XQueryKindBit(Kind::Attribute)) != 0;
    return;
  }
  _isOfName = false;
  if (_choice->isOfTests()) {
    _test.restrictTo(XQueryKindBit(Kind::Element) | XQueryKindBit(Kind::Attribute));
  }
  if (_choice->needsContext() && run.contextHasDefaultNamespace()) _context = &run.context;
}

}  // namespace xquery
