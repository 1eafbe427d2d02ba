#include "ReadingTexts.h"

#include "DataWriter.h"

#include <utility>

namespace bench {
namespace {

// With which every text begins and ends, and how large it is to be.
class TextWriter : protected DataWriter {
 public:
  TextWriter(uint64_t seed, double factor)
      : DataWriter(seed, factor), _bytes(static_cast<size_t>(factor * 110e6)) {}

 protected:
  template <class WriteOne>
  std::string document(std::string_view root, WriteOne writeOne) {
    open(root);
    while (_out.size() < _bytes) writeOne();
    close(root);
    return std::move(_out);
  }

 private:
  const size_t _bytes;
};

class AttributeRecords : TextWriter {
 public:
  explicit AttributeRecords(double factor) : TextWriter(20040101, factor) {}

  std::string document() {
    unsigned number = 0;
    return TextWriter::document("readings", [&] {
      put("<reading id=\"r#\" sensor=\"s#\"", {number, _random.below(5000)});
      attribute("day", isoDate(2001, 2004));
      attribute("state", _random.percent(90) ? "ok" : "late");
      attribute("unit", "hPa");
      put(" low=\"#\" mean=\"#\" high=\"#\" count=\"#\"/>\n",
          {_random.between(900, 990), _random.between(990, 1010), _random.between(1010, 1100),
           _random.below(100)});
      ++number;
    });
  }
};

class Prose : TextWriter {
 public:
  explicit Prose(double factor) : TextWriter(20040202, factor) {}

  std::string document() {
    return TextWriter::document("book", [&] {
      open("chapter");
      element("title", fullName());
      for (unsigned left = _random.between(5, 20); left > 0; left--) paragraph();
      close("chapter");
    });
  }

 private:
  void paragraph() {
    open("p");
    for (unsigned left = _random.between(1, 4); left > 0; left--) {
      words(_random.between(60, 200));
      if (_random.percent(50)) ((_out += " <em>") += word()) += "</em> ";
    }
    close("p");
  }
};

class Scripts : TextWriter {
 public:
  explicit Scripts(double factor) : TextWriter(20040303, factor) {}

  std::string document() {
    return TextWriter::document("texts", [&] {
      ((_out += "<text xml:lang=\"") += _random.pick(languages)) += "\">";
      const auto& characters = alphabets[_random.below(alphabets.size())];
      for (unsigned left = _random.between(5, 60); left > 0; left--) {
        for (unsigned letters = _random.between(1, 8); letters > 0; letters--) {
          _out += _random.pick(characters);
        }
        _out += ' ';
      }
      close("text");
    });
  }

 private:
  static constexpr std::array<std::string_view, 4> languages = {"ru", "el", "ja", "mixed"};
  using Alphabet = std::array<std::string_view, 8>;
  // Of two, two, three, and one to four bytes each.
  static constexpr std::array<Alphabet, 4> alphabets = {
      {{"а", "б", "в", "г", "д", "е", "ж", "з"},
       {"α", "β", "γ", "δ", "ε", "ζ", "η", "θ"},
       {"日", "本", "語", "の", "文", "字", "列", "、"},
       {"a", "é", "ß", "€", "中", "𝄞", "z", "ø"}}};
};

class Nested : TextWriter {
 public:
  explicit Nested(double factor) : TextWriter(20040404, factor) {}

  std::string document() {
    return TextWriter::document("trees", [&] {
      const unsigned depth = _random.between(2000, 6000);
      for (unsigned level = 0; level < depth; level++) {
        put("<node level=\"#\">", {level});
        if (level % 8 == 0) words(1);
      }
      for (unsigned level = 0; level < depth; level++) _out += "</node>";
      _out += '\n';
    });
  }
};

}  // namespace

std::string attributeRecords(double factor) {
  return AttributeRecords(factor).document();
}
std::string proseText(double factor) {
  return Prose(factor).document();
}
std::string textInScripts(double factor) {
  return Scripts(factor).document();
}
std::string nestedElements(double factor) {
  return Nested(factor).document();
}

}  // namespace bench
