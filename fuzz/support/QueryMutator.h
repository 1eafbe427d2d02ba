// Changes of query text that keep most of its grammar: fragments between brackets, and words, take
// each other's places, or those of what a small grammar makes. Bytes alone seldom get past the
// parser.
#pragma once

#include <cstddef>
#include <random>
#include <string>
#include <string_view>
#include <vector>

namespace xquery::fuzz {

class QueryMutator {
 public:
  explicit QueryMutator(unsigned seed) : _random(seed) {}

  // A text that differs from `query` in a few places, of about `most` bytes at most.
  std::string mutated(std::string query, size_t most);
  // A program of the grammar.
  std::string program();

 private:
  struct Span {
    size_t start;
    size_t length;
  };

  size_t below(size_t bound) {
    return std::uniform_int_distribution<size_t>(0, bound - 1)(_random);
  }
  std::string_view oneOf(const std::vector<std::string_view>& choices) {
    return choices[below(choices.size())];
  }

  // Fragments of a text: what stands between two brackets that belong together, and words.
  static std::vector<Span> fragmentsOf(std::string_view query);
  void changeOnce(std::string& query);

  std::string expr(int depth);
  std::string simple();
  std::string path(int depth);
  std::string step(int depth);
  std::string clauses(int depth);
  std::string constructor(int depth);
  std::string typed(int depth);
  std::string call(int depth);
  std::string prologItem();

  std::mt19937 _random;
};

}  // namespace xquery::fuzz
