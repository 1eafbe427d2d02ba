// Results of streamed queries, item by item.
//
// The library hands items out as it reads; an iterator of Python asks for them. So a thread of its
// own reads, evaluates and puts items into a queue of bounded length, and whoever iterates takes
// them out. Records are gone when the next one is read, so that nodes are copied, and texts as
// well.
//
// The thread ends when the document does, when the stream is closed or let go of, and when the
// package is told that the interpreter ends. What it works with, a `Production`, lives as long as
// either of the two needs it: where the stream is let go of by what it reads from, on that very
// thread, nobody can wait for the thread, which then ends by itself.
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
  void close() {
    const std::lock_guard held(lock);
    isClosed = true;
    changed.notify_all();
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

// What the thread works with. Made and let go of with the interpreter's lock held.
class Production {
 public:
  Production(Ref<XQuery> query, std::shared_ptr<const Settings> settings, std::string path,
             py::object read, const py::dict& given)
      : _query(std::move(query)),
        _settings(std::move(settings)),
        _read(std::move(read)),
        _variables(variablesFrom(given)),
        _context(XQueryContext::xqueryContextWithNamespaces(_settings->namespaces)) {
    _context->contextSetLoading(_settings->loadingOfDocuments());
    _context->contextSetClient(_settings->client);
    XQueryLimits limits = _settings->limits;
    limits.cancelled = flag;
    _context->contextSetLimits(limits);
    _input.path = std::move(path);
    _input.options = NSXMLNodePreserveWhitespace;
    if (_read.is_none()) return;
    _input.read = [this](char* buffer, size_t size) { return readFromPython(buffer, size); };
  }
  Production(const Production&) = delete;
  Production& operator=(const Production&) = delete;

  // Without the interpreter's lock.
  void run() {
    XQueryStreamFailure failure;
    std::exception_ptr thrown;
    try {
      const auto receive = [this](const Value& item) { return channel.put(apart(item)); };
      (void)_context->evaluateStream(*_query, _variables, _input, receive, failure);
    } catch (...) {
      thrown = std::current_exception();
    }
    const std::lock_guard held(channel.lock);
    channel.failure = std::move(failure);
    if (thrown) channel.thrown = thrown;
    channel.isDone = true;
    channel.changed.notify_all();
  }

  // For the collection of cycles.
  PyObject* read() const { return _read.ptr(); }

  const Cancellation::Flag flag = std::make_shared<std::atomic<bool>>(false);
  Channel channel;

 private:
  ptrdiff_t readFromPython(char* buffer, size_t size) {
    if (!isInterpreterAlive()) return -1;
    try {
      return locked([&] {
        const py::object data = _read(size);
        const py::object bytes = steal(PyBytes_FromObject(data.ptr()));
        const auto length = static_cast<size_t>(PyBytes_GET_SIZE(bytes.ptr()));
        if (length > size) {
          throw py::value_error("read() answered more bytes than it was asked for");
        }
        std::copy_n(PyBytes_AS_STRING(bytes.ptr()), length, buffer);
        return static_cast<ptrdiff_t>(length);
      });
    } catch (...) {
      const std::lock_guard held(channel.lock);
      channel.thrown = std::current_exception();
      return -1;
    }
  }

  const Ref<XQuery> _query;
  const std::shared_ptr<const Settings> _settings;
  const py::object _read;
  const XQueryVariables _variables;
  const Ref<XQueryContext> _context;
  XQueryStreamInput _input;
};

using SharedProduction = std::shared_ptr<Production>;

// Lets go on a thread that has not the interpreter's lock.
void letGo(SharedProduction production) {
  if (isInterpreterAlive()) {
    locked([&] { production = nullptr; });
  } else {
    new SharedProduction(std::move(production));  // nobody can take the lock
  }
}

class Stream {
 public:
  Stream(const Compiled& compiled, py::object kept, std::string path, py::object read,
         std::string name, const py::dict& variables)
      : _kept(std::move(kept)), _name(std::move(name)) {
    const auto settings = _kept.cast<std::shared_ptr<Settings>>();
    _production = std::make_shared<Production>(compiled.query, settings, std::move(path),
                                               std::move(read), variables);
    _cancellation = settings->cancellation;
    if (_cancellation) _cancellation->add(_production->flag);
    _thread = std::thread([production = _production]() mutable {
      production->run();
      letGo(std::move(production));
    });
  }

  ~Stream() { letGoOfAll(); }
  Stream(const Stream&) = delete;
  Stream& operator=(const Stream&) = delete;

  // The next item, made an object of Python; raises StopIteration at the end.
  py::object next() {
    if (!_production) throw py::stop_iteration();
    const SharedProduction production = _production;
    const Asking asking(production->channel);
    if (_taken.empty()) take(production->channel);
    if (_taken.empty()) end(*production);
    const Value item = std::move(_taken.front());
    _taken.pop_front();
    return toPython(*item);
  }

  // From any thread: one that asks meanwhile finds that the stream has ended.
  void close() {
    if (!_thread.joinable()) return;
    if (isOnItsThread()) {
      throw std::runtime_error("a stream cannot be closed by what it reads from");
    }
    // With the interpreter's lock held, so that only one thread waits for it.
    std::thread thread = std::move(_thread);
    const SharedProduction production = _production;
    production->flag->store(true);
    {
      const Unlocked released;
      Channel& channel = production->channel;
      channel.close();
      {
        std::unique_lock held(channel.lock);
        const auto self = std::this_thread::get_id();
        channel.changed.wait(
            held, [&] { return channel.asking == std::thread::id() || channel.asking == self; });
      }
      thread.join();
    }
    finish();
  }

  // As `close`, but without waiting where the thread itself does it.
  void letGoOfAll() {
    if (_thread.joinable() && isOnItsThread()) {
      _production->flag->store(true);
      _production->channel.close();
      _thread.detach();
      finish();
    }
    close();
  }

  int traverse(visitproc visit, void* arg) const {
    Py_VISIT(_kept.ptr());
    if (_production) Py_VISIT(_production->read());
    return 0;
  }

 private:
  bool isOnItsThread() const { return _thread.get_id() == std::this_thread::get_id(); }

  // Waits for items, and takes all that there are.
  void take(Channel& channel) {
    bool isKnown = false;
    while (!isKnown) {
      {
        const Unlocked released;
        std::unique_lock held(channel.lock);
        isKnown = channel.changed.wait_for(held, lookAtSignals, [&] {
          return !channel.waiting.empty() || channel.isDone || channel.isClosed;
        });
        _taken.swap(channel.waiting);
        channel.changed.notify_all();
      }
      if (PyErr_CheckSignals() != 0) {
        const py::error_already_set interrupt;
        close();
        throw interrupt;
      }
    }
  }

  // Nothing is left: how it ended.
  [[noreturn]] void end(Production& production) {
    const bool wasClosed = !_thread.joinable();
    close();
    if (wasClosed) throw py::stop_iteration();
    Channel& channel = production.channel;
    if (channel.thrown) std::rethrow_exception(std::exchange(channel.thrown, nullptr));
    if (channel.failure.error) raise(*channel.failure.error);
    if (!channel.failure.reading.message.empty()) raise(channel.failure.reading, _name);
    throw py::stop_iteration();
  }

  void finish() {
    if (_cancellation) _cancellation->remove(_production->flag);
    _cancellation = nullptr;
    _taken.clear();
    _production = nullptr;
    _kept = py::none();
  }

  py::object _kept;  // the settings
  std::string _name;
  SharedProduction _production;  // null once closed
  std::shared_ptr<Cancellation> _cancellation;
  std::deque<Value> _taken;  // by the iterating thread
  std::thread _thread;
};

// --- collection of cycles ------------------------------------------------------------------------

int traverse(PyObject* self, visitproc visit, void* arg) {
  Py_VISIT(Py_TYPE(self));
  const Stream* stream = madeObject<Stream>(self);
  return stream ? stream->traverse(visit, arg) : 0;
}

int clear(PyObject* self) {
  if (Stream* stream = madeObject<Stream>(self)) stream->letGoOfAll();
  return 0;
}

}  // namespace

void addStreams(py::module_& module) {
  py::class_<Stream>(module, "Stream", py::custom_type_setup([](PyHeapTypeObject* type) {
                       takePartInCollection(type, traverse, clear);
                     }))
      .def(py::init<const Compiled&, py::object, std::string, py::object, std::string,
                    const py::dict&>())
      .def("__next__", &Stream::next)
      .def("close", &Stream::close);
}

}  // namespace xquery::python
