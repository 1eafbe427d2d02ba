#include "Expr/TypeTests/XQueryTypeDeclaration.h"
#include "Parser/BuilderSupport.h"
#include "Parser/XQueryTokens.h"

namespace xquery {
namespace {

NSObject* withOccurrence(NSObject* type, int token) {
  int32_t occurrence = XQueryTypeDeclaration::ExactlyOne;
  if (token == kTokenQuestionMark) occurrence = XQueryTypeDeclaration::ZeroOrOne;
  if (token == kTokenAsterisk) occurrence = XQueryTypeDeclaration::ZeroOrMore;
  if (token == kTokenPlus) occurrence = XQueryTypeDeclaration::OneOrMore;
  cast<XQueryTypeDeclaration>(type)->setOccuranceType(occurrence);
  return type;
}

}  // namespace

NSObject* XQNodeNameWildCard() {
  return nullptr;
}

NSObject* XQTypeName(NSObject* name) {
  return name;
}

NSObject* XQTypeNameWildCard() {
  return nullptr;
}

NSObject* XQAnyKindTest(int64_t line) {
  return XQAtLine(XQueryTypeDeclaration::anyKind(), line);
}

void XQSchemaTest(NSObject* name, int64_t line) {
  XQRemark(XQueryRemark::Matter::SchemaTest, line, name);
}

NSObject* XQElementTest(NSObject* name, NSObject* type, bool, int64_t line) {
  if (type) XQRemark(XQueryRemark::Matter::TypeInTest, line, type);
  return XQAtLine(XQueryTypeDeclaration::element(Value(name)), line);
}

NSObject* XQAttributeTest(NSObject* name, NSObject* type, int64_t line) {
  if (type) XQRemark(XQueryRemark::Matter::TypeInTest, line, type);
  return XQAtLine(XQueryTypeDeclaration::attribute(Value(name)), line);
}

NSObject* XQPITest(NSObject* target, int64_t line) {
  return XQAtLine(XQueryTypeDeclaration::pi(XQRef<NSString>(target)), line);
}

NSObject* XQDocumentTest(NSObject* elementTest, int64_t line) {
  return XQAtLine(XQueryTypeDeclaration::document(XQRef<XQueryTypeDeclaration>(elementTest)), line);
}

NSObject* XQCommentTest(int64_t line) {
  return XQAtLine(XQueryTypeDeclaration::comment(), line);
}

NSObject* XQTextTest(int64_t line) {
  return XQAtLine(XQueryTypeDeclaration::text(), line);
}

NSObject* XQAtomicType(NSObject* name, int64_t line) {
  return XQAtLine(XQueryTypeDeclaration::atomic(XQRef<NSString>(name)), line);
}

NSObject* XQAnyItemType(int64_t line) {
  return XQAtLine(XQueryTypeDeclaration::item(), line);
}

NSObject* XQSequenceTypeEmpty(int64_t line) {
  return XQAtLine(XQueryTypeDeclaration::empty(), line);
}

NSObject* XQSingleType(NSObject* type, int occurrenceToken) {
  return withOccurrence(type, occurrenceToken);
}

NSObject* XQSequenceType(NSObject* type, int occurrenceToken) {
  return withOccurrence(type, occurrenceToken);
}

}  // namespace xquery
