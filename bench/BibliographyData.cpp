// The kind of a record, and so its key, follows from its number: a record can refer to one that is
// written later. Names of people are drawn first, and each once.
#include "BibliographyData.h"

#include "DataWriter.h"

#include <algorithm>
#include <array>
#include <set>
#include <string_view>
#include <vector>

namespace bench {
namespace {

constexpr std::array<std::string_view, 12> publishers = {
    "Abel & Sons", "Birch",   "Clover Press",     "Dawn", "Elm House", "Fjord",
    "Garnet",      "Harbour", "Institute Papers", "Juno", "Kestrel",   "Lantern"};
constexpr std::array<std::string_view, 5> currencies = {"EUR", "USD", "GBP", "JPY", "CHF"};

constexpr unsigned firstYear = 1975, lastYear = 2004;

class BibliographyWriter : private DataWriter {
 public:
  explicit BibliographyWriter(double factor)
      : DataWriter(19750704, factor),
        _people(scaled(60000, factor)),
        _journals(scaled(500, factor)),
        _proceedings(scaled(4000, factor)),
        _records(scaled(270000, factor)) {
    std::set<std::string> taken;
    for (unsigned id = 0; id < _people; id++) {
      std::string name = fullName();
      if (!taken.insert(name).second) name += " " + std::to_string(id);
      _names.push_back(name);
    }
  }

  std::string document() {
    _out += "<bibliography>\n";
    _out += "<people>\n";
    for (unsigned id = 0; id < _people; id++) person(id);
    _out += "</people>\n<venues>\n";
    for (unsigned id = 0; id < _journals; id++) journal(id);
    for (unsigned id = 0; id < _proceedings; id++) proceedings(id);
    _out += "</venues>\n<records>\n";
    for (unsigned id = 0; id < _records; id++) record(id);
    _out += "</records>\n</bibliography>\n";
    return std::move(_out);
  }

 private:
  enum class Kind { Article, Paper, Book, Thesis };
  static constexpr std::string_view elements[] = {"article", "paper", "book", "thesis"};

  static Kind kindOf(unsigned record) {
    const unsigned place = record % 20;
    return place < 9    ? Kind::Article
           : place < 17 ? Kind::Paper
           : place < 19 ? Kind::Book
                        : Kind::Thesis;
  }
  static std::string_view elementOf(unsigned record) {
    return elements[static_cast<size_t>(kindOf(record))];
  }
  static std::string keyOf(unsigned record) {
    return std::string(elementOf(record)) + "/" + std::to_string(record);
  }

  void number(std::string_view name, unsigned value) { element(name, std::to_string(value)); }
  void year() { number("year", _random.between(firstYear, lastYear)); }
  void publisher() {
    const std::string_view name = _random.pick(publishers);
    element("publisher", name == publishers[0] ? "Abel &amp; Sons" : name);
  }
  void title() {
    open("title");
    words(_random.between(3, 12));
    close("title");
  }

  void person(unsigned id) {
    put("<person id=\"p#\">\n", {id});
    element("name", _names[id]);
    element("country", _random.pick(countries));
    if (_random.percent(70)) number("born", _random.between(1920, 1980));
    if (_random.percent(30)) element("homepage", "http://www." + std::string(word()) + ".example/");
    _out += "</person>\n";
  }
  void journal(unsigned id) {
    put("<journal key=\"journals/#\">\n", {id});
    title();
    publisher();
    element("country", _random.pick(countries));
    _out += "</journal>\n";
  }
  void proceedings(unsigned id) {
    put("<proceedings key=\"conf/#\">\n", {id});
    title();
    year();
    for (unsigned n = _random.between(1, 3); n > 0; n--) {
      element("editor", _names[_random.below(_people)]);
    }
    publisher();
    _out += "</proceedings>\n";
  }

  // A few people write much, and nobody is an author twice.
  void authors(unsigned count) {
    std::vector<unsigned> chosen;
    for (; count > 0; count--) {
      const unsigned author = _random.skewed(_people);
      if (std::find(chosen.begin(), chosen.end(), author) != chosen.end()) continue;
      chosen.push_back(author);
      element("author", _names[author]);
    }
  }
  void record(unsigned id) {
    const Kind kind = kindOf(id);
    _out += '<';
    _out += elementOf(id);
    attribute("key", keyOf(id));
    if (_random.percent(20)) attribute("lang", _random.percent(50) ? "de" : "fr");
    _out += ">\n";
    authors(kind == Kind::Thesis ? 1 : 1 + _random.skewed(9));
    title();
    year();
    details(kind);
    for (unsigned n = _random.below(4); n > 0; n--) element("keyword", word());
    for (unsigned n = _random.skewed(10); n > 0; n--) {
      _out += "<cite";
      attribute("key", keyOf(_random.below(_records)));
      _out += "/>\n";
    }
    close(elementOf(id));
  }
  void details(Kind kind) {
    switch (kind) {
      case Kind::Article:
        put("<journal>journals/#</journal>\n", {_random.below(_journals)});
        number("volume", _random.between(1, 60));
        pages();
        break;
      case Kind::Paper:
        put("<crossref>conf/#</crossref>\n", {_random.below(_proceedings)});
        pages();
        break;
      case Kind::Book:
        publisher();
        _out += "<price";
        attribute("currency", _random.pick(currencies));
        _out += '>' + moneyText(_random.between(500, 15000));
        close("price");
        break;
      case Kind::Thesis:
        element("school", "University of " + capitalised());
        break;
    }
  }
  void pages() {
    const unsigned first = _random.between(1, 900);
    put("<pages>#-#</pages>\n", {first, first + _random.between(0, 40)});
  }

  unsigned _people, _journals, _proceedings, _records;
  std::vector<std::string> _names;
};

}  // namespace

std::string bibliographyData(double factor) {
  return BibliographyWriter(factor).document();
}

}  // namespace bench
