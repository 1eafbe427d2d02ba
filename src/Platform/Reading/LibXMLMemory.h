// The memory that libxml2 takes: texts, dictionaries, content models and trees grow in it as easily
// as values do, and nothing else tells how large they are. It stands here between libxml2 and
// malloc to count what is taken for us. Nothing is refused, since libxml2 does not come out of
// every such refusal well: who counts ends the work at the next occasion.
//
// Where a host has given libxml2 another allocator nothing is counted, since of its blocks the
// sizes are unknown.
#pragma once

#include <atomic>
#include <cstdint>

struct _xmlParserCtxt;

namespace xquery {

class LibXMLMemory {
 public:
  class Counter {
   public:
    // Bytes taken, or given back if negative. Called from within libxml2: throws nothing.
    virtual void noteBytes(int64_t more) = 0;

   protected:
    ~Counter() = default;
  };

  // As long as it lives, what libxml2 does for this thread is counted there.
  class CountedBy {
   public:
    explicit CountedBy(Counter& counter);
    ~CountedBy();
    CountedBy(const CountedBy&) = delete;
    CountedBy& operator=(const CountedBy&) = delete;

   private:
    Counter* const _outer;
  };

  // Before anything is counted.
  static void begin();

  // Threads that nobody waits for any more and that still work with libxml2. It releases what it
  // shares when the process ends, whoever still uses it, unless its memory comes from somebody
  // else: where there are such threads, or parsers to be freed, the allocator stays ours.
  static std::atomic<int>& threadsLeftBehind();
};

// Counts as memory of this thread's values while it lives, and makes the next look at the limits
// come at once when that is too much.
class LibXMLValueBytes final : public LibXMLMemory::Counter {
 public:
  LibXMLValueBytes() : _counting(*this) {}
  ~LibXMLValueBytes();
  void noteBytes(int64_t more) override;

  int64_t bytes() const { return _bytes; }
  // Who gives back what is left uncounts it.
  void leaveCounted() { _bytes = 0; }

 private:
  int64_t _bytes = 0;
  const LibXMLMemory::CountedBy _counting;
};

// Frees a parser and its document, which are of names and entities blocks without number: where the
// evaluation is over, when nobody waits for it any more.
class LibXMLOwnedParser {
 public:
  // `counted` knows what was taken for the parser.
  LibXMLOwnedParser(_xmlParserCtxt* parser, LibXMLValueBytes& counted)
      : _parser(parser), _counted(counted) {}
  ~LibXMLOwnedParser();
  LibXMLOwnedParser(const LibXMLOwnedParser&) = delete;
  LibXMLOwnedParser& operator=(const LibXMLOwnedParser&) = delete;

 private:
  bool isSetAside() noexcept;

  _xmlParserCtxt* const _parser;
  LibXMLValueBytes& _counted;
};

}  // namespace xquery
