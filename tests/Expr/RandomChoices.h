// What generators of trees and queries choose by; the same seed makes the same choices.
#pragma once

#include <cstddef>
#include <random>
#include <string>
#include <vector>

namespace xquery {

class RandomChoices {
 public:
  explicit RandomChoices(unsigned seed) : _random(seed) {}

  size_t below(size_t bound) {
    return std::uniform_int_distribution<size_t>(0, bound - 1)(_random);
  }
  std::string oneOf(const std::vector<std::string>& choices) {
    return choices[below(choices.size())];
  }

 private:
  std::mt19937 _random;
};

}  // namespace xquery
