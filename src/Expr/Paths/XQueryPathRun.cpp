#include "Expr/Paths/XQueryPathRun.h"

#include "Context/XQueryContextInternal.h"
#include "Expr/Paths/XQueryPath.h"
#include "Expr/XQuerySequence.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/Names.h"
#include "Types/XQueryAtomization.h"

namespace xquery {
namespace {

constexpr uint32_t elementsAndAttributes =
    XQueryKindBit(Kind::Element) | XQueryKindBit(Kind::Attribute);
constexpr uint32_t namedKinds = elementsAndAttributes | XQueryKindBit(Kind::Namespace) |
                                XQueryKindBit(Kind::ProcessingInstruction);
constexpr uint32_t allKinds = namedKinds | XQueryKindBit(Kind::Document) |
                              XQueryKindBit(Kind::Comment) | XQueryKindBit(Kind::Text);

}  // namespace

bool XQueryAllAreNodes(const Value& items) {
  const XQueryItemList list(items.get());
  WorkPacer pacer;
  for (size_t i = 0; i < list.count(); ++i) {
    pacer.turn();
    if (!XQueryIsNode(list[i])) return false;
  }
  return true;
}

bool XQueryPathRun::contextHasDefaultNamespace() {
  if (_defaultNamespace == DefaultNamespace::Unknown) {
    _defaultNamespace = _internal(context).hasDefaultNamespace() ? DefaultNamespace::Present
                                                                 : DefaultNamespace::None;
  }
  return _defaultNamespace == DefaultNamespace::Present;
}

const NSXMLExpandedName* XQueryPathRun::nameForDeferredTest(const XQueryNameTest& test) {
  for (const auto& known : _deferredNames) {
    if (known.first == &test) return known.second.get();
  }
  const Ref<XQueryQName> qName = test.qNameForContext(&context);
  _deferredNames.emplace_back(&test,
                              qName ? XQueryNameTest::interned(*qName) : NSXMLExpandedNameRef());
  return _deferredNames.back().second.get();
}

XQueryNodeTest::XQueryNodeTest(const XQueryExpr* test, XQueryPathRun& run)
    : _expr(test), _run(&run) {
  setTest();
}

void XQueryNodeTest::setTest() {
  switch (_expr ? _expr->kind() : Kind::None) {
    case Kind::NameTest:
      setNameTest(*cast<XQueryNameTest>(_expr));
      break;
    case Kind::WildCardNameTest:
      setWildCard(*cast<XQueryWildCardNameTest>(_expr));
      break;
    case Kind::TypeDeclaration:
      setKindTest(*cast<XQueryTypeDeclaration>(_expr));
      break;
    default:  // matches nothing
      break;
  }
}

void XQueryNodeTest::setNameTest(const XQueryNameTest& test) {
  _name = test.boundName();
  if (!_name && test.nameWithoutNamespace() && !_run->contextHasDefaultNamespace()) {
    _name = test.nameWithoutNamespace();
  }
  if (_name) {
    accept(elementsAndAttributes);
  } else {
    ask(elementsAndAttributes);
  }
}

// The full wildcard asks only for a name.
void XQueryNodeTest::setWildCard(const XQueryWildCardNameTest& test) {
  if (test.prefix() || test.localName()) {
    ask(namedKinds);
  } else {
    accept(namedKinds);
  }
}

// One node is one item: an occurrence indicator accepts it or not, whichever node it is.
void XQueryNodeTest::setKindTest(const XQueryTypeDeclaration& test) {
  if (!test.acceptsCount(1)) return;
  const bool hasData = test.data() != nullptr;
  switch (test.type()) {
    case XQueryTypeDeclaration::AnyKindTest:
      return accept(hasData ? 0 : allKinds);
    case XQueryTypeDeclaration::TextTest:
      return accept(hasData ? 0 : XQueryKindBit(Kind::Text));
    case XQueryTypeDeclaration::CommentTest:
      return accept(hasData ? 0 : XQueryKindBit(Kind::Comment));
    case XQueryTypeDeclaration::DocumentTest:
      return accept(hasData ? 0 : XQueryKindBit(Kind::Document));
    case XQueryTypeDeclaration::ElementTest:
      return hasData ? ask(XQueryKindBit(Kind::Element)) : accept(XQueryKindBit(Kind::Element));
    case XQueryTypeDeclaration::AttributeTest:
      return hasData ? ask(XQueryKindBit(Kind::Attribute)) : accept(XQueryKindBit(Kind::Attribute));
    default:
      return ask(allKinds);
  }
}

bool XQueryNodeTest::matchesFurther(const NSXMLNode* node) {
  const auto* nameTest = dyn_cast<XQueryNameTest>(_expr);
  if (!nameTest || !nameTest->isDeferred()) {
    return XQueryAxisStep::isValid(node, _expr, _run->context);
  }
  _name = _run->nameForDeferredTest(*nameTest);
  if (!_name) _kinds = 0;
  return _name && node->expandedName() == _name;
}

}  // namespace xquery
