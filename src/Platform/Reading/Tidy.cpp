// libtidy recurses with the nesting of what it reads, and its work can grow out of all proportion
// to its input. So it runs on a thread of its own with a stack of known size, and takes all memory
// from an allocator of ours. That is where it is held to its limits of stack, memory and time:
// reaching one leaves libtidy by a jump out of the allocator, after which all it had is freed from
// outside.
//
// Some of its loops ask for no memory, and a few of those take time that grows with the square of
// what they work on. Whoever waits for the thread therefore leaves it behind when it comes to no
// end, and what it works on is owned by both. What it takes meanwhile counts as memory of whoever
// waits.
//
// What it makes of the HTML is not written by libtidy but here: as XML that is always well formed,
// and without the line breaks that a pretty printer adds.
#include "Platform/Reading/Tidy.h"

#include "Platform/Base/CountedBytes.h"
#include "Platform/Base/ThreadClock.h"
#include "Platform/Base/WorkerThread.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Reading/HTMLText.h"
#include "Platform/Text/UTF8.h"

#include <algorithm>
#include <atomic>
#include <chrono>
#include <condition_variable>
#include <csetjmp>
#include <cstdint>
#include <cstdlib>
#include <exception>
#include <malloc.h>
#include <memory>
#include <mutex>
#include <new>
#include <pthread.h>
#include <tidy/tidy.h>
#include <tidy/tidybuffio.h>
#include <unordered_set>

namespace xquery {

namespace {

constexpr size_t stackSize = size_t{64} << 20;
// What reads may take of it; the passes over the tree that follow need less.
constexpr size_t usableStack = stackSize / 2;
constexpr size_t mostMemory = size_t{256} << 20;
constexpr size_t mostMemoryPerByte = 64;
// Of the processor; ten times what a large document takes.
constexpr double mostSeconds = 2;
constexpr double mostSecondsPerByte = 1e-6;
// Between the allocator's limit and the end of the wait.
constexpr double patience = 1;
constexpr int mostLeftBehind = 4;
// libtidy compares every attribute of a tag with every other, asking for no memory meanwhile. HTML
// that has so many is seldom meant well, so that a thread is not spent on it.
constexpr size_t mostAttributes = 5'000;
constexpr const char* tooMuchTime = "HTML takes too much time";
constexpr const char* tooMuchMemory = "HTML takes too much memory";

// What the values of this thread may still take.
size_t roomForValues() {
  const WorkMeter& meter = workMeter;
  if (meter.mostValueBytes == INT64_MAX) return SIZE_MAX;
  return static_cast<size_t>(std::max<int64_t>(meter.mostValueBytes - meter.valueBytes, 0));
}

// --- the allocator -------------------------------------------------------------------------------

class Allocator {
 public:
  explicit Allocator(size_t inputBytes)
      : _mostBytes(std::min(mostMemory + inputBytes * mostMemoryPerByte, roomForValues())),
        _mostSeconds(mostSeconds + static_cast<double>(inputBytes) * mostSecondsPerByte) {}
  ~Allocator() { freeAll(); }
  Allocator(const Allocator&) = delete;
  Allocator& operator=(const Allocator&) = delete;

  TidyAllocator* forTidy() { return &_shell.tidy; }
  const char* failure() const { return _failure; }
  void freeAll() {
    while (_blocks) unlink(_blocks);
  }
  // From any thread: what has been taken, what is written included, and what would have been when
  // a request was refused.
  size_t bytes() const { return _bytes.load(std::memory_order_relaxed); }
  size_t refusedBytes() const { return _refusedBytes; }
  // What is written grows by doubling; a limit may be reached here.
  void noteWritten(size_t capacity) {
    _bytes.fetch_add(capacity - _written, std::memory_order_relaxed);
    _written = capacity;
    check(0);
  }
  double allowedSeconds() const { return _mostSeconds; }
  // From another thread: the next request for memory is a limit reached.
  void abandon() { _isAbandoned.store(true, std::memory_order_relaxed); }
  // Calls `function`, which is left by a jump when a limit is reached: on its way to libtidy
  // nothing must need its destructor. Whether it came to its end.
  template <class Function>
  bool run(Function function) {
    _stackStart = here();
    if (setjmp(_exit) != 0) return false;
    function();
    return true;
  }

