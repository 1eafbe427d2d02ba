// Results of streamed queries, item by item.
//
// The library hands items out as it reads; an iterator of Python asks for them. So a thread of its
// own reads, evaluates and puts items into a queue of bounded length, and whoever iterates takes
// them out. Records are gone when the next one is read, so that nodes are copied, and texts as
// well.
//
// The thread ends when the document does, when the stream is closed or let go of, and when the
// package is told that the interpreter ends.
#include "Callbacks.h"
#include "Errors.h"
#include "Queries.h"
#include "Values.h"
#include <xquery/Stream.h>

#include <chrono>
#include <condition_variable>
#include <deque>
#include <exception>
#include <mutex>
#include <thread>

namespace xquery::python {
namespace {

constexpr size_t mostWaiting = 256;
constexpr auto lookAtSignals = std::chrono::milliseconds(50);

Value apart(const Value& item) {
  if (item->isNode()) return cast<NSXMLNode>(item)->copy();
  if (const auto* text = dyn_cast<NSString>(item)) return NSString::stringWithView(text->view());
  return item;
}

// What both threads know. Everything below the lock is guarded by it.
struct Channel {
  std::mutex lock;
  std::condition_variable changed;
  std::deque<Value> waiting;
  bool isClosed = false;  // nobody asks any more
  bool isDone = false;    // nothing more comes
  XQueryStreamFailure failure;
  std::exception_ptr thrown;  // by a function of Python
  std::thread::id asking;     // the thread that waits for items and takes them, if any

  // False when nobody asks.
  bool put(Value item) {
    std::unique_lock held(lock);
    changed.wait(held, [&] { return isClosed || waiting.size() < mostWaiting; });
    if (isClosed) return false;
    waiting.push_back(std::move(item));
    if (waiting.size() == 1) changed.notify_all();
    return true;
  }
};

// One thread asks at a time.
class Asking {
 public:
  explicit Asking(Channel& channel) : _channel(channel) {
    const std::lock_guard held(_channel.lock);
    if (_channel.asking != std::thread::id()) {
      throw py::value_error("the stream is being asked for its next item already");
    }
    _channel.asking = std::this_thread::get_id();
  }
  ~Asking() {
    const std::lock_guard held(_channel.lock);
    _channel.asking = std::thread::id();
    _channel.changed.notify_all();
  }
  Asking(const Asking&) = delete;
  Asking& operator=(const Asking&) = delete;

 private:
  Channel& _channel;
};

class Stream {
 public:
  Stream(const Compiled& compiled, std::shared_ptr<Settings> kept, std::string path,
         py::object read, std::string name, const py::dict& variables)
      : _query(compiled.query),
        _settings(std::move(kept)),
        _read(std::move(read)),
        _name(std::move(name)),
        _constants(constantsFrom(variables)),
        _cancellation(_settings->cancellation) {
    const Settings& settings = *_settings;
    _context = XQueryContext::xqueryContextWithNamespaces(settings.namespaces);
    _context->contextSetLoading(settings.loadingOfDocuments());
    _context->contextSetClient(settings.client);
    XQueryLimits limits = settings.limits;
    limits.cancelled = _flag;
    _context->contextSetLimits(limits);
    if (_cancellation) _cancellation->add(_flag);
    _input.path = std::move(path);
    _input.options = NSXMLNodePreserveWhitespace;
    if (!_read.is_none()) {
      _input.read = [this](char* buffer, size_t size) { return readFromPython(buffer, size); };
    }
    _thread = std::thread([this] { produce(); });
  }

  ~Stream() { close(); }
  Stream(const Stream&) = delete;
  Stream& operator=(const Stream&) = delete;

  // The next item, made an object of Python; raises StopIteration at the end.
  py::object next() {
    const Asking asking(_channel);
    if (_taken.empty()) take();
    if (_taken.empty()) end();
    const Value item = std::move(_taken.front());
    _taken.pop_front();
    return toPython(*item);
  }

