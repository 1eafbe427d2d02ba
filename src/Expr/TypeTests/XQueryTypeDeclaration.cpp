#include "Expr/TypeTests/XQueryTypeDeclaration.h"

#include "Context/XQueryContextInternal.h"
#include "Expr/Paths/XQueryNameTest.h"
#include "Expr/XQueryParts.h"
#include "Platform/Base/WorkMeter.h"
#include "Prolog/XQueryProlog.h"
#include "Types/XQueryErrors.h"
#include "Types/XQueryQName.h"
#include "Types/XQueryTypeTable.h"
#include "xquery/Collection.h"
#include "xquery/XMLNode.h"

namespace xquery {
namespace {

Ref<XQueryTypeDeclaration> declaration(XQueryTypeDeclaration::Type type, Value data = {}) {
  return make<XQueryTypeDeclaration>(static_cast<int>(type), std::move(data));
}

// Every member of a sequence of several items, or the one item, must be of the type. A name that is
// no built-in type matches nothing; neither does an array that stands as an item.
bool matchesAtomicType(const NSObject& subject, size_t count, const XQueryTypeDeclaration& type) {
  const XQueryTypeID id = type.typeID();
  if (id == XQueryTypeNone) return false;
  const auto* array = count > 1 ? dyn_cast<NSArray>(&subject) : nullptr;
  if (!array) return XQueryIsKindOfType(XQueryObjectTypeID(&subject), id);
  WorkPacer pacer;
  for (const Value& member : array->objects()) {
    pacer.turn();
    if (!XQueryIsKindOfType(XQueryObjectTypeID(member.get()), id)) return false;
  }
  return true;
}

bool matchesNameTest(const NSXMLNode& node, const NSObject* nameTest, XQueryContext* context) {
  if (!nameTest) return true;
  const auto* test = dyn_cast<XQueryNameTest>(nameTest);
  return test && test->isValidNode(node, context);
}

bool matchesTarget(const NSXMLNode& node, const NSObject* target) {
  if (!target) return true;
  const auto* name = dyn_cast<NSString>(target);
  return name && node.nameView() == name->view();
}

// The kind tests look at the subject as one node, so a sequence of several nodes never matches one.
bool matchesKindTest(const NSObject& subject, const XQueryTypeDeclaration& test,
                     XQueryContext* context) {
  const auto* node = dyn_cast<NSXMLNode>(&subject);
  if (!node) return false;
  const NSObject* data = test.data();
  switch (test.type()) {
    case XQueryTypeDeclaration::DocumentTest:
      return node->kind() == Kind::Document && !data;
    case XQueryTypeDeclaration::ElementTest:
      return node->kind() == Kind::Element && matchesNameTest(*node, data, context);
    case XQueryTypeDeclaration::ProcessingInstructionTest:
      return node->kind() == Kind::ProcessingInstruction && matchesTarget(*node, data);
    case XQueryTypeDeclaration::AttributeTest:
      return node->kind() == Kind::Attribute && matchesNameTest(*node, data, context);
    case XQueryTypeDeclaration::CommentTest:
      return node->kind() == Kind::Comment && !data;
    case XQueryTypeDeclaration::TextTest:
      return node->kind() == Kind::Text && !data;
    case XQueryTypeDeclaration::AnyKindTest:
      return !data;
    default:
      return false;
  }
}

bool matchesType(const NSObject& subject, size_t count, const XQueryTypeDeclaration& declaration,
                 XQueryContext* context) {
  switch (declaration.type()) {
    case XQueryTypeDeclaration::Atomic:
      return matchesAtomicType(subject, count, declaration);
    case XQueryTypeDeclaration::Item:
      return true;
    default:
      return matchesKindTest(subject, declaration, context);
  }
}

}  // namespace

XQueryTypeDeclaration::XQueryTypeDeclaration(int type, Value data)
    : XQueryExpr(Kind::TypeDeclaration), _type(type) {
  setData(std::move(data));
}

void XQueryTypeDeclaration::setData(Value data) {
  const auto* qName = dyn_cast<XQueryQName>(data);
  _typeID = _type == Atomic && qName ? XQueryTypeIDForQName(*qName) : XQueryTypeNone;
  _data = std::move(data);
}

Ref<XQueryTypeDeclaration> XQueryTypeDeclaration::atomic(Ref<NSString> lexicalQName) {
  return declaration(Atomic, std::move(lexicalQName));
}

Ref<XQueryTypeDeclaration> XQueryTypeDeclaration::empty() {
  return declaration(Empty);
}

Ref<XQueryTypeDeclaration> XQueryTypeDeclaration::item() {
  return declaration(Item);
}

Ref<XQueryTypeDeclaration> XQueryTypeDeclaration::document(Ref<XQueryTypeDeclaration> elementTest) {
  return declaration(DocumentTest, std::move(elementTest));
}

Ref<XQueryTypeDeclaration> XQueryTypeDeclaration::element(Value nameTest) {
  return declaration(ElementTest, std::move(nameTest));
}

Ref<XQueryTypeDeclaration> XQueryTypeDeclaration::attribute(Value nameTest) {
  return declaration(AttributeTest, std::move(nameTest));
}

Ref<XQueryTypeDeclaration> XQueryTypeDeclaration::pi(Ref<NSString> target) {
  return declaration(ProcessingInstructionTest, std::move(target));
}

Ref<XQueryTypeDeclaration> XQueryTypeDeclaration::comment() {
  return declaration(CommentTest);
}

Ref<XQueryTypeDeclaration> XQueryTypeDeclaration::text() {
  return declaration(TextTest);
}

Ref<XQueryTypeDeclaration> XQueryTypeDeclaration::anyKind() {
  return declaration(AnyKindTest);
}

void XQueryTypeDeclaration::bindInfoForProlog(XQueryProlog& prolog) {
  if (_type == Atomic) {
    if (auto* lexical = dyn_cast<NSString>(_data)) {
      setData(prolog.xmlQNameFromString(Ref<NSString>(lexical)));
    }
    return;
  }
  if (_type != ElementTest && _type != AttributeTest) return;
  if (auto* nameTest = dyn_cast<XQueryNameTest>(_data)) {
    if (_type == AttributeTest) nameTest->setAttribute(true);
    nameTest->bindInfoForProlog(prolog);
  }
}

void XQueryTypeDeclaration::visitParts(XQueryPartVisitor& visitor) {
  visitor.ownPart(dyn_cast<XQueryExpr>(_data.get()), XQueryRole::NodeTest);
}

Value XQueryTypeDeclaration::computeValue(XQueryContext&) const {
  return NSNull::null();
}

bool XQueryTypeDeclaration::acceptsCount(size_t count) const {
  switch (_occuranceType) {
    case ExactlyOne:
      return count == 1;
    case ZeroOrOne:
      return count < 2;
    case ZeroOrMore:
      return true;
    case OneOrMore:  // asks for more than one: that is how "+" has always been read here
      return count > 1;
    default:
      return false;
  }
}

bool XQueryInstanceOf(const NSObject* object, const XQueryTypeDeclaration& instanceOf,
                      XQueryContext* forContext) {
  if (!object) return false;
  size_t count = 1;
  if (const auto* array = dyn_cast<NSArray>(object)) {
    count = array->count();
    if (count == 0) object = NSNull::null();
    if (count == 1) object = array->objectAtIndex(0);
    if (!object) return false;
  }
  if (object->kind() == Kind::Null) {
    return instanceOf.type() == XQueryTypeDeclaration::Empty || instanceOf.acceptsCount(0);
  }
  return matchesType(*object, count, instanceOf, forContext) && instanceOf.acceptsCount(count);
}

Value XQueryTreatAs(const Value& object, const XQueryTypeDeclaration& treatAs,
                    XQueryContext& forContext) {
  if (!XQueryInstanceOf(object.get(), treatAs, &forContext)) {
    _internal(forContext).raise(XQueryErrors::invalidType.error());
  }
  return object;
}

}  // namespace xquery
