// The declarations of a module's prolog as the parser found them.
//
// The parser makes one item per declaration; the prolog applies them in source order by sending
// each XQueryUpdateProlog. An item checks what it can against the prolog built so far: on a failure
// it adds an error without a line to the prolog and changes nothing more, else it updates the
// prolog. No failure keeps the items after it from being applied.
#pragma once

#include "Expr/TypeTests/XQueryTypeDeclaration.h"
#include "Expr/XQueryExpr.h"
#include "Prolog/XQueryDeclarations.h"
#include "xquery/Object.h"
#include "xquery/String.h"

#include <cstdint>
#include <optional>
#include <vector>

namespace xquery {

class XQueryProlog;

// The locations of an import. None at all is not the same as an empty list: see the module import.
using XQueryPrologItemLocations = std::optional<std::vector<Ref<NSString>>>;

class XQueryPrologItem : public NSCounted {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::PrologItem; }

  // The source line, counted from 0.
  int64_t line() const { return _line; }
  // Where the declaration stands, without its semicolon.
  XQueryPlaceNumber place() const { return _place; }
  void setPlace(XQueryPlaceNumber place) { _place = place; }
  virtual void XQueryUpdateProlog(XQueryProlog& prolog) = 0;
  // For diagnostics, and part of several error messages.
  virtual Ref<NSString> description() const = 0;

 protected:
  explicit XQueryPrologItem(int64_t line) : NSCounted(Kind::PrologItem), _line(line) {}

 private:
  int64_t _line;
  XQueryPlaceNumber _place = 0;
};

// Makes the prolog that of a library module.
class XQueryPrologItemModuleNamespace : public XQueryPrologItem {
 public:
  [[nodiscard]] static Ref<XQueryPrologItemModuleNamespace> moduleNamespace(
      Ref<NSString> namespaceString, Ref<NSString> forPrefix, int64_t atLine);
  const Ref<NSString>& namespaceString() const { return _namespaceString; }
  const Ref<NSString>& prefix() const { return _prefix; }
  void XQueryUpdateProlog(XQueryProlog& prolog) override;
  Ref<NSString> description() const override;

 protected:
  XQueryPrologItemModuleNamespace(Ref<NSString> namespaceString, Ref<NSString> prefix,
                                  int64_t line);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Ref<NSString> _namespaceString;
  Ref<NSString> _prefix;
};

// Boundary space. The misspelling belongs to the name, here and below.
class XQueryPrologItemXMLSpacePerserve : public XQueryPrologItem {
 public:
  [[nodiscard]] static Ref<XQueryPrologItemXMLSpacePerserve> preserve(bool preserve,
                                                                      int64_t atLine);
  bool value() const { return _value; }
  void XQueryUpdateProlog(XQueryProlog& prolog) override;
  Ref<NSString> description() const override;

 protected:
  XQueryPrologItemXMLSpacePerserve(bool value, int64_t line);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  bool _value;
};

class XQueryPrologItemDefaultOrder : public XQueryPrologItem {
 public:
  [[nodiscard]] static Ref<XQueryPrologItemDefaultOrder> emptyLeast(bool emptyLeast,
                                                                    int64_t atLine);
  bool value() const { return _value; }
  void XQueryUpdateProlog(XQueryProlog& prolog) override;
  Ref<NSString> description() const override;

 protected:
  XQueryPrologItemDefaultOrder(bool value, int64_t line);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  bool _value;
};

class XQueryPrologItemInheritNamespaces : public XQueryPrologItem {
 public:
  [[nodiscard]] static Ref<XQueryPrologItemInheritNamespaces> inherit(bool inherit, int64_t atLine);
  bool value() const { return _value; }
  void XQueryUpdateProlog(XQueryProlog& prolog) override;
  Ref<NSString> description() const override;

 protected:
  XQueryPrologItemInheritNamespaces(bool value, int64_t line);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  bool _value;
};

class XQueryPrologItemOrdered : public XQueryPrologItem {
 public:
  [[nodiscard]] static Ref<XQueryPrologItemOrdered> ordered(bool ordered, int64_t atLine);
  bool value() const { return _value; }
  void XQueryUpdateProlog(XQueryProlog& prolog) override;
  Ref<NSString> description() const override;

 protected:
  XQueryPrologItemOrdered(bool value, int64_t line);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  bool _value;
};

class XQueryPrologItemConstructionPerserve : public XQueryPrologItem {
 public:
  [[nodiscard]] static Ref<XQueryPrologItemConstructionPerserve> preserve(bool preserve,
                                                                          int64_t atLine);
  bool value() const { return _value; }
  void XQueryUpdateProlog(XQueryProlog& prolog) override;
  Ref<NSString> description() const override;

 protected:
  XQueryPrologItemConstructionPerserve(bool value, int64_t line);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  bool _value;
};

