// The static context of one module.
#pragma once

#include "Platform/Base/XQueryPlaces.h"
#include "Prolog/StringTable.h"
#include "Prolog/XQueryNamespaceStack.h"
#include "Prolog/XQueryRemark.h"
#include "Types/XQueryQName.h"
#include "xquery/Collection.h"
#include "xquery/Error.h"
#include "xquery/Object.h"
#include "xquery/String.h"
#include "xquery/URL.h"
#include "xquery/XMLNode.h"

#include <cstdint>
#include <unordered_map>
#include <utility>
#include <vector>

namespace xquery {

class XQueryExpr;
class XQueryFunctionDecl;
class NSURLLoader;
class XQueryModuleImporter;
class XQueryModules;
class XQueryPrologItem;
class XQueryPrologItemModuleImport;
class XQueryPrologItemSchemaImport;
class XQueryVarDecl;

// A function name together with its number of parameters.
class XQueryFunctionSignature {
 public:
  XQueryFunctionSignature(Ref<XQueryQName> name, size_t argCount)
      : _name(std::move(name)), _argCount(argCount) {}
  const Ref<XQueryQName>& name() const { return _name; }
  size_t argCount() const { return _argCount; }
  bool operator==(const XQueryFunctionSignature& other) const {
    return _argCount == other._argCount && _name->isEqual(*other._name);
  }
  // The name's hash: overloads of one name share a bucket.
  uint32_t hash() const { return _name->hash(); }

 private:
  Ref<XQueryQName> _name;
  size_t _argCount;
};
struct XQueryFunctionSignatureHash {
  size_t operator()(const XQueryFunctionSignature& signature) const { return signature.hash(); }
};

class XQueryProlog : public NSCounted {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::Prolog; }

  // `places` are those of the expressions that the parser made, where it did. `modules` null makes
  // a new registry, which fetches what is imported through the loader, or through one with the
  // settings that a compilation starts with; `location` and `version` may be null.
  [[nodiscard]] static Ref<XQueryProlog> prologWithItems(
      const std::vector<Ref<XQueryPrologItem>>& items, Ref<NSString> atLocation,
      Ref<XQueryModules> forModules, const Ref<NSString>& version,
      Ref<NSURLLoader> loader = nullptr, Ref<XQueryPlaces> places = nullptr);

  XQueryModules& modules() const { return *_modules; }
  bool xmlSpacePreserve() const { return _xmlSpacePreserve; }
  bool constructionPreserve() const { return _constructionPreserve; }
  bool ordered() const { return _ordered; }
  bool emptyLeast() const { return _emptyLeast; }
  bool inheritNamespaces() const { return _inheritNamespaces; }
  // Null when undeclared.
  const Ref<NSString>& defaultElementNamespace() const { return _defaultElementNamespace; }
  const Ref<NSString>& defaultCollation() const { return _defaultCollation; }
  const Ref<NSString>& baseURI() const { return _baseURI; }
  const Ref<NSString>& modulePrefix() const { return _modulePrefix; }
  const Ref<NSString>& location() const { return _location; }
  // The URL that the module's text is known by; null for none. It is told to nobody but to what
  // resolves a location.
  const Ref<NSURL>& moduleURL() const { return _moduleURL; }
  // What relative locations are resolved against: the base URI, or the module's own URL where none
  // is declared. Null when there is neither.
  const Ref<NSURL>& locationBase() const { return _locationBase; }
  // Null when the text is no URI reference. What there is no base for stays relative.
  Ref<NSURL> URLForLocation(const Ref<NSString>& location) const;
  // The declared one, else the standard function namespace.
  Ref<NSString> defaultFunctionNamespace() const;
  int schemaMode() const { return _schemaMode; }
  bool isModule() const { return static_cast<bool>(_modulePrefix); }
  // The modules whose declarations this one took over, in the order of the imports.
  const std::vector<const XQueryProlog*>& importedModules() const { return _importedModules; }
  // XQueryVarDecl and XQueryFunctionDecl objects in the order they were registered.
  const std::vector<Value>& declarations() const { return _declarations; }
  const std::vector<Ref<XQueryError>>& errors() const { return _errors; }
  const std::vector<Ref<XQueryExpr>>& qNameReferences() const { return _qNameReferences; }
  const std::vector<Ref<XQueryPrologItemModuleImport>>& moduleImports() const {
    return _moduleImports;
  }
  const std::vector<Ref<XQueryPrologItemSchemaImport>>& schemaImports() const {
    return _schemaImports;
  }

