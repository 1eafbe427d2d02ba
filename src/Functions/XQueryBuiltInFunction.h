// The registry of built-in functions.
//
// It is keyed by name alone and knows nothing of argument counts: every procedure checks its own.
#pragma once

#include "Prolog/XQueryModules.h"
#include "Types/XQueryQName.h"
#include "xquery/Object.h"

#include <cstddef>
#include <cstdint>
#include <span>
#include <string_view>

namespace xquery {

class XQueryContext;

// Evaluated arguments (a null pointer for none), their number, and the context. No argument is
// null, and none is an array of fewer than two elements. The answer is
//   a value         an item, an array (of any number of items) or NSNull
//   an XQueryError  a failure, which the call raises
//   null            wrong arguments: a wrong number of them, or of a kind that cannot be used
using XQueryProcedure = Value (*)(const Value* arguments, size_t count, XQueryContext& context);

class XQueryBuiltInFunction : public NSCounted {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::BuiltInFunction; }

  // What the analysis of expressions may count on.
  enum Traits : uint8_t {
    // The function answers equal values for the same arguments, fails alike, looks at nothing else
    // and does nothing else. Holds for calls with at least one argument: without any, some of these
    // functions take the context item.
    ReadsArgumentsOnly = 1,
    // It answers truth values and nothing else.
    AnswersTruth = 2,
    // A call asks the host for a document, which the host can tell.
    LoadsDocuments = 4,
  };

  [[nodiscard]] static Ref<XQueryBuiltInFunction> builtInFunctionWithProc(XQueryProcedure proc);
  XQueryProcedure proc() const { return _proc; }
  bool has(Traits trait) const { return (_traits & trait) != 0; }

  // Null for a name that is not registered.
  static XQueryProcedure functionForQName(const Ref<XQueryQName>& qName);
  static const XQueryBuiltInFunction* entryForQName(const Ref<XQueryQName>& qName);

  struct Registration {
    XQueryNamespaceID namespaceID;
    std::string_view localName;
    XQueryProcedure proc;
    uint8_t traits = 0;
  };
  // Every built-in function, in the order of registration.
  static std::span<const Registration> registrations();

 protected:
  explicit XQueryBuiltInFunction(XQueryProcedure initWithProc, uint8_t traits = 0)
      : NSCounted(Kind::BuiltInFunction), _proc(initWithProc), _traits(traits) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  XQueryProcedure _proc;
  uint8_t _traits;
};

}  // namespace xquery
