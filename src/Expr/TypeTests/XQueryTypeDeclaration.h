// Sequence types and the one routine that matches a value against them.
#pragma once

#include "Expr/XQueryExpr.h"
#include "Types/XQueryTypeTable.h"

namespace xquery {

class XQueryNameTest;

class XQueryTypeDeclaration : public XQueryExpr {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::TypeDeclaration; }

  enum Type : int {
    Atomic = 1,
    Empty = 2,
    Item = 3,
    DocumentTest = 4,
    ElementTest = 5,
    ProcessingInstructionTest = 6,
    AttributeTest = 7,
    CommentTest = 8,
    TextTest = 9,
    AnyKindTest = 10,
  };
  // The misspelling belongs to the name.
  enum OccuranceType : int32_t { ExactlyOne = 0, ZeroOrOne = 1, ZeroOrMore = 2, OneOrMore = 3 };

  [[nodiscard]] static Ref<XQueryTypeDeclaration> atomic(Ref<NSString> lexicalQName);
  [[nodiscard]] static Ref<XQueryTypeDeclaration> empty();
  [[nodiscard]] static Ref<XQueryTypeDeclaration> item();
  // Inner element test, or null.
  [[nodiscard]] static Ref<XQueryTypeDeclaration> document(Ref<XQueryTypeDeclaration> elementTest);
  // Name test, or null for any element / attribute.
  [[nodiscard]] static Ref<XQueryTypeDeclaration> element(Value nameTest);
  [[nodiscard]] static Ref<XQueryTypeDeclaration> attribute(Value nameTest);
  // Target name, or null.
  [[nodiscard]] static Ref<XQueryTypeDeclaration> pi(Ref<NSString> target);
  [[nodiscard]] static Ref<XQueryTypeDeclaration> comment();
  [[nodiscard]] static Ref<XQueryTypeDeclaration> text();
  [[nodiscard]] static Ref<XQueryTypeDeclaration> anyKind();

  int type() const { return _type; }
  // For an atomic type its name: lexical until bound, then an XQueryQName.
  NSObject* data() const { return _data.get(); }
  // The built-in type that a bound atomic declaration names; 0 when it names none.
  XQueryTypeID typeID() const { return _typeID; }
  // Whether the occurrence indicator lets a sequence of so many items pass.
  bool acceptsCount(size_t count) const;
  int32_t occuranceType() const { return _occuranceType; }
  void setOccuranceType(int32_t occuranceType) { _occuranceType = occuranceType; }

  void bindInfoForProlog(XQueryProlog& prolog) override;
  void visitParts(XQueryPartVisitor& visitor) override;
  // A declaration is never evaluated for a value: NSNull.
  Value computeValue(XQueryContext& context) const override;

  XQueryTypeDeclaration(int type, Value data);

 private:
  void setData(Value data);

  int _type;
  int32_t _occuranceType = ExactlyOne;
  XQueryTypeID _typeID = XQueryTypeNone;
  Value _data;
};

// "instance of" over a value: answers whether the value matches. `forContext` may be null (kind
// tests in path steps pass none).
bool XQueryInstanceOf(const NSObject* object, const XQueryTypeDeclaration& instanceOf,
                      XQueryContext* forContext);
// The value itself when it matches; otherwise raises error 6 "invalid type".
Value XQueryTreatAs(const Value& object, const XQueryTypeDeclaration& treatAs,
                    XQueryContext& forContext);

}  // namespace xquery