class XQueryPrologItemDefaultCollation : public XQueryPrologItem {
 public:
  [[nodiscard]] static Ref<XQueryPrologItemDefaultCollation> collation(Ref<NSString> collation,
                                                                       int64_t atLine);
  const Ref<NSString>& collation() const { return _collation; }
  void XQueryUpdateProlog(XQueryProlog& prolog) override;
  Ref<NSString> description() const override;

 protected:
  XQueryPrologItemDefaultCollation(Ref<NSString> collation, int64_t line);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Ref<NSString> _collation;
};

// A second one is error 32.
class XQueryPrologItemDefaultBaseURI : public XQueryPrologItem {
 public:
  [[nodiscard]] static Ref<XQueryPrologItemDefaultBaseURI> baseURI(Ref<NSString> baseURI,
                                                                   int64_t atLine);
  const Ref<NSString>& baseURI() const { return _baseURI; }
  void XQueryUpdateProlog(XQueryProlog& prolog) override;
  Ref<NSString> description() const override;

 protected:
  XQueryPrologItemDefaultBaseURI(Ref<NSString> baseURI, int64_t line);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Ref<NSString> _baseURI;
};

// Error 33 for a prefix that a declaration already bound, 70 for "xml" and "xmlns".
class XQueryPrologItemDeclareNamespace : public XQueryPrologItem {
 public:
  [[nodiscard]] static Ref<XQueryPrologItemDeclareNamespace> declareNamespace(
      Ref<NSString> URI, Ref<NSString> forPrefix, int64_t atLine);
  const Ref<NSString>& namespaceString() const { return _namespaceString; }
  const Ref<NSString>& prefix() const { return _prefix; }
  void XQueryUpdateProlog(XQueryProlog& prolog) override;
  Ref<NSString> description() const override;

 protected:
  XQueryPrologItemDeclareNamespace(Ref<NSString> namespaceString, Ref<NSString> prefix,
                                   int64_t line);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Ref<NSString> _namespaceString;
  Ref<NSString> _prefix;
};

// Error 46 for an empty URI.
class XQueryPrologItemDefaultElementNamespace : public XQueryPrologItem {
 public:
  [[nodiscard]] static Ref<XQueryPrologItemDefaultElementNamespace> elementNamespace(
      Ref<NSString> URI, int64_t atLine);
  const Ref<NSString>& namespaceString() const { return _namespaceString; }
  void XQueryUpdateProlog(XQueryProlog& prolog) override;
  Ref<NSString> description() const override;

 protected:
  XQueryPrologItemDefaultElementNamespace(Ref<NSString> namespaceString, int64_t line);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Ref<NSString> _namespaceString;
};

// Error 46 for an empty URI.
class XQueryPrologItemDefaultFunctionNamespace : public XQueryPrologItem {
 public:
  [[nodiscard]] static Ref<XQueryPrologItemDefaultFunctionNamespace> functionNamespace(
      Ref<NSString> URI, int64_t atLine);
  const Ref<NSString>& namespaceString() const { return _namespaceString; }
  void XQueryUpdateProlog(XQueryProlog& prolog) override;
  Ref<NSString> description() const override;

 protected:
  XQueryPrologItemDefaultFunctionNamespace(Ref<NSString> namespaceString, int64_t line);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Ref<NSString> _namespaceString;
};

// Error 48 outside the module's namespace, 49 for a name already declared. The name is the lexical
// one; the type may be null, and so is the expression of an external variable.
class XQueryPrologItemVariableDeclaration : public XQueryPrologItem {
 public:
  [[nodiscard]] static Ref<XQueryPrologItemVariableDeclaration> variable(
      Ref<NSString> name, Ref<XQueryTypeDeclaration> ofType, Ref<XQueryExpr> forExpr,
      bool isExternal, int64_t atLine);
  const Ref<NSString>& varName() const { return _varName; }
  const Ref<XQueryTypeDeclaration>& type() const { return _type; }
  const Ref<XQueryExpr>& expr() const { return _expr; }
  bool external() const { return _external; }
  void XQueryUpdateProlog(XQueryProlog& prolog) override;
  Ref<NSString> description() const override;

 protected:
  XQueryPrologItemVariableDeclaration(Ref<NSString> varName, Ref<XQueryTypeDeclaration> type,
                                      Ref<XQueryExpr> expr, bool external, int64_t line);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Ref<NSString> _varName;
  Ref<XQueryTypeDeclaration> _type;
  Ref<XQueryExpr> _expr;
  bool _external;
};