 private:
  struct Block {
    Block* previous;
    Block* next;
    size_t size;
    alignas(std::max_align_t) unsigned char bytes[1];
  };
  // libtidy hands back a pointer to its part.
  struct Shell {
    TidyAllocator tidy;
    Allocator* allocator;
  };
  static constexpr size_t headSize = offsetof(Block, bytes);

  static uintptr_t here() { return reinterpret_cast<uintptr_t>(__builtin_frame_address(0)); }
  static Allocator& of(TidyAllocator* self) { return *reinterpret_cast<Shell*>(self)->allocator; }
  static Block* blockOf(void* bytes) {
    return reinterpret_cast<Block*>(static_cast<unsigned char*>(bytes) - headSize);
  }

  [[noreturn]] void leave(const char* failure) {
    _failure = failure;
    std::longjmp(_exit, 1);
  }
  void check(size_t more) {
    if (_isAbandoned.load(std::memory_order_relaxed)) leave(tooMuchTime);
    if (_stackStart - here() > usableStack) leave("HTML nested too deeply");
    if (bytes() + more > _mostBytes) {
      _refusedBytes = bytes() + more;
      leave(tooMuchMemory);
    }
    constexpr unsigned betweenClocks = 256;
    if (++_calls % betweenClocks == 0 && threadSeconds() > _mostSeconds) {
      leave(tooMuchTime);
    }
  }
  // Most blocks are so small that what malloc and we add is a good part of them.
  void link(Block* block) {
    block->size = malloc_usable_size(block) + sizeof(size_t);
    block->previous = nullptr;
    block->next = _blocks;
    if (_blocks) _blocks->previous = block;
    _blocks = block;
    _bytes.fetch_add(block->size, std::memory_order_relaxed);
  }
  void unlink(Block* block) {
    detach(block);
    std::free(block);
  }
  void detach(Block* block) {
    if (block->next) block->next->previous = block->previous;
    (block->previous ? block->previous->next : _blocks) = block->next;
    _bytes.fetch_sub(block->size, std::memory_order_relaxed);
  }

  static void* allocate(TidyAllocator* self, size_t size);
  static void* reallocate(TidyAllocator* self, void* bytes, size_t size);
  static void release(TidyAllocator* self, void* bytes) {
    if (bytes) of(self).unlink(blockOf(bytes));
  }
  static void panic(TidyAllocator* self, const char*) { of(self).leave("HTML cannot be read"); }
  static const TidyAllocatorVtbl functions;

