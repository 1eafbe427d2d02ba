// The static context: how it is built from the prolog items, and its namespaces and names. Where a
// URI or a prefix has an ID at all is a question for the registry of modules; here is which prefix
// stands for which ID.
#include "Prolog/XQueryProlog.h"

#include "Platform/Base/Counting.h"
#include "Platform/Base/LastingObjects.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Base/XQueryErrorTrace.h"
#include "Platform/Loading/NSURLLoader.h"
#include "Prolog/XQueryDeclarations.h"
#include "Prolog/XQueryModuleImporter.h"
#include "Prolog/XQueryModules.h"
#include "Prolog/XQueryPrologItems.h"
#include "Types/MessageText.h"
#include "Types/XQueryErrors.h"

#include <algorithm>
#include <array>

namespace xquery {

namespace {

struct PredeclaredPrefix {
  std::string_view prefix;
  int64_t namespaceID;
};

constexpr std::array<PredeclaredPrefix, 9> predeclaredPrefixes = {{
    {"local", XQueryNamespaceLocal},
    {"xml", XQueryNamespaceXML},
    {"xs", XQueryNamespaceXS},
    {"xsi", XQueryNamespaceXSI},
    {"fn", XQueryNamespaceFN},
    {"xdt", XQueryNamespaceXDT},
    {"err", XQueryNamespaceErr},
    {"ext", XQueryNamespaceExt},
    {"html", XQueryNamespaceXHTML},
}};

constexpr size_t prefixSlotCount = predeclaredPrefixes.size() + 2;
using PrefixSlots = std::array<Value, prefixSlotCount>;

// The prefixes stand in one row from slot 2 on, so that from the fourth ID on, which has none of
// its own, each stands one place below its ID. What prefix a constructed element gets depends on
// this.
PrefixSlots makePredeclaredSlots() {
  const LastingObjects lasting;
  PrefixSlots slots;
  slots[0] = slots[1] = NSNull::null();
  for (size_t index = 0; index < predeclaredPrefixes.size(); ++index) {
    auto prefix = NSString::stringWithASCII(predeclaredPrefixes[index].prefix);
    NSCounting::makeImmortal(*prefix);
    slots[index + 2] = prefix;
  }
  return slots;
}

const PrefixSlots& predeclaredSlots() {
  static const PrefixSlots slots = makePredeclaredSlots();
  return slots;
}

int64_t predeclaredIDForPrefix(NSStringView prefix) {
  for (const auto& row : predeclaredPrefixes) {
    if (prefix == row.prefix) return row.namespaceID;
  }
  return XQueryNamespaceNone;
}

bool isBuiltinID(int64_t id) {
  return id >= 1 && id < XQueryNamespaceFirstUser;
}

}  // namespace

// --- construction --------------------------------------------------------------------------------

XQueryProlog::XQueryProlog(Ref<XQueryModules> modules, Ref<NSURLLoader> loader)
    : NSCounted(Kind::Prolog),
      _modules(modules ? modules : XQueryModules::modules(std::move(loader))),
      _madeModules(!modules),
      _namespacePrefixes(predeclaredSlots().begin(), predeclaredSlots().end()) {}

XQueryProlog::~XQueryProlog() {
  if (_madeModules) _modules->removePrologs();
}

Ref<XQueryProlog> XQueryProlog::prologWithItems(const std::vector<Ref<XQueryPrologItem>>& items,
                                                Ref<NSString> atLocation,
                                                Ref<XQueryModules> forModules,
                                                const Ref<NSString>& version,
                                                Ref<NSURLLoader> loader, Ref<XQueryPlaces> places) {
  Ref<NSURL> moduleURL;
  if (loader) {
    moduleURL = NSURL::URLWithString(NSString::stringWithUTF8(loader->loading().moduleURL));
  }
  auto prolog = make<XQueryProlog>(std::move(forModules), std::move(loader));
  if (places) prolog->_modules->setPlaces(std::move(places));
  prolog->_start(items, std::move(atLocation), version, std::move(moduleURL));
  XQueryModuleImporter().build(prolog);
  if (prolog->_madeModules) prolog->_modules->endLoading();
  return prolog;
}

void XQueryProlog::_start(const std::vector<Ref<XQueryPrologItem>>& items, Ref<NSString> atLocation,
                          const Ref<NSString>& version, Ref<NSURL> moduleURL) {
  if (version && !(version->view() == "1.0")) {
    addError(XQueryErrors::unsupportedVersion.error(version));
  }
  _location = std::move(atLocation);
  // A relative one leads nowhere.
  if (moduleURL && !moduleURL->scheme().empty()) _moduleURL = std::move(moduleURL);
  findLocationBase();
  _addItems(items);
  if (isModule()) _modules->addProlog(this, namespaceIDForPrefix(_modulePrefix->view()));
}

bool XQueryProlog::madeModules(const XQueryModules& modules) const {
  return _madeModules && _modules == &modules;
}

void XQueryProlog::setBaseURI(Ref<NSString> baseURI) {
  _baseURI = std::move(baseURI);
  findLocationBase();
}

// A base URI that is relative itself is one below the module's.
void XQueryProlog::findLocationBase() {
  _locationBase = _moduleURL;
  if (!_baseURI) return;
  const Ref<NSURL> declared =
      _moduleURL ? NSURL::URLWithString(_baseURI, *_moduleURL) : NSURL::URLWithString(_baseURI);
  if (declared && !declared->scheme().empty()) _locationBase = declared;
}

Ref<NSURL> XQueryProlog::URLForLocation(const Ref<NSString>& location) const {
  return _locationBase ? NSURL::URLWithString(location, *_locationBase)
                       : NSURL::URLWithString(location);
}

void XQueryProlog::_addItems(const std::vector<Ref<XQueryPrologItem>>& items) {
  for (const auto& item : items) {
    checkWork();
    item->XQueryUpdateProlog(*this);
  }
}

void XQueryProlog::addError(Ref<XQueryError> error, XQueryPlaceNumber at) {
  if (at != 0 && !XQueryErrorTrace::of(*error)) {
    error =
        XQueryErrorTrace::error(*error, XQueryErrorTrace::traceInPlaces(_modules->places(), at));
  }
  _errors.push_back(std::move(error));
}

void XQueryProlog::addQNameReference(Ref<XQueryExpr> reference) {
  _qNameReferences.push_back(std::move(reference));
}

void XQueryProlog::addModule(Ref<XQueryPrologItemModuleImport> item) {
  _moduleImports.push_back(std::move(item));
}

void XQueryProlog::addSchema(Ref<XQueryPrologItemSchemaImport> item) {
  _schemaImports.push_back(std::move(item));
}

void XQueryProlog::setDefaultSchema(const Ref<NSString>&, const Ref<NSString>&) {}

// --- namespaces ----------------------------------------------------------------------------------

Ref<NSString> XQueryProlog::defaultFunctionNamespace() const {
  return _defaultFunctionNamespace ? _defaultFunctionNamespace : namespaceForID(XQueryNamespaceFN);
}

void XQueryProlog::setDefaultElementNamespace(Ref<NSString> URI) {
  addNamespace(URI);
  _defaultElementNamespace = std::move(URI);
}

void XQueryProlog::setDefaultFunctionNamespace(Ref<NSString> URI) {
  addNamespace(URI);
  _defaultFunctionNamespace = std::move(URI);
}

Ref<NSString> XQueryProlog::namespaceForPrefix(NSStringView prefix, bool& fromProlog) const {
  checkWork();
  const NSXMLNode* declaration = _inScopeNamespaces.forPrefix(prefix);
  fromProlog = !declaration;
  if (declaration) return declaration->stringValue();
  return namespaceForID(namespaceIDForPrefix(prefix));
}

Ref<NSString> XQueryProlog::namespaceForPrefix(NSStringView prefix) const {
  bool fromProlog = false;
  return namespaceForPrefix(prefix, fromProlog);
}

Ref<NSString> XQueryProlog::namespaceForID(int64_t id) const {
  return _modules->namespaceForID(id);
}

int64_t XQueryProlog::namespaceID(const Ref<NSString>& URI) const {
  return _modules->namespaceID(URI, false);
}

int64_t XQueryProlog::namespaceIDForPrefix(NSStringView prefix) const {
  const auto found = _namespacePrefixIDs.find(prefix);
  return found != _namespacePrefixIDs.end() ? found->second : predeclaredIDForPrefix(prefix);
}

Value XQueryProlog::prefixesForID(int64_t id) const {
  if (id < 1 || id >= static_cast<int64_t>(_namespacePrefixes.size())) return nullptr;
  const Value& slot = _namespacePrefixes[static_cast<size_t>(id)];
  return isa<NSNull>(slot) ? nullptr : slot;
}

int64_t XQueryProlog::addNamespace(const Ref<NSString>& URI) {
  return _modules->namespaceID(URI, true);
}

// A slot of a built-in namespace that holds one prefix is cleared whatever that prefix is: the row
// of predeclared prefixes is shifted, so it may be another one's.
void XQueryProlog::removePrefix(const Ref<NSString>& prefix, int64_t fromBuiltinID) {
  const auto index = static_cast<size_t>(fromBuiltinID);
  if (index >= _namespacePrefixes.size()) return;
  Value& slot = _namespacePrefixes[index];
  if (auto* several = dyn_cast<NSArray>(slot)) {
    std::erase_if(several->objects(), [&](const Value& other) {
      return cast<NSString>(other)->isEqualToString(*prefix);
    });
  } else {
    slot = NSNull::null();
  }
}

void XQueryProlog::addPrefix(const Ref<NSString>& prefix, const Ref<NSString>& forNamespace) {
  const int64_t id = addNamespace(forNamespace);
  if (id == XQueryNamespaceNone || !prefix) return;
  const int64_t previousID = namespaceIDForPrefix(prefix->view());
  if (isBuiltinID(previousID)) removePrefix(prefix, previousID);
  _namespacePrefixIDs.insert_or_assign(prefix, id);

  const auto index = static_cast<size_t>(id);
  if (index >= _namespacePrefixes.size()) _namespacePrefixes.resize(index + 1, NSNull::null());
  Value& slot = _namespacePrefixes[index];
  if (isa<NSNull>(slot)) {
    slot = prefix;
  } else if (auto* several = dyn_cast<NSArray>(slot)) {
    several->objects().push_back(prefix);
  } else {
    slot = NSArray::arrayWithObjects({slot, prefix});
  }
}

void XQueryProlog::pushInScopeNamespaces(std::vector<Ref<NSXMLNode>> namespaces) {
  _inScopeNamespaces.push(std::move(namespaces));
}

void XQueryProlog::popInScopeNamespaces() {
  _inScopeNamespaces.pop();
}

// --- names ---------------------------------------------------------------------------------------

Ref<XQueryQName> XQueryProlog::variableQNameFromString(const Ref<NSString>& name) const {
  Ref<NSString> prefix;
  Ref<NSString> localPart;
  XQueryQName::parseQNameString(name, prefix, localPart);
  if (prefix->length() == 0) return XQueryQName::qname(localPart, nullptr);
  const auto URI = namespaceForPrefix(prefix->view());
  return URI ? XQueryQName::qname(localPart, URI) : nullptr;
}

Ref<XQueryQName> XQueryProlog::functionQNameFromString(const Ref<NSString>& name) const {
  Ref<NSString> prefix;
  Ref<NSString> localPart;
  XQueryQName::parseQNameString(name, prefix, localPart);
  const auto URI =
      prefix->length() == 0 ? defaultFunctionNamespace() : namespaceForPrefix(prefix->view());
  return URI ? XQueryQName::qname(localPart, URI) : nullptr;
}

Ref<XQueryQName> XQueryProlog::xmlQNameFromString(const Ref<NSString>& name) const {
  checkWork();
  XQueryQName::Range prefix;
  XQueryQName::Range localPart;
  XQueryQName::parseQNameString(name->view(), prefix, localPart);
  Ref<NSString> URI;
  if (prefix.length > 0) {
    URI = namespaceForPrefix(name->view().substring(prefix.location, prefix.length));
    if (!URI) return nullptr;
  } else {
    URI = _defaultElementNamespace;
    if (!URI && !isModule()) return nullptr;
  }
  return localPart.length == 0 ? nullptr : XQueryQName::qname(name, URI);
}

// --- diagnostics ---------------------------------------------------------------------------------

Ref<NSString> XQueryProlog::description() const {
  const auto word = [](bool value, std::string_view yes, std::string_view no) {
    return value ? yes : no;
  };
  return messageText("<XQueryProlog location:", _location, " module prefix:", _modulePrefix,
                     " base uri:", _baseURI, " default collation:", _defaultCollation,
                     " default element namespace:", _defaultElementNamespace,
                     " default function namespace:", defaultFunctionNamespace(),
                     " xmlspace:", word(_xmlSpacePreserve, "preserve", "strip"),
                     " construction:", word(_constructionPreserve, "preserve", "strip"),
                     " ordering:", word(_ordered, "ordered", "unordered"),
                     " empty:", word(_emptyLeast, "least", "greatest"),
                     " inherit namespaces:", word(_inheritNamespaces, "YES", "NO"),
                     " validation:", static_cast<int64_t>(_schemaMode),
                     " declarations:", static_cast<int64_t>(_declarations.size()),
                     " module imports:", static_cast<int64_t>(_moduleImports.size()),
                     " schema imports:", static_cast<int64_t>(_schemaImports.size()),
                     " errors:", static_cast<int64_t>(_errors.size()), ">");
}

}  // namespace xquery
