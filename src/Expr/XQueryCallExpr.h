// What the analysis of expressions has to know of a function call.
#pragma once

#include "Expr/XQueryExpr.h"
#include "Expr/XQueryLists.h"

#include <utility>

namespace xquery {

class XQueryCallExpr : public XQueryExpr {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::FunctionCall; }

  // Null arguments are none.
  XQueryArgs* args() const { return _args.get(); }
  // Whether the function answers equal values for the same arguments, fails alike, looks at nothing
  // else and does nothing else. Found by binding.
  bool readsArgumentsOnly() const { return _readsArgumentsOnly; }
  // Whether a call asks the host for a document, which the host can tell. Found by binding.
  bool loadsDocuments() const { return _loadsDocuments; }
  // Whether a call answers truth values and nothing else. Found by binding.
  bool answersTruth() const { return _answersTruth; }

 protected:
  explicit XQueryCallExpr(Ref<XQueryArgs> args)
      : XQueryExpr(Kind::FunctionCall), _args(std::move(args)) {}

  Ref<XQueryArgs> _args;
  bool _readsArgumentsOnly = false;
  bool _loadsDocuments = false;
  bool _answersTruth = false;
};

}  // namespace xquery
