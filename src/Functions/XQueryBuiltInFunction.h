// The registry of built-in functions.
//
// It is keyed by name alone and knows nothing of argument counts: every procedure checks its own.
#pragma once

#include "Prolog/XQueryModules.h"
#include "Types/XQueryItemKinds.h"
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
// The same for arguments that are not needed behind the call, and may be taken apart.
using XQueryTakingProcedure = Value (*)(Value* arguments, size_t count, XQueryContext& context);

class XQueryBuiltInFunction : public NSCounted {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::BuiltInFunction; }

  // What the analysis of expressions may count on, for every call that answers a value.
  enum Traits : uint32_t {
    // Looks at what lies outside the subtrees of the nodes it is given: what is around them.
    LooksAround = 1 << 0,
    // Looks at the context item; the second one when it is called with fewer arguments than it
    // takes.
    ReadsFocus = 1 << 1,
    FocusByDefault = 1 << 2,
    ReadsPosition = 1 << 3,
    ReadsSize = 1 << 4,
    // Looks at the static context, the zone or the clock, which stay what they are at one place of
    // a query for all of an evaluation.
    ReadsStatic = 1 << 5,
    // A call asks the host for a document, which the host can tell.
    LoadsDocuments = 1 << 6,
    // Its answer may hold nodes that did not exist before.
    MakesNodes = 1 << 7,
    // The host hears of each call.
    Traces = 1 << 8,
    // Called again with the same arguments it may answer something else, or do more.
    Unrepeatable = 1 << 9,
    // With a number of arguments that it takes, each with a value, it always answers one.
    NeverFails = 1 << 10,
    // Of what it hands on of its first argument: items stay in their order; none is left out.
    KeepsOrder = 1 << 11,
    KeepsCount = 1 << 12,
    // Of nodes among its arguments, or that are the context item, it looks at nothing but: what
    // atomizing them gives, and hands on none of the first argument's; their kinds and names; how
    // many the first argument has, and the values of the others. Of a function that has none of
    // these it is not known.
    LooksAtValues = 1 << 13,
    LooksAtNames = 1 << 14,
    LooksAtCount = 1 << 15,
  };

  // Kinds of an answer besides the plain ones: those of the first argument, of all arguments, and
  // of what atomizing the first argument gives. The first two hand on the items themselves.
  static constexpr XQueryItemKinds OfFirst = 1U << 29;
  static constexpr XQueryItemKinds OfAll = 1U << 30;
  static constexpr XQueryItemKinds AtomizedFirst = 1U << 31;
  static constexpr uint8_t many = 255;
  // Of which kinds the items of an answer are, and how many there are at least and at most.
  struct Answer {
    XQueryItemKinds kinds;
    uint8_t least;
    uint8_t most;
  };
  // Called with another number of them the function refuses.
  struct Arguments {
    uint8_t least;
    uint8_t most;
  };
  struct Registration {
    XQueryNamespaceID namespaceID;
    std::string_view localName;
    XQueryProcedure proc;
    Arguments arguments;
    Answer answer;
    uint32_t traits = 0;
    // Null for most.
    XQueryTakingProcedure takingProc = nullptr;

    bool has(Traits trait) const { return (traits & trait) != 0; }
    bool takes(size_t argumentCount) const {
      return argumentCount >= arguments.least &&
             (argumentCount <= arguments.most || arguments.most == many);
    }
    bool readsContextItem(size_t argumentCount) const;
    // Whether a call answers equal values for the same arguments, fails alike, looks at nothing
    // else and does nothing else.
    bool readsArgumentsOnly(size_t argumentCount) const;
    // Whether it answers truth values and nothing else.
    bool answersTruth() const { return answer.kinds == XQueryItems::Boolean && answer.least == 1; }
  };

  [[nodiscard]] static Ref<XQueryBuiltInFunction> builtInFunctionWithProc(XQueryProcedure proc);
  XQueryProcedure proc() const { return _row.proc; }
  const Registration& row() const { return _row; }

  // Null for a name that is not registered.
  static XQueryProcedure functionForQName(const Ref<XQueryQName>& qName);
  static const XQueryBuiltInFunction* entryForQName(const Ref<XQueryQName>& qName);

  // Every built-in function, in the order of registration.
  static std::span<const Registration> registrations();

 protected:
  explicit XQueryBuiltInFunction(const Registration& row)
      : NSCounted(Kind::BuiltInFunction), _row(row) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Registration _row;
};

}  // namespace xquery