  // What the parser noted of the module's text.
  const XQueryRemarks& remarks() const { return _remarks; }
  void setRemarks(XQueryRemarks remarks) { _remarks = std::move(remarks); }

  // --- namespaces ------------------------------------------------------------------------------
  // The in-scope namespaces first (`fromProlog` false), then the declared prefixes. Null for an
  // unknown prefix.
  Ref<NSString> namespaceForPrefix(NSStringView prefix, bool& fromProlog) const;
  Ref<NSString> namespaceForPrefix(NSStringView prefix) const;
  Ref<NSString> namespaceForID(int64_t id) const;
  int64_t namespaceID(const Ref<NSString>& URI) const;
  int64_t namespaceIDForPrefix(NSStringView prefix) const;
  // Null, one string, or an array of strings.
  Value prefixesForID(int64_t id) const;
  int64_t addNamespace(const Ref<NSString>& URI);
  void addPrefix(const Ref<NSString>& prefix, const Ref<NSString>& forNamespace);
  void addNamespace(const Ref<NSString>& URI, const Ref<NSString>& forPrefix) {
    addPrefix(forPrefix, URI);
  }
  void pushInScopeNamespaces(std::vector<Ref<NSXMLNode>> namespaces);
  void popInScopeNamespaces();

  // --- declarations and names ------------------------------------------------------------------
  XQueryVarDecl* variableInfoForQName(const Ref<XQueryQName>& qName) const;
  void setVariableInfo(Ref<XQueryVarDecl> declaration, const Ref<XQueryQName>& forQName);
  XQueryFunctionDecl* functionInfoForSignature(const XQueryFunctionSignature& signature) const;
  void setFunctionInfo(Ref<XQueryFunctionDecl> declaration,
                       const XQueryFunctionSignature& forSignature);
  // 0 when no local variable of that name is in scope.
  int64_t localVariableIDForQName(const Ref<XQueryQName>& qName) const;
  int64_t newLocalVariableIDForQName(const Ref<XQueryQName>& qName);
  int64_t nextLocalVariableID() const { return _nextLocalVariableID; }
  void setNextLocalVariableID(int64_t id) { _nextLocalVariableID = id; }
  // The local variables at one point of the binding pass. An expression whose variables end with it
  // puts back the scope it found: the next ID, and which name has which ID, so that an outer
  // variable shadowed inside is visible again and an inner one is not.
  struct LocalScope {
    int64_t nextID;
    size_t namedCount;
  };
  LocalScope localScope() const { return {_nextLocalVariableID, _localVariableLog.size()}; }
  void restoreLocalScope(const LocalScope& scope);
  // How many expressions have been bound that may give a node a parent: constructors that take in
  // nodes, and calls of functions that may hold such constructors. The difference between two
  // moments of the binding pass tells of what was bound in between.
  size_t adopterCount() const { return _adopterCount; }
  void countAdopter() { ++_adopterCount; }
  // Null when the name does not resolve.
  Ref<XQueryQName> variableQNameFromString(const Ref<NSString>& name) const;
  Ref<XQueryQName> functionQNameFromString(const Ref<NSString>& name) const;
  Ref<XQueryQName> xmlQNameFromString(const Ref<NSString>& name) const;
  void addQNameReference(Ref<XQueryExpr> reference);
  // An error that has a place already keeps it.
  void addError(Ref<XQueryError> error, XQueryPlaceNumber at = 0);

