// Hashes of what others may choose: names, texts, numbers of a document.
//
// Whoever knows how a table is filled can choose a hundred thousand keys that all meet in one place
// of it, and every look goes past all of them. So the hashes depend on numbers that are drawn when
// the process first asks, and nothing that can be seen may depend on the order in a table.
//
// The mixing is by folded products: of the 128 bits of a product, both halves. Each of the two
// factors has a number of its own mixed in, since with a factor that is zero whatever the other
// knows would be lost.
#pragma once

#include <cstdint>

namespace xquery {

struct HashSecrets {
  uint64_t start;
  uint64_t left;
  uint64_t right;
};

const HashSecrets& hashSecrets();

inline uint64_t foldedProduct(uint64_t a, uint64_t b) {
  __extension__ using Wide = unsigned __int128;
  const Wide product = static_cast<Wide>(a) * b;
  return static_cast<uint64_t>(product) ^ static_cast<uint64_t>(product >> 64);
}

// What was mixed before, and two words more.
inline uint64_t mixedHash(const HashSecrets& secrets, uint64_t hash, uint64_t a, uint64_t b) {
  return foldedProduct(a ^ secrets.left, b ^ secrets.right ^ hash);
}

inline uint64_t keyedHash(uint64_t word) {
  const HashSecrets& secrets = hashSecrets();
  return mixedHash(secrets, secrets.start, word, 0);
}

}  // namespace xquery
