#include "Platform/Stylesheets/LibXSLT.h"

#include "Platform/Base/WorkerThread.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Reading/LibXMLMemory.h"
#include "Platform/Stylesheets/LibXMLTree.h"
#include "Platform/Stylesheets/StylesheetBounds.h"

#include <libxml/globals.h>
#include <libxml/parser.h>
#include <libxml/tree.h>
#include <libxml/xmlerror.h>
#include <libxslt/documents.h>
#include <libxslt/imports.h>
#include <libxslt/security.h>
#include <libxslt/transform.h>
#include <libxslt/xslt.h>
#include <libxslt/xsltInternals.h>
#include <libxslt/xsltutils.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <condition_variable>
#include <cstdarg>
#include <cstdio>
#include <cstring>
#include <exception>
#include <memory>
#include <mutex>
#include <new>
#include <pthread.h>
#include <string>
#include <thread>
#include <type_traits>
#include <utility>
#include <vector>

namespace xquery {

namespace {

// Templates may nest as deep as libxslt allows by itself, expressions some thousands of levels, and
// trees are copied recursively at about a hundred bytes a level, without a bound. Once so much of
// the stack is in use the transformation is stopped; the copy at hand, of a tree that could itself
// be made within that bound twice over at most, is completed first.
constexpr size_t stackBytes = size_t{64} << 20;
constexpr size_t stackBytesBeforeStop = size_t{8} << 20;
constexpr int mostTemplateLevels = 3000;
constexpr int mostVariables = 15000;

constexpr auto timeBetweenLooks = std::chrono::milliseconds(5);
constexpr auto timeToStop = std::chrono::milliseconds(40);
constexpr size_t longestFailure = 1000;

template <auto function>
struct Freed {
  template <class T>
  void operator()(T* object) const {
    function(object);
  }
};
using Stylesheet = std::unique_ptr<xsltStylesheet, Freed<xsltFreeStylesheet>>;
using Context = std::unique_ptr<xsltTransformContext, Freed<xsltFreeTransformContext>>;
using Security = std::unique_ptr<xsltSecurityPrefs, Freed<xsltFreeSecurityPrefs>>;

// Owned by the caller and by the thread that does the work, whichever lives longer.
class Transformation final : public std::enable_shared_from_this<Transformation>,
                             private LibXMLMemory::Counter {
 public:
  explicit Transformation(const LibXSLTTask& task);
  Value run(std::string& failure);

  // --- called by libxslt and libxml2 on the thread of the transformation -------------------------
  xmlDocPtr load(const xmlChar* URL, xmlDictPtr dictionary, bool isStylesheet);
  void hear(const char* format, va_list arguments);
  void hear(const char* text);
  void noteNode();

 private:
  void noteBytes(int64_t more) override;

  // As long as it lives, what libxml2 has taken is part of what the calling thread has taken, so
  // that whatever looks at that sees all.
  class TakenTogether {
   public:
    explicit TakenTogether(Transformation& transformation);
    ~TakenTogether();
    TakenTogether(const TakenTogether&) = delete;
    TakenTogether& operator=(const TakenTogether&) = delete;

   private:
    Transformation& _transformation;
  };

  struct Request {
    const char* URL;
    xmlDictPtr dictionary;
    bool isStylesheet;
    LibXMLDocument document;
  };

  // On the thread of the transformation.
  static void* start(void* self);
  void work();
  bool finish();  // whether nobody waits for it
  Stylesheet compile();
  void apply(xsltStylesheet& stylesheet);
  void setContext(xsltTransformContext* context);
  void stop();  // under the lock

  // On the calling thread.
  // Whether the thread is done; otherwise it is left behind.
  bool attend();
  void copyTask();
  void look(Request* request);
  void answer(Request& request);
  LibXMLDocument copyOf(const NSXMLDocument& document, size_t mostLevels, const std::string& URL,
                        xmlDictPtr dictionary = nullptr);
  // Null, and why in the failure, when it is more than may be compiled.
  LibXMLDocument copyOfStylesheet(const NSXMLDocument& document, const std::string& URL,
                                  xmlDictPtr dictionary = nullptr);
  Value result();

  const LibXSLTTask& _task;  // not for the thread of the transformation
  const NSXMLDocument::XSLTArguments _arguments;
  std::vector<const char*> _argumentTexts;  // name and value by turns, and null
  std::atomic<int64_t> _bytes = 0;          // taken by libxml2 less those given back
  int64_t _mostBytes = INT64_MAX;           // of them
  std::atomic<bool> _takesTooMuch = false;
  bool _isTakenTogether = false;  // on the calling thread
  int64_t _bytesTakenTogether = 0;
  StylesheetBounds _bounds;
  const char* _refusal = nullptr;  // why a stylesheet was not even compiled
  LibXMLDocument _document;
  LibXMLDocument _stylesheet;
  LibXMLDocument _result;
  bool _hasTextResult = false;
  std::string _failure;
  const char* _stackTop = nullptr;
  std::atomic<bool> _nestsTooDeeply = false;
  std::shared_ptr<Transformation> _self;  // for the thread to take

  std::mutex _mutex;
  std::condition_variable _changed;
  bool _isDone = false;
  bool _isEnding = false;
  bool _isLeftBehind = false;
  Request* _request = nullptr;               // to be answered
  xsltTransformContext* _context = nullptr;  // that can be stopped

  std::exception_ptr _ended;  // on the calling thread
  size_t _loads = 0;
};

// The transformation of this thread.
thread_local Transformation* current = nullptr;

// --- what libxslt keeps for the whole process ----------------------------------------------------

// A host may use libxslt for itself: what does not belong to a transformation of ours goes on to
// whoever was responsible before.
xsltDocLoaderFunc otherLoader = nullptr;
xmlGenericErrorFunc otherErrorFunction = nullptr;
void* otherErrorContext = nullptr;

xmlDocPtr loadDocument(const xmlChar* URL, xmlDictPtr dictionary, int options, void* context,
                       xsltLoadType type) {
  if (!current) return otherLoader(URL, dictionary, options, context, type);
  return current->load(URL, dictionary, type != XSLT_LOAD_DOCUMENT);
}

void hearError(void*, const char* format, ...) {
  va_list arguments;
  va_start(arguments, format);
  if (current) {
    current->hear(format, arguments);
  } else {
    char text[longestFailure];
    std::vsnprintf(text, sizeof text, format, arguments);
    otherErrorFunction(otherErrorContext, "%s", text);
  }
  va_end(arguments);
}

void hearStructuredError(void*, xmlError* error) {
  if (current && error->level >= XML_ERR_ERROR && error->message) current->hear(error->message);
}

void noteNode(xmlNodePtr) {
  if (current) current->noteNode();
}

void initialise() {
  LibXMLMemory::begin();
  xsltInit();
  otherLoader = xsltDocDefaultLoader;
  xsltSetLoaderFunc(loadDocument);
  otherErrorFunction = xsltGenericError;
  otherErrorContext = xsltGenericErrorContext;
  xsltSetGenericErrorFunc(nullptr, hearError);
  // This makes libxml2 look at what each thread has set; the main thread's own is put back.
  xmlRegisterNodeDefault(xmlRegisterNodeDefault(nullptr));
}

// --- on the thread of the transformation ---------------------------------------------------------

// Nothing here asks for memory of our own: an exception could not pass the frames of C, and would
// end the process where there are none.

void* Transformation::start(void* self) {
  auto transformation = std::move(static_cast<Transformation*>(self)->_self);
  transformation->work();
  const bool wasLeftBehind = transformation->finish();
  transformation.reset();
  // Not before, since what it freed is libxml2's.
  if (wasLeftBehind) --LibXMLMemory::threadsLeftBehind();
  return nullptr;
}

void Transformation::work() {
  _stackTop = static_cast<const char*>(__builtin_frame_address(0));
  current = this;
  const LibXMLMemory::CountedBy counting(*this);
  // These three are of the thread and go with it.
  xmlSetStructuredErrorFunc(nullptr, hearStructuredError);
  xmlSetGenericErrorFunc(nullptr, hearError);
  xmlRegisterNodeDefaultValue = xquery::noteNode;
  if (const Stylesheet stylesheet = compile()) apply(*stylesheet);
  current = nullptr;
}

bool Transformation::finish() {
  const std::lock_guard lock(_mutex);
  _isDone = true;
  _changed.notify_all();
  return _isLeftBehind;
}

Stylesheet Transformation::compile() {
  Stylesheet stylesheet(xsltParseStylesheetDoc(_stylesheet.get()));
  if (!stylesheet) return nullptr;
  // The stylesheet owns its document from here on.
  static_cast<void>(_stylesheet.release());
  return stylesheet->errors == 0 ? std::move(stylesheet) : nullptr;
}

bool isTextMethod(xsltStylesheet* stylesheet) {
  const xmlChar* method = nullptr;
  XSLT_GET_IMPORT_PTR(method, stylesheet, method)
  return method && xmlStrEqual(method, reinterpret_cast<const xmlChar*>("text"));
}

// Reading is left to the loader, which asks the policy.
Security securityPreferences() {
  Security preferences(xsltNewSecurityPrefs());
  if (!preferences) return nullptr;
  for (const xsltSecurityOption option :
       {XSLT_SECPREF_WRITE_FILE, XSLT_SECPREF_CREATE_DIRECTORY, XSLT_SECPREF_WRITE_NETWORK}) {
    if (xsltSetSecurityPrefs(preferences.get(), option, xsltSecurityForbid) != 0) return nullptr;
  }
  return preferences;
}

void Transformation::apply(xsltStylesheet& stylesheet) {
  const Security security = securityPreferences();
  const Context context(xsltNewTransformContext(&stylesheet, _document.get()));
  if (!security || !context) return;
  if (xsltSetCtxtSecurityPrefs(security.get(), context.get()) != 0) return;
  xsltSetTransformErrorFunc(context.get(), nullptr, hearError);
  context->xinclude = 0;
  context->maxTemplateDepth = mostTemplateLevels;
  context->maxTemplateVars = mostVariables;
  setContext(context.get());
  LibXMLDocument result(xsltApplyStylesheetUser(&stylesheet, _document.get(), _argumentTexts.data(),
                                                nullptr, nullptr, context.get()));
  setContext(nullptr);
  // There is a result of what was done before a failure as well.
  if (context->state != XSLT_STATE_OK) return;
  _hasTextResult = isTextMethod(&stylesheet);
  _result = std::move(result);
}

void Transformation::setContext(xsltTransformContext* context) {
  const std::lock_guard lock(_mutex);
  _context = context;
  if (context && _isEnding) stop();
}

// The fields are looked at by libxslt before each instruction and, the limit on operations, in
// every expression. Repeated until it has stopped, since libxslt sets the state as well.
void Transformation::stop() {
  if (!_context) return;
  const auto set = [](auto& field, auto value) {
    __atomic_store_n(&field, static_cast<std::remove_reference_t<decltype(field)>>(value),
                     __ATOMIC_RELAXED);
  };
  set(_context->state, XSLT_STATE_STOPPED);
  set(_context->opLimit, 1);
  if (_context->xpathCtxt) set(_context->xpathCtxt->opLimit, 1);
}

xmlDocPtr Transformation::load(const xmlChar* URL, xmlDictPtr dictionary, bool isStylesheet) {
  Request request{reinterpret_cast<const char*>(URL), dictionary, isStylesheet, nullptr};
  std::unique_lock lock(_mutex);
  if (_isEnding) return nullptr;
  _request = &request;
  _changed.notify_all();
  _changed.wait(lock, [this] { return !_request; });
  return request.document.release();
}

void Transformation::hear(const char* format, va_list arguments) {
  char text[longestFailure];
  std::vsnprintf(text, sizeof text, format, arguments);
  hear(text);
}

void Transformation::hear(const char* text) {
  _failure.append(text, std::min(std::strlen(text), longestFailure - _failure.size()));
}

// Trees are copied with a node per level of the recursion, so that this is called at its bottom.
void Transformation::noteNode() {
  const auto* frame = static_cast<const char*>(__builtin_frame_address(0));
  if (static_cast<size_t>(_stackTop - frame) < stackBytesBeforeStop || _nestsTooDeeply) return;
  _nestsTooDeeply = true;
  const std::lock_guard lock(_mutex);
  stop();
}

// The block at hand is given nevertheless.
void Transformation::noteBytes(int64_t more) {
  const int64_t bytes = _bytes.fetch_add(more, std::memory_order_relaxed) + more;
  if (current) {
    if (bytes <= _mostBytes || _takesTooMuch.exchange(true)) return;
    const std::lock_guard lock(_mutex);
    stop();
  } else if (_isTakenTogether) {
    workMeter.valueBytes += more;
    _bytesTakenTogether += more;
  }
}

// --- on the calling thread -----------------------------------------------------------------------

Transformation::TakenTogether::TakenTogether(Transformation& transformation)
    : _transformation(transformation) {
  _transformation._isTakenTogether = true;
  _transformation._bytesTakenTogether = _transformation._bytes.load(std::memory_order_relaxed);
  workMeter.valueBytes += _transformation._bytesTakenTogether;
}

Transformation::TakenTogether::~TakenTogether() {
  workMeter.valueBytes -= _transformation._bytesTakenTogether;
  _transformation._isTakenTogether = false;
}

Transformation::Transformation(const LibXSLTTask& task) : _task(task), _arguments(task.arguments) {
  for (const auto& [name, value] : _arguments) {
    _argumentTexts.push_back(name.c_str());
    _argumentTexts.push_back(value.c_str());
  }
  _argumentTexts.push_back(nullptr);
  _failure.reserve(longestFailure);
}

bool Transformation::attend() {
  using Clock = std::chrono::steady_clock;
  Clock::time_point lastMoment = Clock::time_point::max();
  std::unique_lock lock(_mutex);
  while (true) {
    _changed.wait_for(lock, timeBetweenLooks, [this] { return _isDone || _request; });
    if (_isDone) return true;
    Request* const request = _request;
    lock.unlock();
    look(request);
    lock.lock();
    if (_ended && !_isEnding) {
      _isEnding = true;
      lastMoment = Clock::now() + timeToStop;
    }
    if (_isEnding || _nestsTooDeeply || _takesTooMuch) stop();
    // Once it is ending, nothing that was asked for meanwhile is answered either.
    if (request || _isEnding) {
      _request = nullptr;
      _changed.notify_all();
    }
    if (_isDone || Clock::now() < lastMoment) continue;
    _isLeftBehind = true;
    ++LibXMLMemory::threadsLeftBehind();
    return false;
  }
}

void Transformation::look(Request* request) {
  if (_ended) return;
  const TakenTogether together(*this);
  try {
    // The watcher raises it.
    if (_takesTooMuch || workMeter.valueBytes > workMeter.mostValueBytes) {
      workMeter.wasRefused = true;
    }
    lookAtWork();
    if (request) answer(*request);
  } catch (...) {
    _ended = std::current_exception();
  }
}

void Transformation::answer(Request& request) {
  if (++_loads > LibXSLTMostLoads) return;
  const Ref<NSXMLDocument> document = _task.load(request.URL, request.isStylesheet);
  if (!document) return;
  request.document =
      request.isStylesheet
          ? copyOfStylesheet(*document, request.URL, request.dictionary)
          : copyOf(*document, LibXSLTMostDocumentLevels, request.URL, request.dictionary);
}

void Transformation::copyTask() {
  const TakenTogether together(*this);
  _document = copyOf(_task.document, LibXSLTMostDocumentLevels, _task.documentURL);
  _stylesheet = copyOfStylesheet(_task.stylesheet, _task.stylesheetURL);
}

LibXMLDocument Transformation::copyOfStylesheet(const NSXMLDocument& document,
                                                const std::string& URL, xmlDictPtr dictionary) {
  if (_bounds.admit(document)) {
    return copyOf(document, LibXSLTMostStylesheetLevels, URL, dictionary);
  }
  _refusal = "the stylesheet is too large";
  return nullptr;
}

LibXMLDocument Transformation::copyOf(const NSXMLDocument& document, size_t mostLevels,
                                      const std::string& URL, xmlDictPtr dictionary) {
  const LibXMLMemory::CountedBy counting(*this);
  return LibXMLDocumentFrom(document, mostLevels, URL, dictionary);
}

Value Transformation::result() {
  const TakenTogether together(*this);
  if (_hasTextResult) return textFromLibXML(*_result);
  return documentFromLibXML(*_result);
}

// What was heard comes in lines and parts of lines.
std::string oneLine(std::string text) {
  while (!text.empty() && (text.back() == '\n' || text.back() == ' ')) text.pop_back();
  std::replace(text.begin(), text.end(), '\n', ' ');
  return text;
}

Value Transformation::run(std::string& failure) {
  copyTask();
  failure = _refusal ? _refusal : "the document nests too deeply";
  if (!_document || !_stylesheet) return nullptr;
  while (LibXMLMemory::threadsLeftBehind() >= LibXSLTMostLeftBehind) {
    lookAtWork();
    std::this_thread::sleep_for(timeBetweenLooks);
  }
  failure = "no thread can be started";
  if (workMeter.mostValueBytes != INT64_MAX) {
    _mostBytes = workMeter.mostValueBytes - workMeter.valueBytes;
  }
  pthread_t thread;
  _self = shared_from_this();
  if (!startWorkerThread(thread, stackBytes, start, this)) {
    _self = nullptr;
    return nullptr;
  }
  const bool isDone = attend();
  isDone ? pthread_join(thread, nullptr) : pthread_detach(thread);
  if (_takesTooMuch) look(nullptr);
  if (_ended) std::rethrow_exception(std::exchange(_ended, nullptr));
  if (_result) return result();
  failure = _nestsTooDeeply ? "the result nests too deeply" : oneLine(std::move(_failure));
  if (_refusal) failure = _refusal;
  if (failure.empty()) failure = "the stylesheet failed";
  return nullptr;
}

}  // namespace

std::atomic<int> LibXSLTMostLeftBehind = 16;

Value transformWithLibXSLT(const LibXSLTTask& task, std::string& failure) {
  static std::once_flag initialised;
  std::call_once(initialised, initialise);
  return std::make_shared<Transformation>(task)->run(failure);
}

}  // namespace xquery