// Error 48 outside the module's namespace, 45 in a namespace where a main module may declare no
// function, 34 for a name and parameter count already declared.
class XQueryPrologItemFunctionDeclaration : public XQueryPrologItem {
 public:
  [[nodiscard]] static Ref<XQueryPrologItemFunctionDeclaration> function(
      Ref<NSString> name, std::vector<Ref<XQueryParam>> withParams,
      Ref<XQueryTypeDeclaration> ofType, Ref<XQueryExpr> forExpr, bool isExternal, int64_t atLine);
  const Ref<NSString>& name() const { return _name; }
  const std::vector<Ref<XQueryParam>>& paramList() const { return _paramList; }
  const Ref<XQueryTypeDeclaration>& type() const { return _type; }
  const Ref<XQueryExpr>& expr() const { return _expr; }
  bool external() const { return _external; }
  void XQueryUpdateProlog(XQueryProlog& prolog) override;
  Ref<NSString> description() const override;

 protected:
  XQueryPrologItemFunctionDeclaration(Ref<NSString> name, std::vector<Ref<XQueryParam>> paramList,
                                      Ref<XQueryTypeDeclaration> type, Ref<XQueryExpr> expr,
                                      bool external, int64_t line);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Ref<NSString> _name;
  std::vector<Ref<XQueryParam>> _paramList;
  Ref<XQueryTypeDeclaration> _type;
  Ref<XQueryExpr> _expr;
  bool _external;
};

class XQueryPrologItemDeclareValidationSchemaMode : public XQueryPrologItem {
 public:
  [[nodiscard]] static Ref<XQueryPrologItemDeclareValidationSchemaMode> schemaMode(int32_t mode,
                                                                                   int64_t atLine);
  int32_t mode() const { return _mode; }
  void XQueryUpdateProlog(XQueryProlog& prolog) override;
  Ref<NSString> description() const override;

 protected:
  XQueryPrologItemDeclareValidationSchemaMode(int32_t mode, int64_t line);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  int32_t _mode;
};

// Error 33 for a prefix bound to another namespace. The prefix may be null. Recorded here, resolved
// when all items have been applied.
class XQueryPrologItemModuleImport : public XQueryPrologItem {
 public:
  [[nodiscard]] static Ref<XQueryPrologItemModuleImport> moduleImport(
      Ref<NSString> namespaceString, XQueryPrologItemLocations atLocations, Ref<NSString> forPrefix,
      int64_t atLine);
  const Ref<NSString>& namespaceString() const { return _namespaceString; }
  const XQueryPrologItemLocations& locations() const { return _locations; }
  const Ref<NSString>& prefix() const { return _prefix; }
  void XQueryUpdateProlog(XQueryProlog& prolog) override;
  Ref<NSString> description() const override;

 protected:
  XQueryPrologItemModuleImport(Ref<NSString> namespaceString, XQueryPrologItemLocations locations,
                               Ref<NSString> prefix, int64_t line);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Ref<NSString> _namespaceString;
  XQueryPrologItemLocations _locations;
  Ref<NSString> _prefix;
};

// Checked as a module import is, and only recorded: no schema is ever loaded.
class XQueryPrologItemSchemaImport : public XQueryPrologItem {
 public:
  [[nodiscard]] static Ref<XQueryPrologItemSchemaImport> schemaImport(
      Ref<NSString> namespaceString, XQueryPrologItemLocations atLocations, Ref<NSString> forPrefix,
      int64_t atLine);
  const Ref<NSString>& namespaceString() const { return _namespaceString; }
  const XQueryPrologItemLocations& locations() const { return _locations; }
  const Ref<NSString>& prefix() const { return _prefix; }
  void XQueryUpdateProlog(XQueryProlog& prolog) override;
  Ref<NSString> description() const override;

 protected:
  XQueryPrologItemSchemaImport(Ref<NSString> namespaceString, XQueryPrologItemLocations locations,
                               Ref<NSString> prefix, int64_t line);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Ref<NSString> _namespaceString;
  XQueryPrologItemLocations _locations;
  Ref<NSString> _prefix;
};

// Changes nothing, the default element namespace included: no schema is ever loaded.
class XQueryPrologItemSchemaImportDefaultElement : public XQueryPrologItem {
 public:
  [[nodiscard]] static Ref<XQueryPrologItemSchemaImportDefaultElement> defaultElement(
      Ref<NSString> namespaceString, XQueryPrologItemLocations atLocations, int64_t atLine);
  const Ref<NSString>& namespaceString() const { return _namespaceString; }
  const XQueryPrologItemLocations& locations() const { return _locations; }
  void XQueryUpdateProlog(XQueryProlog& prolog) override;
  Ref<NSString> description() const override;

 protected:
  XQueryPrologItemSchemaImportDefaultElement(Ref<NSString> namespaceString,
                                             XQueryPrologItemLocations locations, int64_t line);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Ref<NSString> _namespaceString;
  XQueryPrologItemLocations _locations;
};

}  // namespace xquery
