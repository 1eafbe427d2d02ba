#include "Functions/XQueryFunctionCall.h"

#include "Context/StackGuard.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/XQueryParts.h"
#include "Expr/XQuerySequence.h"
#include "Prolog/XQueryDeclarations.h"
#include "Prolog/XQueryProlog.h"
#include "Types/XQueryErrors.h"

#include <vector>

namespace xquery {
namespace {

// Puts the caller's local variables aside for a frame of the callee's, and back on every way out.
class CalleeFrame {
 public:
  CalleeFrame(XQueryContextInternal& context, XQueryFrameRef frame)
      : _context(context), _other(std::move(frame)) {
    _context._exchangeInScopeVariables(_other);
  }
  CalleeFrame(const CalleeFrame&) = delete;
  CalleeFrame& operator=(const CalleeFrame&) = delete;
  ~CalleeFrame() { _context._exchangeInScopeVariables(_other); }

 private:
  XQueryContextInternal& _context;
  XQueryFrameRef _other;
};

// The same for the active prolog and its ordering mode.
class CalleeProlog {
 public:
  CalleeProlog(XQueryContextInternal& context, XQueryProlog& prolog)
      : _context(context), _prolog(context.activeProlog()), _ordered(context.ordered()) {
    _context.setActiveProlog(&prolog);
    _context.setOrdered(prolog.ordered());
  }
  CalleeProlog(const CalleeProlog&) = delete;
  CalleeProlog& operator=(const CalleeProlog&) = delete;
  ~CalleeProlog() {
    _context.setActiveProlog(_prolog);
    _context.setOrdered(_ordered);
  }

