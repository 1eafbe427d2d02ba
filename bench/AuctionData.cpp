// The document is written front to back. References between the parts are drawn from the counts,
// which are fixed before the first element is written, so they always resolve.
#include "AuctionData.h"

#include "DataWriter.h"

#include <algorithm>
#include <array>
#include <cstdio>
#include <string_view>

namespace bench {
namespace {

constexpr std::array<std::string_view, 4> payments = {"Cash", "Creditcard", "Money order",
                                                      "Personal check"};
constexpr std::array<std::string_view, 4> educations = {"High School", "College", "Graduate School",
                                                        "Other"};
constexpr std::array<std::string_view, 3> decorations = {"keyword", "bold", "emph"};

struct Region {
  std::string_view name;
  double share;
};
constexpr std::array<Region, 6> regions = {{{"africa", 0.025},
                                            {"asia", 0.09},
                                            {"australia", 0.10},
                                            {"europe", 0.28},
                                            {"namerica", 0.46},
                                            {"samerica", 0.045}}};

struct Counts {
  explicit Counts(double factor) {
    for (size_t i = 0; i < regions.size(); i++) {
      items[i] = scaled(22000 * regions[i].share, factor);
      allItems += items[i];
    }
    categories = scaled(1000, factor);
    people = scaled(25000, factor);
    openAuctions = scaled(12000, factor);
    closedAuctions = scaled(10000, factor);
  }

  std::array<unsigned, regions.size()> items{};
  unsigned allItems = 0;
  unsigned categories, people, openAuctions, closedAuctions;
};

class AuctionWriter : private DataWriter {
 public:
  explicit AuctionWriter(double factor) : DataWriter(20041029, factor), _counts(factor) {}

  std::string document() {
    _out += "<site>\n";
    writeRegions();
    writeCategories();
    writePeople();
    writeOpenAuctions();
    writeClosedAuctions();
    _out += "</site>\n";
    return std::move(_out);
  }

 private:
  void date(std::string_view name) {
    const unsigned month = _random.between(1, 12), day = _random.between(1, 28);
    const unsigned year = _random.between(1998, 2004);
    char text[48];
    std::snprintf(text, sizeof text, "%02u/%02u/%u", month, day, year);
    element(name, text);
  }
  void time() {
    const unsigned hour = _random.below(24), minute = _random.below(60);
    const unsigned second = _random.below(60);
    char text[48];
    std::snprintf(text, sizeof text, "%02u:%02u:%02u", hour, minute, second);
    element("time", text);
  }

  // Mixed content: runs of words broken by decorations, which nest a little.
  void mixed(unsigned budget, unsigned depth) {
    while (budget > 0) {
      const unsigned run = std::min(budget, _random.between(4, 24));
      words(run);
      budget -= run;
      if (budget == 0) break;
      const std::string_view name = _random.pick(decorations);
      const unsigned inner = std::min(budget, _random.between(1, 4));
      _out += ' ';
      open(name);
      if (depth < 2 && _random.percent(15)) {
        mixed(inner, depth + 1);
      } else {
        words(inner);
      }
      ((_out += "</") += name) += "> ";
      budget -= inner;
    }
  }
  void text() {
    open("text");
    mixed(_random.between(15, 123), 0);
    close("text");
  }
  void parlist(unsigned depth) {
    _out += "<parlist>\n";
    for (unsigned count = _random.between(2, 4); count > 0; count--) {
      _out += "<listitem>\n";
      if (depth < 3 && _random.percent(20)) {
        parlist(depth + 1);
      } else {
        text();
      }
      _out += "</listitem>\n";
    }
    _out += "</parlist>\n";
  }
  void description() {
    _out += "<description>\n";
    if (_random.percent(30)) {
      parlist(0);
    } else {
      text();
    }
    _out += "</description>\n";
  }

  void writeRegions() {
    _out += "<regions>\n";
    unsigned id = 0;
    for (size_t i = 0; i < regions.size(); i++) {
      open(regions[i].name);
      _out += '\n';
      for (unsigned n = 0; n < _counts.items[i]; n++) item(id++);
      close(regions[i].name);
    }
    _out += "</regions>\n";
  }
  void item(unsigned id) {
    put(_random.percent(10) ? "<item id=\"item#\" featured=\"yes\">\n" : "<item id=\"item#\">\n",
        {id});
    element("location", _random.pick(countries));
    put("<quantity>#</quantity>\n", {_random.percent(80) ? 1 : _random.between(2, 9)});
    open("name");
    words(_random.between(2, 4));
    close("name");
    element("payment", _random.pick(payments));
    description();
    element("shipping", _random.percent(50) ? "Will ship internationally" : "Buyer pays postage");
    for (unsigned n = _random.between(1, 5); n > 0; n--) {
      put("<incategory category=\"category#\"/>\n", {_random.below(_counts.categories)});
    }
    _out += "<mailbox>\n";
    for (unsigned n = _random.percent(50) ? _random.between(1, 3) : 0; n > 0; n--) mail();
    _out += "</mailbox>\n</item>\n";
  }
  void mail() {
    _out += "<mail>\n";
    element("from", fullName());
    element("to", fullName());
    date("date");
    text();
    _out += "</mail>\n";
  }