  Shell _shell = {{&functions}, this};
  Block* _blocks = nullptr;
  std::atomic<size_t> _bytes = 0;
  size_t _written = 0;
  size_t _refusedBytes = 0;
  const size_t _mostBytes;
  const double _mostSeconds;
  unsigned _calls = 0;
  uintptr_t _stackStart = 0;
  std::atomic<bool> _isAbandoned = false;
  const char* _failure = "";
  std::jmp_buf _exit;
};

const TidyAllocatorVtbl Allocator::functions = {&Allocator::allocate, &Allocator::reallocate,
                                                &Allocator::release, &Allocator::panic};

void* Allocator::allocate(TidyAllocator* self, size_t size) {
  Allocator& allocator = of(self);
  allocator.check(size);
  auto* const block = static_cast<Block*>(std::malloc(headSize + size));
  if (!block) allocator.leave("out of memory");
  allocator.link(block);
  return block->bytes;
}

void* Allocator::reallocate(TidyAllocator* self, void* bytes, size_t size) {
  if (!bytes) return allocate(self, size);
  Allocator& allocator = of(self);
  allocator.check(size);
  Block* const block = blockOf(bytes);
  allocator.detach(block);
  auto* const moved = static_cast<Block*>(std::realloc(block, headSize + size));
  if (!moved) {
    allocator.link(block);
    allocator.leave("out of memory");
  }
  allocator.link(moved);
  return moved->bytes;
}

// --- writing -------------------------------------------------------------------------------------

constexpr std::string_view booleanAttributes[] = {
    "async",    "autofocus", "autoplay", "checked", "compact",    "controls", "declare",
    "default",  "defer",     "disabled", "hidden",  "ismap",      "loop",     "multiple",
    "muted",    "nohref",    "noresize", "noshade", "novalidate", "nowrap",   "open",
    "readonly", "required",  "reversed", "selected"};

struct Foreign {
  std::string_view element;
  std::string_view URI;
};

constexpr std::string_view XHTML = "http://www.w3.org/1999/xhtml";
constexpr Foreign foreignNamespaces[] = {
    {"svg", "http://www.w3.org/2000/svg"},
    {"math", "http://www.w3.org/1998/Math/MathML"},
};

bool isNameStart(char byte) {
  return (byte >= 'a' && byte <= 'z') || (byte >= 'A' && byte <= 'Z') || byte == '_';
}

bool isNameCharacter(char byte) {
  return isNameStart(byte) || (byte >= '0' && byte <= '9') || byte == '-' || byte == '.';
}

bool isName(std::string_view name) {
  return !name.empty() && isNameStart(name[0]) &&
         std::all_of(name.begin(), name.end(), isNameCharacter);
}

bool isXMLCharacter(char32_t point) {
  return point == '\t' || point == '\n' || point == '\r' || (point >= 0x20 && point <= 0xFFFD) ||
         (point >= 0x10000 && point <= 0x10FFFF);
}

// Writes the tree that libtidy made. Its functions that call libtidy keep nothing in their frames
// that needs a destructor.
class Writer {
 public:
  Writer(TidyDoc document, Allocator& allocator, std::string& out)
      : _document(document), _allocator(allocator), _out(out) {
    tidyBufInitWithAllocator(&_value, allocator.forTidy());
  }
  void write();

 private:
  // Whether it was an element, left open.
  bool open(TidyNode node);
  void close(TidyNode node);
  void openElement(TidyNode node);
  void attribute(TidyAttr attribute);
  void elementName(std::string_view name);
  enum class Place : uint8_t { Content, Attribute };
  void text(std::string_view utf8, Place place);
  void comment(std::string_view utf8);
  std::string_view value(TidyNode node);

