#include "Platform/Reading/LibXMLMemory.h"

#include "Platform/Base/Abandoned.h"
#include "Platform/Base/WorkMeter.h"

#include <libxml/parser.h>
#include <libxml/tree.h>
#include <libxml/xmlmemory.h>

#include <algorithm>
#include <cstdlib>
#include <malloc.h>
#include <memory>
#include <mutex>
#include <new>

namespace xquery {

namespace {

constinit thread_local LibXMLMemory::Counter* counter __attribute__((tls_model("initial-exec"))) =
    nullptr;

int64_t sizeOf(void* block) {
  return static_cast<int64_t>(malloc_usable_size(block));
}

void* countingMalloc(size_t size) {
  void* const block = std::malloc(size);
  if (counter) counter->noteBytes(sizeOf(block));
  return block;
}

void* countingRealloc(void* block, size_t size) {
  const int64_t before = counter ? sizeOf(block) : 0;
  void* const moved = std::realloc(block, size);
  if (counter && moved) counter->noteBytes(sizeOf(moved) - before);
  return moved;
}

void countingFree(void* block) {
  if (counter) counter->noteBytes(-sizeOf(block));
  std::free(block);
}

struct Functions {
  xmlFreeFunc free;
  xmlMallocFunc malloc;
  xmlReallocFunc realloc;
  bool operator==(const Functions&) const = default;
};

constexpr Functions plain = {std::free, std::malloc, std::realloc};
constexpr Functions counting = {countingFree, countingMalloc, countingRealloc};

void replace(const Functions& before, const Functions& after) {
  Functions found;
  xmlStrdupFunc strdup;  // takes its memory from the others
  xmlMemGet(&found.free, &found.malloc, &found.realloc, &strdup);
  if (found == before) xmlMemSetup(after.free, after.malloc, after.realloc, strdup);
}

struct LeftBehind {
  ~LeftBehind() {
    if (threads == 0 && parsers == 0) replace(counting, plain);
  }
  std::atomic<int> threads = 0;
  std::atomic<int> parsers = 0;  // set aside to be freed
};
LeftBehind leftBehind;

}  // namespace

LibXMLMemory::CountedBy::CountedBy(Counter& one) : _outer(counter) {
  counter = &one;
}

LibXMLMemory::CountedBy::~CountedBy() {
  counter = _outer;
}

void LibXMLMemory::begin() {
  static std::once_flag begun;
  std::call_once(begun, [] {
    xmlInitParser();
    replace(plain, counting);
  });
}

std::atomic<int>& LibXMLMemory::threadsLeftBehind() {
  return leftBehind.threads;
}

LibXMLValueBytes::~LibXMLValueBytes() {
  workMeter.valueBytes -= _bytes;
}

void LibXMLValueBytes::noteBytes(int64_t more) {
  _bytes += more;
  workMeter.valueBytes += more;
  if (workMeter.valueBytes > workMeter.mostValueBytes) workMeter.stepsLeft = 0;
}

namespace {

void freeWithDocument(xmlParserCtxt* parser) {
  xmlFreeDoc(parser->myDoc);
  parser->myDoc = nullptr;
  xmlFreeParserCtxt(parser);
}

struct LeftParser {
  xmlParserCtxt* parser;
  int64_t bytes;
};

void freeLeft(const void* argument) {
  const std::unique_ptr<const LeftParser> left(static_cast<const LeftParser*>(argument));
  {
    const LibXMLValueBytes apart;  // whatever else is being counted
    freeWithDocument(left->parser);
  }
  uncountValueBytes(static_cast<size_t>(left->bytes));
  --leftBehind.parsers;
}

}  // namespace

LibXMLOwnedParser::~LibXMLOwnedParser() {
  if (!isSetAside()) freeWithDocument(_parser);
}

bool LibXMLOwnedParser::isSetAside() noexcept {
  if (!abandonedValues || !abandonedValues->isOver()) return false;
  // An entry of a table and a short text.
  constexpr int64_t bytesOfAPart = 64;
  const int64_t bytes = std::max(_counted.bytes(), int64_t{0});
  std::unique_ptr<LeftParser> left(new (std::nothrow) LeftParser{_parser, bytes});
  if (!left) return false;
  ++leftBehind.parsers;
  if (!abandonedValues->take(left.get(), freeLeft, static_cast<size_t>(bytes / bytesOfAPart))) {
    --leftBehind.parsers;
    return false;
  }
  static_cast<void>(left.release());
  _counted.leaveCounted();
  return true;
}

}  // namespace xquery
