#include "Queries.h"

#include "Callbacks.h"
#include "Errors.h"
#include "Nodes.h"
#include "Results.h"
#include "Values.h"
#include <xquery/Memory.h>
#include <xquery/Projection.h>
#include <xquery/Stream.h>
#include <xquery/Warnings.h>

#include <array>
#include <unordered_map>
#include <utility>

namespace xquery::python {
namespace {

constexpr std::array<std::pair<std::string_view, XQueryWay>, 5> ways{{
    {"planned", XQueryWay::Planned},
    {"plain", XQueryWay::Plain},
    {"explained", XQueryWay::Explained},
    {"streamed", XQueryWay::Streamed},
    {"profiled", XQueryWay::Profiled},
}};

XQueryWay wayNamed(const std::string& name) {
  for (const auto& [known, way] : ways) {
    if (known == name) return way;
  }
  throw py::value_error("no such way: " + name);
}

Compiled compile(const py::str& source, const Settings& settings, const std::string& way) {
  const std::string text = fromStr(source);
  const XQueryWay wanted = wayNamed(way);
  const UnderWay underWay(settings.cancellation);
  const XQueryLoading loading = settings.loadingOfModules();
  const XQueryLimits limits = settings.limitsOf(underWay);
  Ref<XQuery> query;
  Ref<NSArray> errors;
  {
    const Unlocked released;
    query = XQuery::xqueryWithSource(text, loading, limits, wanted);
    errors = query->parseErrors();
  }
  underWay.raiseWhatHandlersRaise();
  if (errors && errors->count() > 0) raiseCompileError(*errors);
  return {query};
}

// --- evaluation ----------------------------------------------------------------------------------

// A context has the loader and the client of the evaluation that is under way, and no other ones:
// what it kept otherwise would be hidden from the collection of cycles.
class Prepared {
 public:
  Prepared(XQueryContext& context, const Settings& settings, const UnderWay& underWay, bool isKept)
      : _context(context), _settings(settings), _isKept(isKept) {
    if (!settings.isLoadingPlain()) context.contextSetLoading(settings.loadingOfDocuments());
    context.contextSetClient(settings.client);
    context.contextSetLimits(settings.limitsOf(underWay));
  }
  ~Prepared() {
    if (!_isKept) return;
    if (!_settings.isLoadingPlain()) _context.contextSetLoading(_settings.loading);
    _context.contextSetClient(nullptr);
    _context.contextSetLimits(_settings.limits);
  }
  Prepared(const Prepared&) = delete;
  Prepared& operator=(const Prepared&) = delete;

 private:
  XQueryContext& _context;
  const Settings& _settings;
  bool _isKept;
};

Result run(XQueryContext& context, const XQuery& query, const Settings& settings, bool isKept,
           const XQueryVariables& variables, const Value& item) {
  const UnderWay underWay(settings.cancellation);
  const Prepared prepared(context, settings, underWay, isKept);
  Ref<XQueryError> error;
  Ref<NSArray> items;
  Ref<NSError> failure;
  {
    const Unlocked released;
    items = context.evaluateXQuery(query, variables, item, &error);
    failure = XQueryFirstError(items, error);
  }
  underWay.raiseWhatHandlersRaise();
  if (failure) raise(*failure);
  return Result(items ? items : NSArray::array());
}

Ref<XQueryContext> newContext(const Settings& settings) {
  return XQueryContext::xqueryContextWithNamespaces(settings.namespaces);
}

Value contextItemFrom(const py::object& item) {
  return item.is_none() ? Value() : fromPython(item);
}

Result evaluate(const Compiled& compiled, const Settings& settings, const py::object& item,
                const py::dict& given) {
  const XQueryVariables variables = variablesFrom(given);
  const Ref<XQueryContext> context = newContext(settings);
  return run(*context, *compiled.query, settings, false, variables, contextItemFrom(item));
}

// --- sessions ------------------------------------------------------------------------------------

// Taken for one evaluation.
class Taken {
 public:
  explicit Taken(Session& session) : _session(session) {
    if (session.isBusy.exchange(true)) {
      throw std::runtime_error("the context is evaluating: it is for one evaluation at a time");
    }
  }
  ~Taken() { _session.isBusy = false; }
  Taken(const Taken&) = delete;
  Taken& operator=(const Taken&) = delete;

