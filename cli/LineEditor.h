// Lines from the terminal, edited with libedit, which no other file of the command includes.
//
// The terminal is read here rather than by libedit, so that a signal is looked at between two
// characters and never in the middle of its work: an interrupt drops the line, a change of the size
// draws it anew, a stop puts the terminal back as it was meanwhile. A terminal that cannot move its
// cursor (TERM=dumb) gives lines without editing.
//
// Text is UTF-8 whatever the locale says, as it is everywhere in the command.
#pragma once

#include <cstddef>
#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace cli {

// What may stand in place of the end of a text.
struct Completions {
  size_t start = 0;  // of what is replaced, in bytes
  std::vector<std::string> words;
};
using Completer = std::function<Completions(const std::string& textBeforeCursor)>;

class LineEditor {
 public:
  enum class Event { Line, Interrupt, End };

  explicit LineEditor(Completer complete);
  ~LineEditor();
  LineEditor(const LineEditor&) = delete;
  LineEditor& operator=(const LineEditor&) = delete;

  // A line without its end; one that was taken from the history may hold line feeds.
  Event read(const std::string& prompt, std::string& line);
  // The entry can be gone back to.
  void remember(const std::string& entry);

 private:
  class Implementation;
  const std::unique_ptr<Implementation> _implementation;
};

}  // namespace cli
