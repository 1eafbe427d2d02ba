// The text of a document, from memory or in pieces, as it is held while it is read: a window that
// moves on, and that grows where a single piece of markup needs it. Where the input cannot be read
// again from its beginning, all of it is kept, for the case that another reader is to have it.
#pragma once

#include "Platform/Reading/KeptText.h"

#include <functional>
#include <string_view>

namespace xquery {

// Fills the buffer; answers the number of bytes, 0 at the end of the input, negative on failure.
using TextInput = std::function<ptrdiff_t(char* buffer, size_t size)>;
// Goes back to the beginning of the input, if that is possible.
using TextRewinding = std::function<bool()>;

class TextSource {
 public:
  // All of it, borrowed.
  explicit TextSource(std::string_view text)
      : _text(text), _begin(text.data()), _end(text.data() + text.size()) {}
  // In pieces. Windows begin small, since most documents are.
  explicit TextSource(TextInput input, TextRewinding rewind = {}, size_t smallestWindow = 16384,
                      size_t usualWindow = 262144);
  ~TextSource();
  TextSource(const TextSource&) = delete;
  TextSource& operator=(const TextSource&) = delete;

  // What comes is wanted at once: reading does not wait for more where there is some.
  void takeAsItComes() { _takesAsItComes = true; }

  // What is in hand.
  const char* begin() const { return _begin; }
  const char* end() const { return _end; }
  // Gets more, after which all that is in hand begins with what was at `keep`. False at the end of
  // the input, and where it fails.
  bool more(const char* keep);
  // Whether there may be more.
  bool isUnfinished() const { return _input && !_isOver; }

  // All of the text again, as often as wanted; the window is gone.
  TextInput fromTheBeginning();
  // What is not yet read, from a place in the window on; the window is gone.
  TextInput from(const char* at);
  // An estimate.
  size_t expectedBytes() const { return _input ? size_t{4096} : _text.size(); }

 private:
  void makeWindow(size_t size, const char* keep);
  void fill();
  bool isEnough(size_t count) const;
  ptrdiff_t readPieces(char* buffer, size_t size);
  ptrdiff_t readAgain(char* buffer, size_t size);
  void freeWindow();

  std::string_view _text;  // of memory
  TextInput _input;
  TextRewinding _rewind;
  const size_t _smallestWindow = 0;
  const size_t _usualWindow = 0;
  char* _window = nullptr;
  size_t _windowSize = 0;
  const char* _begin = nullptr;
  const char* _end = nullptr;
  bool _isOver = false;
  bool _hasFailed = false;
  bool _keeps = false;
  bool _takesAsItComes = false;
  KeptText _kept;
};

}  // namespace xquery