 private:
  Session& _session;
};

Result evaluateIn(Session& session, const Compiled& compiled, const Settings& settings,
                  const py::object& item, const py::dict& given) {
  const Taken taken(session);
  if (!session.context) throw py::value_error("the context is closed");
  const XQueryVariables variables = variablesFrom(given);
  return run(*session.context, *compiled.query, settings, true, variables, contextItemFrom(item));
}

void close(Session& session) {
  const Taken taken(session);
  const Ref<XQueryContext> context = std::move(session.context);
}

// --- looking at queries --------------------------------------------------------------------------

constexpr std::array<std::pair<std::string_view, XQueryPlanFormat>, 3> planFormats{{
    {"text", XQueryPlanFormat::Text},
    {"json", XQueryPlanFormat::JSON},
    {"dot", XQueryPlanFormat::DOT},
}};

py::object planOf(const Compiled& compiled, const std::string& format) {
  for (const auto& [name, value] : planFormats) {
    if (name == format) return toStrOrNone(compiled.query->planDescription(value));
  }
  throw py::value_error("no such format of plans: " + format);
}

py::list warningsOf(const Compiled& compiled) {
  py::list warnings;
  for (const XQueryWarning& warning : XQueryWarnings(*compiled.query)) {
    warnings.append(py::make_tuple(toStr(warning.identifier), toStrOrNone(warning.text),
                                   toStrOrNone(warning.name), toStrOrNone(warning.module),
                                   warning.line, warning.column));
  }
  return warnings;
}

py::tuple projectionOf(const Compiled& compiled) {
  const XQueryProjection projection = XQueryProjectionOf(*compiled.query);
  return py::make_tuple(projection.isWhole, projection.answersNodes, toStr(projection.description));
}

py::list libraryFunctions() {
  py::list functions;
  for (const XQueryFunctionName& function : XQueryLibraryFunctions()) {
    functions.append(py::make_tuple(
        toStr(function.namespaceURI), toStr(function.localName), function.leastArguments,
        function.mostArguments ? py::object(py::int_(*function.mostArguments)) : py::none()));
  }
  return functions;
}

// --- profiles ------------------------------------------------------------------------------------

struct Profile {
  Ref<XQuery> query;
  XQueryProfile profile;
};

constexpr std::array<std::pair<std::string_view, XQueryProfileFormat>, 3> profileFormats{{
    {"text", XQueryProfileFormat::Text},
    {"json", XQueryProfileFormat::JSON},
    {"html", XQueryProfileFormat::HTML},
}};

py::object describe(const Profile& self, const std::string& format) {
  for (const auto& [name, value] : profileFormats) {
    if (name == format) return toStr(self.profile.describe(value));
  }
  throw py::value_error("no such format of profiles: " + format);
}

Result evaluateProfiled(const Compiled& compiled, Profile& profile, const Settings& settings,
                        const py::object& item, const py::dict& given) {
  const XQueryVariables variables = variablesFrom(given);
  const Ref<XQueryContext> context = newContext(settings);
  struct Adding {
    Profile& profile;
    const XQueryContext& context;
    ~Adding() { profile.profile.add(context); }
  } adding{profile, *context};
  return run(*context, *compiled.query, settings, false, variables, contextItemFrom(item));
}

// --- finding -------------------------------------------------------------------------------------

// The paths that were asked for last, so that a loop that asks each node the same compiles once.
constexpr size_t mostPaths = 256;

const Ref<XQuery>& compiledPath(const py::object& path, const Settings& settings) {
  static auto* known = new std::unordered_map<std::string, Ref<XQuery>>;
  std::string text = fromArgument(path, "a path");
  const auto found = known->find(text);
  if (found != known->end()) return found->second;
  Ref<XQuery> query = compile(py::reinterpret_borrow<py::str>(path), settings, "planned").query;
  if (known->size() >= mostPaths) known->clear();
  return (*known)[std::move(text)] = std::move(query);
}

const Settings& settingsOfPaths() {
  static const auto* settings = [] {
    auto* own = new Settings;
    own->loading.policy = XQueryLoadingPolicy::denyAll();
    own->hasPlainPolicy = false;
    own->loader = own->modules = own->trace = own->missing = py::none();
    own->client = makeClient(*own);
    return own;
  }();
  return *settings;
}

Result find(const Node& node, const py::object& path) {
  const Settings& settings = settingsOfPaths();
  // A reference of its own: another thread may make the list of paths empty meanwhile.
  const Ref<XQuery> query = compiledPath(path, settings);
  const Ref<XQueryContext> context = newContext(settings);
  return run(*context, *query, settings, false, {}, Value(node.node));
}

}  // namespace

py::object findFirst(const Node& node, const py::object& path) {
  const Result result = find(node, path);
  return result.count == 0 ? py::none() : toPython(*result.item(0));
}

py::object findAll(const Node& node, const py::object& path) {
  return py::cast(find(node, path));
}

void addQueries(py::module_& module) {
  py::class_<Compiled>(module, "Compiled")
      .def("plan", planOf)
      .def("warnings", warningsOf)
      .def("projection", projectionOf)
      .def("stream_description",
           [](const Compiled& self) { return toStr(XQueryStreamDescription(*self.query)); });
  py::class_<Session>(module, "Session")
      .def(py::init([](const Settings& settings) {
        auto session = std::make_unique<Session>();
        session->context = newContext(settings);
        return session;
      }))
      .def("evaluate", evaluateIn)
      .def("close", close);
  py::class_<Profile>(module, "Profile")
      .def(py::init([](const Compiled& compiled) {
        return std::make_unique<Profile>(Profile{compiled.query, XQueryProfile(*compiled.query)});
      }))
      .def("describe", describe)
      .def_property_readonly("evaluations",
                             [](const Profile& self) { return self.profile.evaluations(); });
  module.def("compile", compile);
  module.def("evaluate", evaluate);
  module.def("evaluate_profiled", evaluateProfiled);
  module.def("library_functions", libraryFunctions);
  module.def("release_memory", &XQueryReleaseIdleMemory, py::call_guard<Unlocked>());
}

}  // namespace xquery::python
