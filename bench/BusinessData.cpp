// The document is written front to back. References between the parts are drawn from the counts,
// which are fixed before the first element is written, so they always resolve.
#include "BusinessData.h"

#include "DataWriter.h"

#include <algorithm>
#include <array>
#include <cstdio>
#include <string_view>
#include <vector>

namespace bench {
namespace {

constexpr std::array<std::string_view, 6> nations = {"DE", "FR", "KE", "JP", "BR", "US"};
constexpr std::array<std::string_view, 3> classes = {"gold", "silver", "plain"};
constexpr std::array<std::string_view, 4> states = {"open", "shipped", "paid", "cancelled"};
constexpr std::array<std::string_view, 3> currencies = {"EUR", "USD", "GBP"};
constexpr std::array<std::string_view, 4> discounts = {"0.00", "0.00", "0.05", "0.1"};

constexpr unsigned firstOrder = 1000, firstYear = 2001, lastYear = 2004;

class BusinessWriter : private DataWriter {
 public:
  explicit BusinessWriter(double factor)
      : DataWriter(20010203, factor),
        _units(scaled(4000, factor)),
        _customers(scaled(30000, factor)),
        _products(scaled(60000, factor)),
        _orders(scaled(205000, factor)) {}

  std::string document() {
    _out +=
        "<b:business xmlns:b=\"urn:example:business\" xmlns:u=\"urn:example:units\""
        " xmlns:c=\"urn:example:customers\" xmlns:p=\"urn:example:products\""
        " xmlns:o=\"urn:example:orders\">\n";
    unit(1);
    _out += "<c:customers>\n";
    for (unsigned id = 0; id < _customers; id++) customer(id);
    _out += "</c:customers>\n<p:products>\n";
    for (unsigned id = 0; id < _products; id++) product(id);
    _out += "</p:products>\n<o:orders>\n";
    for (unsigned id = 0; id < _orders; id++) order(id);
    _out += "</o:orders>\n<o:payments>\n";
    for (unsigned id = 0; id < _orders; id++) {
      if (_random.percent(70)) payment(id);
    }
    _out += "</o:payments>\n</b:business>\n";
    return std::move(_out);
  }

 private:
  static std::string skuOf(unsigned product) {
    char text[32];
    std::snprintf(text, sizeof text, "P-%06u", product);
    return text;
  }
  void openTag(std::string_view name) { (_out += '<') += name; }
  void attributeOfMoney(std::string_view name, unsigned cents) {
    attribute(name, moneyText(cents));
  }

  // Unit n has the units 4n-2 to 4n+1 below it, as far as there are that many.
  void unit(unsigned id) {
    put("<u:unit id=\"u#\"", {id});
    attribute("name", capitalised());
    _out += ">\n";
    for (unsigned n = _random.between(2, 10); n > 0; n--) employee();
    for (unsigned n = 4 * id - 2; n <= 4 * id + 1 && n <= _units; n++) unit(n);
    close("u:unit");
  }
  void employee() {
    put("<u:employee id=\"e#\"", {_employees++});
    attributeOfMoney("salary", _random.between(150000, 900000));
    attribute("since", isoDate(1980, 2004));
    _out += '>';
    element("u:name", fullName());
    close("u:employee");
  }
  void customer(unsigned id) {
    put("<c:customer id=\"c#\"", {id});
    attribute("country", _random.pick(nations));
    attribute("since", isoDate(1995, 2004));
    attribute("class", _random.pick(classes));
    _out += ">\n";
    element("c:name", fullName());
    openTag("c:credit");
    attribute("currency", _random.pick(currencies));
    _out += '>' + moneyText(_random.between(10000, 2000000));
    close("c:credit");
    put("<c:agent employee=\"e#\"/>\n", {_random.below(_employees)});
    _out += "</c:customer>\n";
  }
  void product(unsigned id) {
    openTag("p:product");
    attribute("sku", skuOf(id));
    put(" group=\"g#\"", {_random.below(40)});
    _out += ">\n";
    open("p:name");
    words(_random.between(1, 4));
    close("p:name");
    _prices.push_back(_random.between(100, 50000));
    money("p:price", _prices.back());
    element("p:tax", _random.percent(70) ? "0.19" : "0.07");
    put("<p:stock>#</p:stock>\n</p:product>\n", {_random.below(500)});
  }

  // A few customers and products make most of the sales, and most lines sell at the price of the
  // product, some above it.
  void order(unsigned id) {
    put("<o:order number=\"#\" customer=\"c#\"", {firstOrder + id, _random.skewed(_customers)});
    attribute("date", isoDate(firstYear, lastYear));
    attribute("status", _random.pick(states));
    _out += ">\n";
    unsigned total = 0;
    const unsigned lines = 1 + _random.skewed(12);
    for (unsigned number = 1; number <= lines; number++) {
      const unsigned product = _random.skewed(_products), quantity = _random.between(1, 9);
      unsigned price = _prices[product];
      if (_random.percent(20)) price += _random.below(200);
      put("<o:line number=\"#\"", {number});
      attribute("sku", skuOf(product));
      put(" quantity=\"#\"", {quantity});
      attributeOfMoney("price", price);
      attribute("discount", _random.pick(discounts));
      _out += "/>\n";
      total += quantity * price;
    }
    _totals.push_back(total);
    if (_random.percent(40)) shipped();
    if (_random.percent(20)) {
      open("o:note");
      words(_random.between(3, 20));
      close("o:note");
    }
    _out += "</o:order>\n";
  }
  void shipped() {
    const std::string day = isoDate(firstYear, lastYear);
    const unsigned hour = _random.below(24), minute = _random.below(60);
    char time[48];
    std::snprintf(time, sizeof time, "T%02u:%02u:00", hour, minute);
    openTag("o:shipped");
    attribute("at", day + time);
    _out += "/>\n";
  }
  void payment(unsigned order) {
    put("<o:payment order=\"#\"", {firstOrder + order});
    attributeOfMoney("amount", _random.percent(80) ? _totals[order] : _totals[order] / 2);
    attribute("date", isoDate(firstYear, lastYear));
    _out += "/>\n";
  }

  unsigned _units, _customers, _products, _orders;
  unsigned _employees = 0;
  std::vector<unsigned> _prices, _totals;  // in cents, by number of product and of order
};

}  // namespace

std::string businessData(double factor) {
  return BusinessWriter(factor).document();
}

}  // namespace bench
