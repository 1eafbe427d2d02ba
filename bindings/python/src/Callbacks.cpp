#include "Callbacks.h"

#include "Results.h"
#include "Settings.h"
#include "Values.h"

#include <atomic>
#include <vector>

namespace xquery::python {
namespace {

// Set when the interpreter begins to end.
std::atomic<bool> isEnding = false;

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
  const py::object bytes = steal(PyBytes_FromObject(data.ptr()));
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

// Keeps the settings and no function itself: the collector of cycles looks into those. May be let
// go of on any thread.
class Loader : public XQueryLoader {
 public:
  explicit Loader(std::shared_ptr<const Settings> settings) : _settings(std::move(settings)) {}
  ~Loader() override {
    if (isInterpreterAlive()) {
      locked([&] { _settings = nullptr; });
    } else {
      new std::shared_ptr<const Settings>(std::move(_settings));  // nobody can take the lock
    }
  }
  Loader(const Loader&) = delete;
  Loader& operator=(const Loader&) = delete;

  std::optional<XQueryResource> load(const NSURL& URL, XQueryLoadPurpose purpose) override {
    if (!isInterpreterAlive()) return std::nullopt;
    return locked([&] {
      const py::object modules = _settings->modules, loader = _settings->loader;
      const py::object text = toStr(URL.absoluteString()->view());
      const bool isModule = purpose == XQueryLoadPurpose::Module && !modules.is_none();
      if (isModule) return resourceFrom(modules(text));
      if (loader.is_none()) return std::optional<XQueryResource>();
      return resourceFrom(loader(text, nameOf(purpose)));
    });
  }

 private:
  std::shared_ptr<const Settings> _settings;
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
  if (missing.is_none()) {
    known().warnOfMissing(URL, reason);
  } else {
    missing(URL, reason);
  }
}

// Who hears of traces and of missing documents. Without a function for traces they are written to
// the log. Lives as long as the settings do.
class Client : public XQueryClient {
 public:
  explicit Client(const Settings& settings) : _settings(settings) {}

  void XQueryClientTraceValue(const Value& value, const Ref<NSString>& label,
                              XQueryContext& context) override {
    if (!_isTraced) return XQueryClient::XQueryClientTraceValue(value, label, context);
    locked([&] {
      const py::object trace = _settings.trace;
      trace(toStr(label->view()), resultOf(value));
    });
  }

  void XQueryClientMissesDocument(const XQueryMissingDocument& document, XQueryContext&) override {
    locked([&] { tellMissing(_settings, document); });
  }

 private:
  const Settings& _settings;
  const bool _isTraced = !_settings.trace.is_none();
};

}  // namespace

bool isInterpreterAlive() {
  return !isEnding && Py_IsInitialized();
}

std::shared_ptr<XQueryLoader> makeLoader(std::shared_ptr<const Settings> settings) {
  return std::make_shared<Loader>(std::move(settings));
}

std::shared_ptr<XQueryClient> makeClient(const Settings& settings) {
  return std::make_shared<Client>(settings);
}

void addCallbacks(py::module_& module) {
  module.def("_end", [] { isEnding = true; });
}

}  // namespace xquery::python