 private:
  XQueryContextInternal& _context;
  XQueryProlog* _prolog;
  bool _ordered;
};

// Calls with more arguments than this allocate the argument vector.
constexpr size_t bufferSlots = 3;

}  // namespace

Ref<XQueryFunctionCall> XQueryFunctionCall::functionCallWithName(Ref<NSString> name,
                                                                 Ref<XQueryArgs> withArgs) {
  return make<XQueryFunctionCall>(std::move(name), std::move(withArgs));
}

void XQueryFunctionCall::bindInfoForProlog(XQueryProlog& prolog) {
  if (const auto qName = prolog.functionQNameFromString(_name)) {
    if (const auto* entry = XQueryBuiltInFunction::entryForQName(qName)) {
      _builtIn = entry;
      _function = entry->proc();
    }
    if (!_function) _functionDecl = prolog.functionInfoForSignature({qName, argumentCount()});
  }
  if (!_function) prolog.countAdopter();
  if (_args) _args->bindInfoForProlog(prolog);
}

void XQueryFunctionCall::visitParts(XQueryPartVisitor& visitor) {
  visitor.ownPart(_args.get(), XQueryRole::Arguments);
}

Value XQueryFunctionCall::computeValue(XQueryContext& context) const {
  XQueryCheckStack(context);
  if (_functionDecl) return callDeclared(context);
  if (_function) return callBuiltIn(context);
  return evaluateArguments(context) ? failUndefined(context) : Value();
}

// For calls that fail whatever the arguments are, once these have been evaluated. False for an
// error among them.
bool XQueryFunctionCall::evaluateArguments(XQueryContext& context) const {
  for (size_t index = 0; index < argumentCount(); ++index) {
    if (XQueryHasFailed(argument(index, context), context)) return false;
  }
  return true;
}

// The arguments go straight into the callee's frame, which is not in force yet. False for an error
// among them.
inline bool XQueryFunctionCall::makeFrame(XQueryFrameRef& frame, XQueryContext& context) const {
  const size_t count = _functionDecl->params().size();
  if (count > 0) frame = make<XQueryFrame>();
  for (size_t index = 0; index < count; ++index) {
    if (!isLateArgument(index) && !passArgument(index, *frame, context)) return false;
  }
  if (_lateArguments == 0) return true;
  for (size_t index = 0; index < count; ++index) {
    if (isLateArgument(index) && !passArgument(index, *frame, context)) return false;
  }
  return true;
}

inline bool XQueryFunctionCall::passArgument(size_t index, XQueryFrame& to,
                                             XQueryContext& context) const {
  Value value = argument(index, context);
  if (XQueryHasFailed(value, context)) return false;
  if (const int64_t varID = _functionDecl->params()[index]->varID()) {
    to.setValue(std::move(value), varID);
  }
  return true;
}

Value XQueryFunctionCall::callDeclared(XQueryContext& context) const {
  auto& dynamic = _internal(context);
  const auto& params = _functionDecl->params();
  if (params.size() != argumentCount()) {
    return evaluateArguments(context) ? failInvalidArguments(context) : Value();
  }
  // An external function was never bound to anything.
  if (_functionDecl->isExternal()) {
    return evaluateArguments(context) ? failUndefined(context) : Value();
  }
  XQueryFrameRef frame;
  if (!makeFrame(frame, context)) return {};
  if (frame) frame->setLetsTake();
  const CalleeFrame calleeFrame(dynamic, std::move(frame));
  const CalleeProlog calleeProlog(dynamic, _functionDecl->prolog());
  Value result = _functionDecl->expr()->evaluateWithContext(context);
  if (!result || isa<XQueryError>(result)) return failInBody(result, context);
  return result;
}

// Passes on what the body failed with, or fails for what it gave instead of a value.
Value XQueryFunctionCall::failInBody(const Value& result, XQueryContext& context) const {
  auto& dynamic = _internal(context);
  if (auto* error = dyn_cast<XQueryError>(result)) dynamic.fail(error, exprPlace());
  if (!dynamic.isFailing()) return failUndefined(context);
  dynamic.failThroughCall(exprPlace(), _name.get());
  return {};
}

bool XQueryFunctionCall::hasBody() const {
  return _functionDecl && !_functionDecl->isExternal() && _functionDecl->expr() &&
         _functionDecl->params().size() == argumentCount();
}

bool XQueryFunctionCall::askBody(const std::function<bool(const XQueryExpr& body)>& ask,
                                 XQueryContext& context) const {
  XQueryCheckStack(context);
  XQueryFrameRef frame;
  if (!makeFrame(frame, context)) return false;
  auto& dynamic = _internal(context);
  const CalleeFrame calleeFrame(dynamic, std::move(frame));
  const CalleeProlog calleeProlog(dynamic, _functionDecl->prolog());
  if (ask(*_functionDecl->expr())) return true;
  failInBody(nullptr, context);
  return false;
}

Value XQueryFunctionCall::evaluatePartOfBody(const XQueryExpr& part,
                                             std::span<const size_t> parameters,
                                             XQueryContext& context) const {
  XQueryCheckStack(context);
  const auto& params = _functionDecl->params();
  XQueryFrameRef frame = params.empty() ? XQueryFrameRef() : make<XQueryFrame>();
  for (const size_t index : parameters) {
    Value value = argument(index, context);
    if (XQueryHasFailed(value, context)) return {};
    if (const int64_t varID = params[index]->varID()) frame->setValue(std::move(value), varID);
  }
  auto& dynamic = _internal(context);
  const CalleeFrame calleeFrame(dynamic, std::move(frame));
  const CalleeProlog calleeProlog(dynamic, _functionDecl->prolog());
  Value result = part.evaluateWithContext(context);
  if (XQueryHasFailed(result, context)) dynamic.failThroughCall(exprPlace(), _name.get());
  return result;
}

Value XQueryFunctionCall::callBuiltIn(XQueryContext& context) const {
  const size_t count = argumentCount();
  if (count <= bufferSlots) {
    Value arguments[bufferSlots];
    return callBuiltIn(count == 0 ? nullptr : arguments, count, context);
  }
  std::vector<Value> arguments(count);
  return callBuiltIn(arguments.data(), count, context);
}

Value XQueryFunctionCall::callBuiltIn(Value* arguments, size_t count,
                                      XQueryContext& context) const {
  auto& dynamic = _internal(context);
  bool isComplete = true;
  for (size_t index = 0; index < count; ++index) {
    arguments[index] = normalised(argument(index, context));
    if (arguments[index]) continue;
    if (dynamic.isFailing()) return {};
    isComplete = false;
  }
  // An argument without a value, as "." is without a focus, is none that a function could use.
  if (!isComplete) return failInvalidArguments(context);
  const XQueryTakingProcedure taking = _builtIn->row().takingProc;
  if (!taking) return callBuiltInWith(arguments, count, context);
  const CalleeFrame calleeFrame(dynamic, nullptr);
  return checkedAnswer(taking(arguments, count, context), context);
}

Value XQueryFunctionCall::callBuiltInWith(const Value* arguments, size_t count,
                                          XQueryContext& context) const {
  const CalleeFrame calleeFrame(_internal(context), nullptr);
  return checkedAnswer(_function(arguments, count, context), context);
}

// Of a built-in function, for its arguments.
Value XQueryFunctionCall::checkedAnswer(Value answer, XQueryContext& context) const {
  auto& dynamic = _internal(context);
  Value result = normalised(std::move(answer));
  if (!result) return failInvalidArguments(context);
  if (auto* error = dyn_cast<XQueryError>(result)) return dynamic.fail(error, exprPlace());
  return result;
}

Value XQueryFunctionCall::failUndefined(XQueryContext& context) const {
  return _internal(context).fail(XQueryErrors::undefinedFunction.errorAtLine(exprLine(), _name),
                                 exprPlace());
}

Value XQueryFunctionCall::failInvalidArguments(XQueryContext& context) const {
  return _internal(context).fail(XQueryErrors::invalidArguments.errorAtLine(exprLine(), _name),
                                 exprPlace());
}

}  // namespace xquery