  void writeCategories() {
    _out += "<categories>\n";
    for (unsigned id = 0; id < _counts.categories; id++) {
      put("<category id=\"category#\">\n", {id});
      open("name");
      words(_random.between(1, 3));
      close("name");
      description();
      _out += "</category>\n";
    }
    _out += "</categories>\n<catgraph>\n";
    for (unsigned id = 0; id < _counts.categories; id++) {
      put("<edge from=\"category#\" to=\"category#\"/>\n",
          {_random.below(_counts.categories), _random.below(_counts.categories)});
    }
    _out += "</catgraph>\n";
  }

  void writePeople() {
    _out += "<people>\n";
    for (unsigned id = 0; id < _counts.people; id++) person(id);
    _out += "</people>\n";
  }
  void person(unsigned id) {
    put("<person id=\"person#\">\n", {id});
    const std::string first = capitalised(), last = capitalised();
    element("name", first + " " + last);
    element("emailaddress", "mailto:" + last + "@" + std::string(word()) + ".example");
    if (_random.percent(50)) {
      put("<phone>+# (#) #</phone>\n",
          {_random.between(1, 39), _random.between(10, 999), _random.between(1000000, 99999999)});
    }
    if (_random.percent(50)) address();
    if (_random.percent(50)) element("homepage", "http://www." + last + ".example/~" + first);
    if (_random.percent(50)) {
      put("<creditcard># # # #</creditcard>\n",
          {_random.between(1000, 9999), _random.between(1000, 9999), _random.between(1000, 9999),
           _random.between(1000, 9999)});
    }
    if (_random.percent(75)) profile();
    if (_random.percent(50)) {
      _out += "<watches>\n";
      for (unsigned n = _random.between(1, 6); n > 0; n--) {
        put("<watch open_auction=\"open_auction#\"/>\n", {_random.below(_counts.openAuctions)});
      }
      _out += "</watches>\n";
    }
    _out += "</person>\n";
  }
  void address() {
    _out += "<address>\n";
    element("street", capitalised() + " Street");
    element("city", capitalised());
    element("country", _random.pick(countries));
    if (_random.percent(30)) element("province", capitalised());
    put("<zipcode>#</zipcode>\n</address>\n", {_random.between(1000, 99999)});
  }
  void profile() {
    const unsigned income = _random.between(900000, 12000000);
    char text[48];
    std::snprintf(text, sizeof text, "<profile income=\"%u.%02u\">\n", income / 100, income % 100);
    _out += text;
    for (unsigned n = _random.below(5); n > 0; n--) {
      put("<interest category=\"category#\"/>\n", {_random.below(_counts.categories)});
    }
    if (_random.percent(50)) element("education", _random.pick(educations));
    if (_random.percent(50)) element("gender", _random.percent(50) ? "male" : "female");
    element("business", _random.percent(50) ? "Yes" : "No");
    if (_random.percent(50)) put("<age>#</age>\n", {_random.between(18, 80)});
    _out += "</profile>\n";
  }

  void writeOpenAuctions() {
    _out += "<open_auctions>\n";
    for (unsigned id = 0; id < _counts.openAuctions; id++) openAuction(id);
    _out += "</open_auctions>\n";
  }
  void openAuction(unsigned id) {
    put("<open_auction id=\"open_auction#\">\n", {id});
    unsigned current = _random.between(100, 30000);
    money("initial", current);
    if (_random.percent(50)) money("reserve", current + _random.between(100, 20000));
    for (unsigned n = _random.skewed(24); n > 0; n--) {
      const unsigned increase = _random.between(1, 24) * 150;
      _out += "<bidder>\n";
      date("date");
      time();
      put("<personref person=\"person#\"/>\n", {_random.below(_counts.people)});
      money("increase", increase);
      _out += "</bidder>\n";
      current += increase;
    }
    money("current", current);
    if (_random.percent(50)) element("privacy", "Yes");
    put("<itemref item=\"item#\"/>\n<seller person=\"person#\"/>\n",
        {_random.below(_counts.allItems), _random.below(_counts.people)});
    annotation();
    put("<quantity>#</quantity>\n", {_random.between(1, 9)});
    element("type", _random.percent(70) ? "Regular" : "Featured");
    _out += "<interval>\n";
    date("start");
    date("end");
    _out += "</interval>\n</open_auction>\n";
  }
  void annotation() {
    put("<annotation>\n<author person=\"person#\"/>\n", {_random.below(_counts.people)});
    description();
    put("<happiness>#</happiness>\n</annotation>\n", {_random.between(1, 10)});
  }

  void writeClosedAuctions() {
    _out += "<closed_auctions>\n";
    for (unsigned n = 0; n < _counts.closedAuctions; n++) {
      put("<closed_auction>\n<seller person=\"person#\"/>\n<buyer person=\"person#\"/>\n"
          "<itemref item=\"item#\"/>\n",
          {_random.below(_counts.people), _random.below(_counts.people),
           _random.below(_counts.allItems)});
      money("price", _random.between(100, 60000));
      date("date");
      put("<quantity>#</quantity>\n", {_random.between(1, 9)});
      element("type", _random.percent(70) ? "Regular" : "Featured");
      annotation();
      _out += "</closed_auction>\n";
    }
    _out += "</closed_auctions>\n";
  }

  Counts _counts;
};

}  // namespace

std::string auctionData(double factor) {
  return AuctionWriter(factor).document();
}

}  // namespace bench