  TidyDoc _document;
  Allocator& _allocator;
  std::string& _out;
  TidyBuffer _value;
  std::unordered_set<std::string_view> _attributes;  // of the tag being written
};

std::string_view Writer::value(TidyNode node) {
  tidyBufClear(&_value);
  if (!tidyNodeGetValue(_document, node, &_value) || !_value.bp) return {};
  return {reinterpret_cast<const char*>(_value.bp), _value.size};
}

std::string_view viewOf(ctmbstr text) {
  return text ? std::string_view(text) : std::string_view();
}

bool isElement(TidyNode node) {
  const TidyNodeType type = tidyNodeGetType(node);
  return type == TidyNode_Start || type == TidyNode_StartEnd;
}

// An end tag that ends nothing may be a child as well.
bool hasElement(TidyNode parent, std::string_view name) {
  TidyNode child = tidyGetChild(parent);
  while (child && !(isElement(child) && viewOf(tidyNodeGetName(child)) == name)) {
    child = tidyGetNext(child);
  }
  return child != nullptr;
}

// The html element, and the comments beside it.
void Writer::write() {
  bool hasRoot = false;
  TidyNode node = tidyGetChild(tidyGetRoot(_document));
  while (node) {
    const bool isTopLevel = tidyNodeGetType(tidyGetParent(node)) == TidyNode_Root;
    const bool isSkipped =
        isTopLevel && (isElement(node) ? hasRoot : tidyNodeGetType(node) != TidyNode_Comment);
    const bool isOpen = !isSkipped && open(node);
    hasRoot = hasRoot || isElement(node);
    if (isOpen && tidyGetChild(node)) {
      node = tidyGetChild(node);
      continue;
    }
    if (isOpen) close(node);
    while (node && !tidyGetNext(node)) {
      node = tidyGetParent(node);
      if (!node || tidyNodeGetType(node) == TidyNode_Root) return;
      close(node);
    }
    node = tidyGetNext(node);
  }
}

bool Writer::open(TidyNode node) {
  _allocator.noteWritten(_out.capacity());
  switch (tidyNodeGetType(node)) {
    case TidyNode_Start:
    case TidyNode_StartEnd:
      openElement(node);
      return true;
    case TidyNode_Text:
    case TidyNode_CDATA:
      text(value(node), Place::Content);
      return false;
    case TidyNode_Comment:
      comment(value(node));
      return false;
    default:
      // Instructions, sections and the code of servers have no meaning in a document.
      return false;
  }
}

void Writer::openElement(TidyNode node) {
  const std::string_view name = viewOf(tidyNodeGetName(node));
  _out += '<';
  elementName(name);
  const bool isTopLevel = tidyNodeGetType(tidyGetParent(node)) == TidyNode_Root;
  if (isTopLevel) {
    _out.append(" xmlns=\"").append(XHTML).append("\"");
  }
  for (const Foreign& foreign : foreignNamespaces) {
    if (name == foreign.element) _out.append(" xmlns=\"").append(foreign.URI).append("\"");
  }
  _attributes.clear();
  for (TidyAttr each = tidyAttrFirst(node); each; each = tidyAttrNext(each)) attribute(each);
  _out += '>';
  // The library adds none where one is ended before it begins.
  if (isTopLevel && !hasElement(node, "head")) _out += "<head><title></title></head>";
}

void Writer::close(TidyNode node) {
  const bool isTopLevel = tidyNodeGetType(tidyGetParent(node)) == TidyNode_Root;
  if (isTopLevel && !hasElement(node, "body") && !hasElement(node, "frameset")) {
    _out += "<body></body>";
  }
  _out += "</";
  elementName(viewOf(tidyNodeGetName(node)));
  _out += '>';
}

void Writer::elementName(std::string_view name) {
  if (name.empty() || !isNameStart(name[0])) _out += '_';
  for (const char byte : name) _out += isNameCharacter(byte) ? byte : '_';
}

// A prefix would have to be declared, and a name that XML does not allow cannot be written.
void Writer::attribute(TidyAttr attribute) {
  const std::string_view name = viewOf(tidyAttrName(attribute));
  const bool isWritten = (isName(name) && name != "xmlns") || name == "xml:lang" ||
                         name == "xml:space" || name == "xml:base" || name == "xml:id";
  if (!isWritten || !_attributes.insert(name).second) return;
  _out.append(" ").append(name).append("=\"");
  if (const ctmbstr given = tidyAttrValue(attribute)) {
    text(given, Place::Attribute);
  } else if (std::find(std::begin(booleanAttributes), std::end(booleanAttributes), name) !=
             std::end(booleanAttributes)) {
    _out.append(name);
  }
  _out += '"';
}

// Null for a character that stands for itself.
const char* escaped(char32_t point, bool isInAttribute) {
  switch (point) {
    case '<':
      return "&lt;";
    case '>':
      return "&gt;";
    case '&':
      return "&amp;";
    case '\r':
      return "&#13;";
    case '"':
      return isInAttribute ? "&quot;" : nullptr;
    case '\n':
      return isInAttribute ? "&#10;" : nullptr;
    case '\t':
      return isInAttribute ? "&#9;" : nullptr;
    default:
      return nullptr;
  }
}

void Writer::text(std::string_view utf8, Place place) {
  const auto* at = reinterpret_cast<const unsigned char*>(utf8.data());
  const unsigned char* const end = at + utf8.size();
  while (at < end) {
    const unsigned char* const start = at;
    const char32_t point = readUTF8(at, end);
    if (const char* reference = escaped(point, place == Place::Attribute)) {
      _out += reference;
    } else if (isXMLCharacter(point)) {
      _out.append(reinterpret_cast<const char*>(start), static_cast<size_t>(at - start));
    }
  }
}

// Two hyphens in a row would end it.
void Writer::comment(std::string_view utf8) {
  _out += "<!--";
  const auto* at = reinterpret_cast<const unsigned char*>(utf8.data());
  const unsigned char* const end = at + utf8.size();
  bool afterHyphen = false;
  while (at < end) {
    const unsigned char* const start = at;
    const char32_t point = readUTF8(at, end);
    if (!isXMLCharacter(point)) continue;
    if (point == '-' && afterHyphen) _out += ' ';
    _out.append(reinterpret_cast<const char*>(start), static_cast<size_t>(at - start));
    afterHyphen = point == '-';
  }
  _out += afterHyphen ? " -->" : "-->";
}

// --- the whole -----------------------------------------------------------------------------------

// Threads that nobody waits for any more. Each ends with its next request for memory.
std::atomic<int> leftBehind = 0;

// Owned by the caller and by the thread that does the work, whichever lives longer.
class Conversion : public std::enable_shared_from_this<Conversion> {
 public:
  explicit Conversion(std::string HTML) : _HTML(std::move(HTML)), _allocator(_HTML.size()) {}

