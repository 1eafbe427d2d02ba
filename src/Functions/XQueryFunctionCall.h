// A call of a built-in or a declared function.
#pragma once

#include "Expr/XQueryExpr.h"
#include "Expr/XQueryLists.h"
#include "Functions/XQueryBuiltInFunction.h"

#include <cstddef>
#include <cstdint>
#include <functional>
#include <span>
#include <utility>

namespace xquery {

class XQueryFrame;
class XQueryFunctionDecl;

class XQueryFunctionCall : public XQueryExpr {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::FunctionCall; }

  // The name as written, prefix included; null arguments are none.
  [[nodiscard]] static Ref<XQueryFunctionCall> functionCallWithName(Ref<NSString> name,
                                                                    Ref<XQueryArgs> withArgs);

  const Ref<NSString>& name() const { return _name; }
  XQueryArgs* args() const { return _args.get(); }
  // What binding found: a procedure, a declaration (owned by its prolog), or neither.
  XQueryProcedure function() const { return _function; }
  // The entry of the procedure in the registry; null for a function that is not built in.
  const XQueryBuiltInFunction* builtIn() const { return _builtIn; }
  XQueryFunctionDecl* functionDecl() const { return _functionDecl; }

  // A built-in function wins over a declared one of the same name, whatever the number of
  // arguments. A name that cannot be resolved is no error before the call is evaluated.
  void bindInfoForProlog(XQueryProlog& prolog) override;

  // Of a call of a declared function: the argument is evaluated behind those that are not late.
  // That cannot fail, and nobody can tell when it is done.
  void setLateArgument(size_t index) { _lateArguments |= uint64_t{1} << index; }
  bool isLateArgument(size_t index) const {
    return index < mostLateArguments && ((_lateArguments >> index) & 1) != 0;
  }
  static constexpr size_t mostLateArguments = 64;

  // Evaluates the arguments and calls. The callee sees none of the caller's local variables; of a
  // declared function the body is evaluated in the static context of the prolog that declared it.
  // Argument values are handed over as they are: declared types are not applied.
  //   error 8   function ... not defined for context   nothing was found, or it gave no value
  //   error 17  invalid arguments to function - ...    the built-in function refused its arguments
  // An error that the function answers is one of the call.
  Value computeValue(XQueryContext& context) const override;
  void visitParts(XQueryPartVisitor& visitor) override;
  // Whether a declared function is called that has a body and takes so many arguments.
  bool hasBody() const;
  // Of such a call: asks the body for something else than its value, in the callee's frame. False
  // after an error, which not being answered is as well.
  bool askBody(const std::function<bool(const XQueryExpr& body)>& ask,
               XQueryContext& context) const;
  // Of a built-in function: what it answers for arguments that have been evaluated, without errors.
  Value callBuiltInWith(const Value* arguments, size_t count, XQueryContext& context) const;
  // Error 17, for whoever works out what a built-in function would.
  [[gnu::noinline, gnu::cold]] Value failInvalidArguments(XQueryContext& context) const;
  // Of a declared function: what a part of its body comes to in this call, where it reads these
  // parameters and no other local variable. The other arguments are not evaluated.
  Value evaluatePartOfBody(const XQueryExpr& part, std::span<const size_t> parameters,
                           XQueryContext& context) const;

 protected:
  XQueryFunctionCall(Ref<NSString> name, Ref<XQueryArgs> args)
      : XQueryExpr(Kind::FunctionCall), _name(std::move(name)), _args(std::move(args)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  size_t argumentCount() const { return _args ? _args->count() : 0; }
  Value argument(size_t index, XQueryContext& context) const {
    return _args->objectAtIndex(index)->evaluateWithContext(context);
  }
  bool evaluateArguments(XQueryContext& context) const;
  bool makeFrame(Ref<XQueryFrame>& frame, XQueryContext& context) const;
  bool passArgument(size_t index, XQueryFrame& to, XQueryContext& context) const;
  Value callDeclared(XQueryContext& context) const;
  Value callBuiltIn(XQueryContext& context) const;
  Value callBuiltIn(Value* arguments, size_t count, XQueryContext& context) const;
  Value checkedAnswer(Value answer, XQueryContext& context) const;
  // Out of line: what they need of the stack is no part of a recursion's frames.
  [[gnu::noinline, gnu::cold]] Value failInBody(const Value& result, XQueryContext& context) const;
  [[gnu::noinline, gnu::cold]] Value failUndefined(XQueryContext& context) const;

  Ref<NSString> _name;
  Ref<XQueryArgs> _args;
  XQueryProcedure _function = nullptr;
  const XQueryBuiltInFunction* _builtIn = nullptr;
  XQueryFunctionDecl* _functionDecl = nullptr;
  uint64_t _lateArguments = 0;
};

}  // namespace xquery
