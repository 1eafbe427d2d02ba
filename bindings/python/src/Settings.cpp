#include "Settings.h"

#include "Callbacks.h"

#include <algorithm>
#include <pybind11/stl.h>

namespace xquery::python {
namespace {

using PolicyRules = std::vector<std::pair<std::string, std::string>>;

struct Rule {
  std::string_view name;
  void (*apply)(XQueryLoadingPolicy& policy, const std::string& argument);
};

// The rules by the names of the methods of xquery.Policy.
constexpr Rule rules[] = {
    {"deny", [](XQueryLoadingPolicy& policy,
                const std::string&) { policy = XQueryLoadingPolicy::denyAll(); }},
    {"allow_scheme",
     [](XQueryLoadingPolicy& policy, const std::string& name) { policy.allowScheme(name); }},
    {"allow_files", [](XQueryLoadingPolicy& policy,
                       const std::string& folder) { policy.allowFilesBelow(folder); }},
    {"allow_urls",
     [](XQueryLoadingPolicy& policy, const std::string& URL) { policy.allowURLsBelow(URL); }},
    {"allow_host",
     [](XQueryLoadingPolicy& policy, const std::string& name) { policy.allowHost(name); }},
    {"forbid_local_addresses",
     [](XQueryLoadingPolicy& policy, const std::string&) { policy.forbidLocalAddresses(); }},
};

XQueryLoadingPolicy policyOf(const py::iterable& given) {
  XQueryLoadingPolicy policy = XQueryLoadingPolicy::allowAll();
  for (const py::handle step : given) {
    const auto [name, argument] = step.cast<std::pair<std::string, std::string>>();
    const auto* rule = std::find_if(
        std::begin(rules), std::end(rules),
        [&, wanted = std::string_view(name)](const Rule& known) { return known.name == wanted; });
    if (rule == std::end(rules)) throw py::value_error("no such rule: " + name);
    rule->apply(policy, argument);
  }
  return policy;
}

std::chrono::nanoseconds durationOf(double seconds) {
  constexpr double most = 1e9;  // thirty years
  if (!(seconds >= 0)) throw py::value_error("seconds must not be negative");
  return std::chrono::duration_cast<std::chrono::nanoseconds>(
      std::chrono::duration<double>(std::min(seconds, most)));
}

py::object functionOrNone(const py::object& object, const char* name) {
  if (object.is_none() || PyCallable_Check(object.ptr())) return object;
  throw py::type_error(std::string(name) + " is not callable");
}

std::shared_ptr<Settings> make(const std::optional<double>& seconds,
                               const std::optional<uint64_t>& memory, const py::iterable& policy,
                               const std::string& URL,
                               const std::map<std::string, std::string>& namespaces,
                               const std::shared_ptr<Cancellation>& cancellation,
                               const py::object& loader, const py::object& modules,
                               const py::object& trace, const py::object& missing) {
  auto settings = std::make_shared<Settings>();
  if (seconds) settings->limits.duration = durationOf(*seconds);
  settings->limits.memoryCeiling = memory;
  settings->loading.policy = policyOf(policy);
  settings->loading.moduleURL = URL;
  settings->namespaces = namespaces;
  settings->cancellation = cancellation;
  settings->loader = functionOrNone(loader, "loader");
  settings->modules = functionOrNone(modules, "modules");
  settings->trace = functionOrNone(trace, "trace");
  settings->missing = functionOrNone(missing, "missing");
  settings->hasPlainPolicy = py::len(policy) == 0;
  settings->client = makeClient(*settings);
  return settings;
}

// --- collection of cycles ------------------------------------------------------------------------

int traverse(PyObject* self, visitproc visit, void* arg) {
  Py_VISIT(Py_TYPE(self));
  if (const Settings* settings = madeObject<Settings>(self)) {
    Py_VISIT(settings->loader.ptr());
    Py_VISIT(settings->modules.ptr());
    Py_VISIT(settings->trace.ptr());
    Py_VISIT(settings->missing.ptr());
  }
  return 0;
}

int clear(PyObject* self) {
  if (Settings* settings = madeObject<Settings>(self)) {
    settings->loader = py::none();
    settings->modules = py::none();
    settings->trace = py::none();
    settings->missing = py::none();
  }
  return 0;
}

}  // namespace

XQueryLimits Settings::limitsOf(const UnderWay& underWay) const {
  XQueryLimits own = limits;
  own.cancelled = underWay.flag();
  return own;
}

XQueryLoading Settings::loadingOfDocuments() const {
  XQueryLoading own = loading;
  if (!loader.is_none()) own.loader = makeLoader(shared_from_this());
  return own;
}

XQueryLoading Settings::loadingOfModules() const {
  XQueryLoading own = loading;
  if (!loader.is_none() || !modules.is_none()) own.loader = makeLoader(shared_from_this());
  return own;
}

void addSettings(py::module_& module) {
  py::class_<Cancellation, std::shared_ptr<Cancellation>>(
      module, "Cancellation",
      "Ends evaluations from another thread.\n\n"
      "Given to compile or to a Context. What is under way when it is cancelled ends within a\n"
      "tenth of a second with a LimitError, and so does what begins later.\n\n"
      ">>> import xquery\n"
      ">>> cancellation = xquery.Cancellation()\n"
      ">>> query = xquery.compile('1 + 1', cancellation=cancellation)\n"
      ">>> query.evaluate().one()\n"
      "2\n"
      ">>> cancellation.cancel()\n"
      ">>> query.evaluate()\n"
      "Traceback (most recent call last):\n"
      "    ...\n"
      "xquery._errors.LimitError: XQueryError:0 - \"limit: evaluation cancelled\"\n")
      .def(py::init<>())
      .def("cancel", &Cancellation::raise)
      .def_property_readonly("is_cancelled", &Cancellation::isRaised);
  py::class_<Settings, std::shared_ptr<Settings>>(module, "Settings",
                                                  py::custom_type_setup([](PyHeapTypeObject* type) {
                                                    takePartInCollection(type, traverse, clear);
                                                  }))
      .def(py::init(&make), py::kw_only(), py::arg("seconds"), py::arg("memory"), py::arg("policy"),
           py::arg("url"), py::arg("namespaces"), py::arg("cancellation"), py::arg("loader"),
           py::arg("modules"), py::arg("trace"), py::arg("missing"));
}

}  // namespace xquery::python
