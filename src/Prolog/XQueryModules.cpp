#include "Prolog/XQueryModules.h"

#include "Platform/Base/Counting.h"
#include "Platform/Base/LastingObjects.h"
#include "Prolog/XQueryProlog.h"

#include <array>
#include <string_view>

namespace xquery {

namespace {

constexpr std::array<std::string_view, XQueryNamespaceFirstUser> builtinURIs = {
    "",
    "http://www.w3.org/2004/10/xpath-functions/collation/codepoint",
    "http://www.w3.org/2004/10/xquery-local-functions",
    "http://www.w3.org/XML/1998/namespace",
    "http://www.w3.org/2000/xmlns",
    "http://www.w3.org/2001/XMLSchema",
    "http://www.w3.org/2001/XMLSchema-instance",
    "http://www.w3.org/2004/10/xpath-functions",
    "http://www.w3.org/2004/10/xpath-datatypes",
    "http://www.w3.org/2004/10/xqt-errors",
    "http://libxquery.example/xquery/2004/10/functions",
    "http://www.w3.org/1999/xhtml",
};

using BuiltinNamespaces = std::array<Ref<NSString>, XQueryNamespaceFirstUser>;

BuiltinNamespaces makeBuiltinNamespaces() {
  const LastingObjects lasting;
  BuiltinNamespaces namespaces;
  for (size_t id = 1; id < builtinURIs.size(); ++id) {
    namespaces[id] = NSString::stringWithASCII(builtinURIs[id]);
    NSCounting::makeImmortal(*namespaces[id]);
  }
  return namespaces;
}

const BuiltinNamespaces& builtinNamespaces() {
  static const BuiltinNamespaces namespaces = makeBuiltinNamespaces();
  return namespaces;
}

// The list is short and most lengths differ: a walk beats a hash.
int64_t builtinIDForNamespace(NSStringView URI) {
  for (size_t id = 1; id < builtinURIs.size(); ++id) {
    if (URI == builtinURIs[id]) return static_cast<int64_t>(id);
  }
  return XQueryNamespaceNone;
}

}  // namespace

XQueryModules::XQueryModules(Ref<NSURLLoader> loader)
    : NSCounted(Kind::Modules), _loader(std::move(loader)) {}

XQueryModules::~XQueryModules() = default;

Ref<XQueryModules> XQueryModules::modules(Ref<NSURLLoader> loader) {
  return make<XQueryModules>(loader ? std::move(loader) : NSURLLoader::loaderWithLoading());
}

Ref<NSString> XQueryModules::builtinNamespaceForID(int64_t id) {
  if (id < 1 || id >= XQueryNamespaceFirstUser) return nullptr;
  return builtinNamespaces()[static_cast<size_t>(id)];
}

Ref<NSString> XQueryModules::namespaceForID(int64_t id) const {
  if (id < XQueryNamespaceFirstUser) return builtinNamespaceForID(id);
  const auto index = static_cast<size_t>(id - XQueryNamespaceFirstUser);
  if (index >= _namespaces.size() || _namespaces[index]->length() == 0) return nullptr;
  return _namespaces[index];
}

int64_t XQueryModules::namespaceID(const Ref<NSString>& URI, bool canCreate) {
  if (!URI) return XQueryNamespaceNone;
  if (const int64_t builtinID = builtinIDForNamespace(URI->view())) return builtinID;
  if (const auto found = _namespaceIDs.find(URI); found != _namespaceIDs.end()) {
    return found->second;
  }
  if (!canCreate) return XQueryNamespaceNone;
  const int64_t id = XQueryNamespaceFirstUser + static_cast<int64_t>(_namespaces.size());
  _namespaces.push_back(URI);
  _namespaceIDs.emplace(URI, id);
  return id;
}

XQueryProlog* XQueryModules::prologForID(int64_t id) const {
  if (id < 1 || id >= static_cast<int64_t>(_prologs.size())) return nullptr;
  return _prologs[static_cast<size_t>(id)];
}

void XQueryModules::addProlog(Ref<XQueryProlog> prolog, int64_t forID) {
  if (!prolog || forID < 1) return;
  const auto index = static_cast<size_t>(forID);
  if (index >= _prologs.size()) _prologs.resize(index + 1);
  _prologs[index] = prolog.get();
  if (!prolog->madeModules(*this)) _ownedPrologs.push_back(std::move(prolog));
}

void XQueryModules::removePrologs() {
  _prologs.clear();
  // The registry may go with the last of them.
  const auto removed = std::move(_ownedPrologs);
}

Ref<NSString> XQueryModules::sourceAtURL(const Ref<NSURL>& URL) {
  if (!_loader || _sourceCount >= _loader->loading().limits.mostModules) return {};
  ++_sourceCount;
  const auto data =
      _loader->URLHandle(URL, XQueryLoadPurpose::Module, true)->resourceData(*_loader);
  return data ? NSString::stringWithUTF8(data->bytes()) : Ref<NSString>();
}

}  // namespace xquery
