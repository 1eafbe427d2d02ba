// Expensive evaluations, one of each kind of work, for xquery_limits.
//
// To add a kind, add a row to the table it belongs to: a query that takes seconds at least and,
// where it reads something, what it reads. A row that ends by itself before its deadline says
// nothing, and the program tells.
#pragma once

#include <string>
#include <utility>
#include <vector>

namespace bench {

// Made when the row is run; most are large.
class Text {
 public:
  Text() = default;
  Text(const char* text) : _text(text) {}
  template <class Make, class = decltype(std::string(std::declval<Make>()()))>
  Text(Make make) : _make(make) {}

  explicit operator bool() const { return _text || _make; }
  std::string text() const { return _make ? _make() : std::string(_text ? _text : ""); }

 private:
  const char* _text = nullptr;
  std::string (*_make)() = nullptr;
};

enum class Door {
  Evaluate,  // limits of the evaluation
  Compile,   // the compilation is what takes long, under limits for compiling
};

struct LimitRow {
  const char* name;
  Text query;
  Text resource = {};  // what every URL of the scheme "app" answers; "app:a.html" is read as HTML
  Text item = {};      // XML of the context item, read before the clock starts
  Door door = Door::Evaluate;
};

// Each is a table in a file of its own.
std::vector<LimitRow> readingRows();
std::vector<LimitRow> valueRows();
std::vector<LimitRow> textRows();
std::vector<LimitRow> sequenceRows();
std::vector<LimitRow> treeRows();
std::vector<LimitRow> programRows();

// --- for making them -----------------------------------------------------------------------------

// Each "@" is the number of the repetition.
std::string repeated(const std::string& text, int count);
// Declares $s: that text, doubled so many times.
std::string doubledText(const std::string& text, int times, const std::string& name = "s");

}  // namespace bench
