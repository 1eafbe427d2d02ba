// Namespace IDs of one compilation, and the library modules it loaded.
//
// Who keeps whom: every prolog owns its registry, and the registry owns the library prologs that
// register with it. The cycle is broken by the prolog that made the registry, the main module's:
// the registry only points at that one, and is emptied by it when it goes. A library prolog that is
// replaced under its ID is kept as well, for others may have copied its declarations by then.
#pragma once

#include "Platform/Base/XQueryPlaces.h"
#include "Platform/Loading/NSURLLoader.h"
#include "Prolog/StringTable.h"
#include "xquery/Object.h"
#include "xquery/String.h"

#include <cstdint>
#include <vector>
namespace xquery {

class XQueryProlog;

enum XQueryNamespaceID : int64_t {
  XQueryNamespaceNone = 0,
  XQueryNamespaceCodepointCollation = 1,
  XQueryNamespaceLocal = 2,
  XQueryNamespaceXML = 3,
  XQueryNamespaceXmlns = 4,
  XQueryNamespaceXS = 5,
  XQueryNamespaceXSI = 6,
  XQueryNamespaceFN = 7,
  XQueryNamespaceXDT = 8,
  XQueryNamespaceErr = 9,
  XQueryNamespaceExt = 10,
  XQueryNamespaceXHTML = 11,
  XQueryNamespaceFirstUser = 12,
};

class XQueryModules : public NSCounted {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::Modules; }
  // Null for a loader with the settings that a compilation starts with.
  [[nodiscard]] static Ref<XQueryModules> modules(Ref<NSURLLoader> loader = nullptr);

  // The built-in URI for IDs 1 to 11, else null.
  static Ref<NSString> builtinNamespaceForID(int64_t id);
  // Null for ID 0, past the end, and for an empty URI.
  Ref<NSString> namespaceForID(int64_t id) const;
  // 0 for an unknown URI that may not be created. The first new one gets 12.
  int64_t namespaceID(const Ref<NSString>& URI, bool canCreate);
  // Null for an ID below 1, past the end, and where no prolog was added.
  XQueryProlog* prologForID(int64_t id) const;
  // Replaces what was there.
  void addProlog(Ref<XQueryProlog> prolog, int64_t forID);
  void removePrologs();

  // Where the expressions of all modules of the compilation stand.
  const Ref<XQueryPlaces>& places() const { return _places; }
  void setPlaces(Ref<XQueryPlaces> places) { _places = std::move(places); }

  // The text behind a URL. Null when the URL is relative, when it may not or cannot be read, when
  // it is not UTF-8, and once the compilation has asked for as many as it may.
  Ref<NSString> sourceAtURL(const Ref<NSURL>& URL);
  // Nothing is loaded any more: lets go of what was fetched.
  void endLoading() { _loader = nullptr; }

 protected:
  explicit XQueryModules(Ref<NSURLLoader> loader);
  ~XQueryModules() override;
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  std::vector<Ref<NSString>> _namespaces;  // from ID 12 on; the built-in ones are shared
  StringTable<int64_t> _namespaceIDs;      // the same namespaces
  std::vector<XQueryProlog*> _prologs;     // by ID
  std::vector<Ref<XQueryProlog>> _ownedPrologs;
  Ref<XQueryPlaces> _places = XQueryPlaces::places();
  Ref<NSURLLoader> _loader;  // null when nothing may be loaded any more
  uint32_t _sourceCount = 0;
};

}  // namespace xquery