  // --- setters, used by the prolog items ---------------------------------------------------------
  void setModulePrefix(Ref<NSString> prefix) { _modulePrefix = std::move(prefix); }
  void setBaseURI(Ref<NSString> baseURI);
  void setXMLSpacePreserve(bool preserve) { _xmlSpacePreserve = preserve; }
  void setConstructionPreserve(bool preserve) { _constructionPreserve = preserve; }
  void setOrdered(bool ordered) { _ordered = ordered; }
  void setEmptyLeast(bool least) { _emptyLeast = least; }
  void setInheritNamespaces(bool inherit) { _inheritNamespaces = inherit; }
  void setDefaultCollation(Ref<NSString> collation) { _defaultCollation = std::move(collation); }
  void setDefaultElementNamespace(Ref<NSString> URI);
  void setDefaultFunctionNamespace(Ref<NSString> URI);
  void setSchemaMode(int mode) { _schemaMode = mode; }
  void addModule(Ref<XQueryPrologItemModuleImport> item);
  void addSchema(Ref<XQueryPrologItemSchemaImport> item);
  // Accepts its arguments and does nothing: no schema is ever loaded.
  void setDefaultSchema(const Ref<NSString>& URI, const Ref<NSString>& atLocation);

  // For diagnostics.
  Ref<NSString> description() const;

  // Whether this prolog made the registry, having been given none.
  bool madeModules(const XQueryModules& modules) const;

  // Without a registry it makes one.
  explicit XQueryProlog(Ref<XQueryModules> modules = nullptr, Ref<NSURLLoader> loader = nullptr);

 protected:
  ~XQueryProlog() override;

 private:
  void removePrefix(const Ref<NSString>& prefix, int64_t fromBuiltinID);
  // `at` is where the import stands.
  void _importDeclarations(const XQueryProlog& module, XQueryPlaceNumber at);
  void bindDeclaration(NSObject& declaration);
  void _addItems(const std::vector<Ref<XQueryPrologItem>>& items);
  // The first part of the building: before the imports.
  void _start(const std::vector<Ref<XQueryPrologItem>>& items, Ref<NSString> atLocation,
              const Ref<NSString>& version, Ref<NSURL> moduleURL);
  void findLocationBase();
  void _bindInfo();

  struct NamedLocal {
    Ref<XQueryQName> name;
    int64_t replacedID;  // 0: the name had none
  };

  Ref<XQueryModules> _modules;
  bool _madeModules;
  Ref<NSString> _modulePrefix;
  Ref<NSString> _defaultCollation;
  Ref<NSString> _defaultElementNamespace;
  Ref<NSString> _defaultFunctionNamespace;
  Ref<NSString> _baseURI;
  Ref<NSString> _location;
  Ref<NSURL> _moduleURL;
  Ref<NSURL> _locationBase;
  int _schemaMode = 0;
  std::vector<Ref<XQueryError>> _errors;
  std::vector<Ref<XQueryPrologItemModuleImport>> _moduleImports;
  std::vector<Ref<XQueryPrologItemSchemaImport>> _schemaImports;
  std::vector<Value> _namespacePrefixes;     // by ID: NSNull, a string, or an array of strings
  StringTable<int64_t> _namespacePrefixIDs;  // what was declared, over the predeclared ones
  std::vector<Value> _declarations;
  std::vector<const XQueryProlog*> _importedModules;  // kept by the registry
  std::vector<Ref<XQueryExpr>> _qNameReferences;
  std::unordered_map<Ref<XQueryQName>, Ref<XQueryVarDecl>, XQueryQNameHash, XQueryQNameEqual>
      _variables;
  std::unordered_map<XQueryFunctionSignature, Ref<XQueryFunctionDecl>, XQueryFunctionSignatureHash>
      _functions;
  XQueryRemarks _remarks;
  size_t _adopterCount = 0;
  int64_t _nextLocalVariableID = 1;
  std::unordered_map<Ref<XQueryQName>, int64_t, XQueryQNameHash, XQueryQNameEqual>
      _localVariableIDs;
  std::vector<NamedLocal> _localVariableLog;  // in the order the IDs were handed out
  XQueryNamespaceStack _inScopeNamespaces;
  bool _xmlSpacePreserve = false;
  bool _constructionPreserve = true;
  bool _ordered = true;
  bool _emptyLeast = true;
  bool _inheritNamespaces = true;

  friend class XQueryModuleImporter;
};

}  // namespace xquery