  // The evaluation that waits for it may be ended meanwhile, by an exception.
  std::optional<std::string> XHTML(std::string& failure);

 private:
  static void* start(void* self);
  void run();
  void configure();

  // On the calling thread. Whether the other has ended, and is joined.
  bool endsSoon(pthread_t thread);
  // Likewise; otherwise it is left behind.
  bool waitFor(pthread_t thread);
  bool leave(pthread_t thread);
  void refuse();

  const std::string _HTML;
  Allocator _allocator;
  std::shared_ptr<Conversion> _self;  // for the thread to take
  TidyDoc _document = nullptr;
  std::string _XHTML;
  bool _isDone = false;
  std::exception_ptr _exception;
  std::mutex _mutex;
  std::condition_variable _changed;
  bool _hasEnded = false;
  bool _isLeftBehind = false;
};

// libtidy settles its language, which is one for all documents, when a document is made.
std::mutex creation;

Bool ignoreReport(TidyDoc, TidyReportLevel, uint, uint, ctmbstr) {
  return no;
}

void Conversion::configure() {
  struct Choice {
    TidyOptionId option;
    Bool value;
  };
  // Nothing that is there is left out for being empty, and nothing is reported.
  constexpr Choice choices[] = {
      {TidyXhtmlOut, yes},      {TidyMark, no},          {TidyForceOutput, yes},
      {TidyQuiet, yes},         {TidyShowWarnings, no},  {TidyDropEmptyElems, no},
      {TidyDropEmptyParas, no}, {TidyEscapeScripts, no},
  };
  for (const Choice& choice : choices) tidyOptSetBool(_document, choice.option, choice.value);
  tidyOptSetInt(_document, TidyDoctypeMode, TidyDoctypeOmit);
  tidyOptSetInt(_document, TidyUseCustomTags, TidyCustomInline);
  tidySetCharEncoding(_document, "utf8");
  tidySetReportFilter(_document, &ignoreReport);
}

void Conversion::run() {
  {
    const std::lock_guard lock(creation);
    if (!_allocator.run([this] { _document = tidyCreateWithAllocator(_allocator.forTidy()); })) {
      return;
    }
  }
  TidyBuffer input;
  tidyBufInitWithAllocator(&input, _allocator.forTidy());
  auto* const bytes = reinterpret_cast<byte*>(const_cast<char*>(_HTML.data()));
  tidyBufAttach(&input, bytes, static_cast<uint>(_HTML.size()));
  Writer writer(_document, _allocator, _XHTML);
  _isDone = _allocator.run([&] {
    configure();
    if (tidyParseBuffer(_document, &input) < 0 || tidyCleanAndRepair(_document) < 0) return;
    writer.write();
  });
}

void* Conversion::start(void* self) {
  const auto conversion = std::move(static_cast<Conversion*>(self)->_self);
  try {
    conversion->run();
  } catch (...) {
    conversion->_exception = std::current_exception();
  }
  // Not by whoever waits, who may have to end soon.
  conversion->_allocator.freeAll();
  const std::lock_guard lock(conversion->_mutex);
  conversion->_hasEnded = true;
  if (conversion->_isLeftBehind) --leftBehind;
  conversion->_changed.notify_one();
  return nullptr;
}

bool Conversion::endsSoon(pthread_t thread) {
  constexpr auto soon = std::chrono::milliseconds(10);
  {
    std::unique_lock lock(_mutex);
    if (!_changed.wait_for(lock, soon, [this] { return _hasEnded; })) return false;
  }
  pthread_join(thread, nullptr);
  return true;
}

bool Conversion::waitFor(pthread_t thread) {
  clockid_t processor = CLOCK_THREAD_CPUTIME_ID;
  ::pthread_getcpuclockid(thread, &processor);
  CountedBytes counted;
  try {
    while (!endsSoon(thread)) {
      counted.set(_allocator.bytes());
      lookAtWork();
      if (threadSeconds(processor) > _allocator.allowedSeconds() + patience) return leave(thread);
    }
    return true;
  } catch (...) {
    leave(thread);
    throw;
  }
}

// Throws when it was the ceiling of this thread's values that was reached, and not our own. A large
// block is refused as it is counted; a small one goes unnoticed until somebody looks.
void Conversion::refuse() {
  countValueBlock(_allocator.refusedBytes());
  uncountValueBytes(_allocator.refusedBytes());
  const CountedBytes counted(_allocator.refusedBytes());
  lookAtWork();
}

bool Conversion::leave(pthread_t thread) {
  _allocator.abandon();
  if (endsSoon(thread)) return true;
  const std::lock_guard lock(_mutex);
  _isLeftBehind = !_hasEnded;
  if (_isLeftBehind) ++leftBehind;
  pthread_detach(thread);
  return false;
}

std::optional<std::string> Conversion::XHTML(std::string& failure) {
  pthread_t thread;
  failure = "no thread to read HTML on";
  if (leftBehind >= mostLeftBehind) return std::nullopt;
  _self = shared_from_this();
  if (!startWorkerThread(thread, stackSize, start, this)) {
    _self = nullptr;
    return std::nullopt;
  }
  failure = tooMuchTime;
  if (!waitFor(thread)) return std::nullopt;
  if (_allocator.failure() == tooMuchMemory) refuse();
  if (_exception) std::rethrow_exception(_exception);
  if (_isDone && !_XHTML.empty()) return std::move(_XHTML);
  failure = *_allocator.failure() ? _allocator.failure() : "HTML cannot be read";
  return std::nullopt;
}

}  // namespace

std::optional<std::string> XHTMLFromHTML(std::string_view bytes, std::string& failure) {
  std::string HTML = HTMLAsUTF8(bytes);
  if (HTML.size() > UINT32_MAX / 2) {
    failure = "HTML too long";
    return std::nullopt;
  }
  if (hasTagOfMoreAttributes(HTML, mostAttributes)) {
    failure = "HTML with a tag of too many attributes";
    return std::nullopt;
  }
  const CountedBytes counted(HTML.capacity());
  return std::make_shared<Conversion>(std::move(HTML))->XHTML(failure);
}

}  // namespace xquery
