#include "Callbacks.h"

#include "Hearing.h"
#include "Results.h"
#include "Settings.h"
#include "Values.h"

#include <atomic>
#include <vector>

namespace xquery::python {
namespace {

// Set when the interpreter begins to end.
std::atomic<bool> isEnding = false;

// An object that is let go of on any thread.
class Kept {
 public:
  explicit Kept(py::object object) : _object(std::move(object)) {}
  ~Kept() {
    if (!isInterpreterAlive()) {
      (void)_object.release();
      return;
    }
    locked([&] { _object = py::object(); });
  }
  Kept(const Kept&) = delete;
  Kept& operator=(const Kept&) = delete;
  const py::object& get() const { return _object; }

 private:
  py::object _object;
};

constexpr const char* nameOf(XQueryLoadPurpose purpose) {
  switch (purpose) {
    case XQueryLoadPurpose::Document:
      return "document";
    case XQueryLoadPurpose::Module:
      return "module";
    case XQueryLoadPurpose::Body:
      return "body";
    case XQueryLoadPurpose::Stylesheet:
      break;
  }
  return "stylesheet";
}

std::string dataFrom(const py::object& data) {
  if (PyUnicode_Check(data.ptr())) {
    // Whatever encoding it says that it had as bytes.
    return py::module_::import("xquery._documents").attr("_utf8")(data).cast<std::string>();
  }
  const py::object bytes = py::reinterpret_steal<py::object>(PyBytes_FromObject(data.ptr()));
  if (!bytes) throw py::error_already_set();
  return {PyBytes_AS_STRING(bytes.ptr()), static_cast<size_t>(PyBytes_GET_SIZE(bytes.ptr()))};
}

// What a loader answers: None, bytes, a str, or a xquery.Resource.
std::optional<XQueryResource> resourceFrom(const py::object& answer) {
  if (answer.is_none()) return std::nullopt;
  XQueryResource resource;
  if (!py::hasattr(answer, "mime_type")) {
    resource.data = dataFrom(answer);
    return resource;
  }
  resource.data = dataFrom(answer.attr("data"));
  const py::object type = answer.attr("mime_type"), status = answer.attr("status"),
                   URL = answer.attr("url");
  if (!type.is_none()) resource.MIMEType = fromStr(type);
  if (!status.is_none()) resource.statusCode = status.cast<int>();
  if (!URL.is_none()) resource.URL = fromStr(URL);
  return resource;
}

class Loader : public XQueryLoader {
 public:
  Loader(const py::object& load, const py::object& modules) : _load(load), _modules(modules) {}

  std::optional<XQueryResource> load(const NSURL& URL, XQueryLoadPurpose purpose) override {
    if (!isInterpreterAlive()) return std::nullopt;
    return locked([&] {
      const py::object& modules = _modules.get();
      const bool isModule = purpose == XQueryLoadPurpose::Module && !modules.is_none();
      const py::object text = toStr(URL.absoluteString()->view());
      if (isModule) return resourceFrom(modules(text));
      if (_load.get().is_none()) return std::optional<XQueryResource>();
      return resourceFrom(_load.get()(text, nameOf(purpose)));
    });
  }

 private:
  Kept _load, _modules;
};

py::object resultOf(const Value& value) {
  if (const auto* array = dyn_cast<NSArray>(value)) {
    return py::cast(Result(Ref<NSArray>(const_cast<NSArray*>(array))));
  }
  std::vector<Value> items;
  if (value && !isa<NSNull>(value)) items.push_back(value);
  return py::cast(Result(NSArray::arrayWithObjects(std::move(items))));
}

void tellMissing(const Settings& settings, const XQueryMissingDocument& document) {
  const py::object missing = settings.missing;
  const py::object URL = toStr(document.URL), reason = toStr(document.reason);
  if (!missing.is_none()) {
    missing(URL, reason);
  } else {
    // Of the caller of the package, which itself is one call.
    known().warn(toStr(document.URL + ": " + document.reason), known().missingWarning, 2);
  }
}

}  // namespace

bool isInterpreterAlive() {
  return !isEnding && Py_IsInitialized();
}

std::shared_ptr<XQueryLoader> makeLoader(const py::object& load, const py::object& modules) {
  return std::make_shared<Loader>(load, modules);
}

std::shared_ptr<XQueryClient> makeClient(const Settings& settings) {
  TraceHearing hear;
  if (!settings.trace.is_none()) {
    hear = [&settings](const Value& value, const Ref<NSString>& label) {
      locked([&] {
        const py::object trace = settings.trace;
        trace(toStr(label->view()), resultOf(value));
      });
    };
  }
  return clientHearing(std::move(hear), [&settings](const XQueryMissingDocument& document) {
    locked([&] { tellMissing(settings, document); });
  });
}

void addCallbacks(py::module_& module) {
  module.def("_end", [] { isEnding = true; });
}

}  // namespace xquery::python
