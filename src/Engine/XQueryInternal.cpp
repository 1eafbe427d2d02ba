#include "Engine/XQueryInternal.h"

#include "Check/Check.h"
#include "Parser/XQueryParser.h"
#include "Plan/Plan.h"
#include "Plan/Profile/XQueryProfiledProgram.h"
#include "Platform/Loading/NSURLLoader.h"
#include "Prolog/XQueryModules.h"
#include "Prolog/XQueryParsedModule.h"
#include "Prolog/XQueryProlog.h"
#include "Prolog/XQueryPrologItems.h"

namespace xquery {

XQueryInternal::XQueryInternal(const Ref<NSString>& initWithSource, const XQueryLoading& loading,
                               XQueryWay way) {
  if (way == XQueryWay::Profiled) {
    const auto start = std::chrono::steady_clock::now();
    compile(initWithSource, loading, way);
    completeProfiledProgram(initWithSource, std::chrono::steady_clock::now() - start);
  } else {
    compile(initWithSource, loading, way);
  }
}

void XQueryInternal::compile(const Ref<NSString>& source, const XQueryLoading& loading,
                             XQueryWay way) {
  const auto places = XQueryPlaces::places();
  const auto parser = XQueryParser::parserWithSource(source, nullptr, places);
  _errors = parser->errors();
  if (!_errors.empty()) return;

  // An empty query has no module: no prolog items and no body.
  std::vector<Ref<XQueryPrologItem>> items;
  Ref<NSString> version;
  XQueryRemarks remarks;
  if (const auto& module = parser->parsedModule()) {
    items = module->prologItems();
    version = module->version();
    remarks = module->remarks();
    _body = module->body();
  }
  _prolog = XQueryProlog::prologWithItems(items, nullptr, nullptr, version,
                                          NSURLLoader::loaderWithLoading(loading), places);
  _prolog->setRemarks(std::move(remarks));
  // Local variable IDs of the main body start at 1.
  _prolog->setNextLocalVariableID(1);
  if (_body) _body->bindInfoForProlog(*_prolog);
  _errors = _prolog->errors();
  if (_errors.empty()) plan(way);
}

void XQueryInternal::plan(XQueryWay way) {
  if (way == XQueryWay::Streamed) {
    planStream();
  } else if (way == XQueryWay::Explained) {
    _warnings = XQueryCheckedProgram(*_prolog, _body);
    auto report = std::make_unique<XQueryPlanReport>();
    auto projection = std::make_unique<XQueryProjectionPlan>();
    _body = XQueryPlanned(*_prolog, _body, *projection, *report);
    _planReport = std::move(report);
    _projectionPlan = std::move(projection);
  } else if (way == XQueryWay::Profiled) {
    planToProfile();
  } else if (way == XQueryWay::Planned && XQueryPlanIsEnabled()) {
    auto projection = std::make_unique<XQueryProjectionPlan>();
    _body = XQueryPlanned(*_prolog, _body, *projection);
    _projectionPlan = std::move(projection);
  }
}

void XQueryInternal::planStream() {
  Ref<XQueryError> refusal;
  _streamProgram = XQueryStreamProgram::of(*_prolog, _body, refusal);
  if (refusal) _errors.push_back(std::move(refusal));
}

void XQueryInternal::planToProfile() {
  auto profiled = std::make_shared<XQueryProfiledProgram>();
  const auto start = std::chrono::steady_clock::now();
  std::optional<XQueryProjectionPlan> projection;
  _body = XQueryProfiled(*_prolog, _body, projection, *profiled);
  profiled->planning = std::chrono::steady_clock::now() - start;
  if (projection) {
    _projectionPlan = std::make_unique<const XQueryProjectionPlan>(std::move(*projection));
  }
  _profiledProgram = std::move(profiled);
}

void XQueryInternal::completeProfiledProgram(const Ref<NSString>& source,
                                             std::chrono::nanoseconds taken) {
  if (!_profiledProgram) return;
  auto complete = std::make_shared<XQueryProfiledProgram>(*_profiledProgram);
  complete->source = source->utf8();
  complete->compiling = taken;
  _profiledProgram = std::move(complete);
}

XQueryInternal::XQueryInternal(Ref<XQueryError> error) : _errors{std::move(error)} {}

XQueryInternal::XQueryInternal(Ref<XQueryProlog> prolog, Ref<XQueryExpr> body)
    : _prolog(std::move(prolog)), _body(std::move(body)), _errors(_prolog->errors()) {}

XQueryInternal::~XQueryInternal() = default;

XQueryProlog* XQueryInternal::prolog() const {
  return _prolog.get();
}

XQueryExpr* XQueryInternal::body() const {
  return _body.get();
}

}  // namespace xquery