  // From any thread: one that asks meanwhile finds that the stream has ended.
  void close() {
    if (!_thread.joinable()) return;
    if (_thread.get_id() == std::this_thread::get_id()) {
      throw std::runtime_error("a stream cannot be closed by what it reads from");
    }
    // With the interpreter's lock held, so that only one thread waits for it.
    std::thread thread = std::move(_thread);
    _flag->store(true);
    {
      const Unlocked released;
      {
        std::unique_lock held(_channel.lock);
        _channel.isClosed = true;
        _channel.changed.notify_all();
        const auto self = std::this_thread::get_id();
        _channel.changed.wait(
            held, [&] { return _channel.asking == std::thread::id() || _channel.asking == self; });
      }
      thread.join();
    }
    finish();
  }

 private:
  void produce() {
    XQueryStreamFailure failure;
    std::exception_ptr thrown;
    try {
      const auto receive = [this](const Value& item) { return _channel.put(apart(item)); };
      (void)_context->evaluateStream(*_query, _constants, _input, receive, failure);
    } catch (...) {
      thrown = std::current_exception();
    }
    const std::lock_guard held(_channel.lock);
    _channel.failure = std::move(failure);
    if (thrown) _channel.thrown = thrown;
    _channel.isDone = true;
    _channel.changed.notify_all();
  }

  // Called by the library, without the interpreter's lock.
  ptrdiff_t readFromPython(char* buffer, size_t size) {
    if (!isInterpreterAlive()) return -1;
    try {
      return locked([&] {
        const py::object data = _read(size);
        const auto bytes = py::reinterpret_steal<py::object>(PyBytes_FromObject(data.ptr()));
        if (!bytes) throw py::error_already_set();
        const auto length = static_cast<size_t>(PyBytes_GET_SIZE(bytes.ptr()));
        if (length > size) {
          throw py::value_error("read() answered more bytes than it was asked for");
        }
        std::copy_n(PyBytes_AS_STRING(bytes.ptr()), length, buffer);
        return static_cast<ptrdiff_t>(length);
      });
    } catch (...) {
      const std::lock_guard held(_channel.lock);
      _channel.thrown = std::current_exception();
      return -1;
    }
  }

  // Waits for items, and takes all that there are.
  void take() {
    bool isKnown = false;
    while (!isKnown) {
      {
        const Unlocked released;
        std::unique_lock held(_channel.lock);
        isKnown = _channel.changed.wait_for(held, lookAtSignals, [&] {
          return !_channel.waiting.empty() || _channel.isDone || _channel.isClosed;
        });
        _taken.swap(_channel.waiting);
        _channel.changed.notify_all();
      }
      if (PyErr_CheckSignals() != 0) {
        const py::error_already_set interrupt;
        close();
        throw interrupt;
      }
    }
  }

  // Nothing is left: how it ended.
  [[noreturn]] void end() {
    const bool wasClosed = !_thread.joinable();
    close();
    if (wasClosed) throw py::stop_iteration();
    if (_channel.thrown) std::rethrow_exception(std::exchange(_channel.thrown, nullptr));
    if (_channel.failure.error) raise(*_channel.failure.error);
    if (!_channel.failure.reading.message.empty()) raise(_channel.failure.reading, _name);
    throw py::stop_iteration();
  }

  void finish() {
    if (_cancellation) _cancellation->remove(_flag);
    _cancellation = nullptr;
    _context = nullptr;
    _constants.clear();
    _taken.clear();
    _channel.waiting.clear();
    _read = py::none();
  }

  Ref<XQuery> _query;
  std::shared_ptr<Settings> _settings;
  Ref<XQueryContext> _context;
  py::object _read;
  std::string _name;
  XQueryVariables _constants;
  std::shared_ptr<Cancellation> _cancellation;
  Cancellation::Flag _flag = std::make_shared<std::atomic<bool>>(false);
  XQueryStreamInput _input;
  Channel _channel;
  std::deque<Value> _taken;  // by the iterating thread
  std::thread _thread;
};

}  // namespace

void addStreams(py::module_& module) {
  py::class_<Stream>(module, "Stream")
      .def(py::init<const Compiled&, std::shared_ptr<Settings>, std::string, py::object,
                    std::string, const py::dict&>())
      .def("__next__", &Stream::next)
      .def("close", &Stream::close);
}

}  // namespace xquery::python
