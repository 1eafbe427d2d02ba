// What the generators of data have in common: a stream of pseudo-random numbers (splitmix64, so no
// library's idea of a distribution can change a byte), words, and the writing of elements.
//
// Prose is drawn from a vocabulary made of syllables with a skewed distribution: few words are
// frequent and many are rare, as in a language, which keeps the text honest for substring searches.
#pragma once

#include <array>
#include <cstdint>
#include <initializer_list>
#include <string>
#include <string_view>
#include <vector>

namespace bench {

class Random {
 public:
  explicit Random(uint64_t seed) : _state(seed) {}

  uint64_t next() {
    _state += 0x9E3779B97F4A7C15U;
    uint64_t z = _state;
    z = (z ^ (z >> 30)) * 0xBF58476D1CE4E5B9U;
    z = (z ^ (z >> 27)) * 0x94D049BB133111EBU;
    return z ^ (z >> 31);
  }
  // From 0 to limit - 1.
  unsigned below(unsigned limit) { return static_cast<unsigned>((next() >> 32) * limit >> 32); }
  unsigned between(unsigned low, unsigned high) { return low + below(high - low + 1); }
  bool percent(unsigned chance) { return below(100) < chance; }
  // Skewed towards 0.
  unsigned skewed(unsigned limit) {
    const uint64_t square = static_cast<uint64_t>(below(65536)) * below(65536);
    return static_cast<unsigned>((square >> 16) * limit >> 16);
  }
  template <class Table>
  std::string_view pick(const Table& table) {
    return table[below(static_cast<unsigned>(table.size()))];
  }

 private:
  uint64_t _state;
};

inline constexpr std::array<std::string_view, 8> countries = {
    "United States", "Germany",     "Kenya",  "Japan",
    "Brazil",        "New Zealand", "France", "Côte d'Ivoire"};

// How many of a thing there are at a factor, of which there are `whole` at factor 1: at least one.
[[nodiscard]] unsigned scaled(double whole, double factor);

// Draw numbers into named variables before they are passed on: the order in which arguments are
// evaluated is the compiler's.
class DataWriter {
 protected:
  DataWriter(uint64_t seed, double factor);

  // Appends literal text in which each "#" stands for the next number.
  void put(std::string_view pattern, std::initializer_list<unsigned> numbers = {});
  void open(std::string_view name) { (_out += '<') += name, _out += '>'; }
  void close(std::string_view name) { ((_out += "</") += name) += ">\n"; }
  void element(std::string_view name, std::string_view text);
  // ` name="text"`
  void attribute(std::string_view name, std::string_view text);
  void money(std::string_view name, unsigned cents) { element(name, moneyText(cents)); }
  void words(unsigned count);

  [[nodiscard]] static std::string moneyText(unsigned cents);
  // YYYY-MM-DD, with days to the 28th.
  [[nodiscard]] std::string isoDate(unsigned firstYear, unsigned lastYear);
  [[nodiscard]] std::string_view word() { return _vocabulary[_random.skewed(4000)]; }
  [[nodiscard]] std::string capitalised();
  [[nodiscard]] std::string fullName();

  Random _random;
  std::string _out;

 private:
  std::vector<std::string> _vocabulary;
};

}  // namespace bench
