#include "Platform/Base/KeyedHash.h"

#include <chrono>
#include <sys/random.h>

namespace xquery {

namespace {

// Where the system has no random numbers, the time and an address are better than nothing.
HashSecrets drawn() {
  HashSecrets secrets;
  if (::getentropy(&secrets, sizeof secrets) == 0) return secrets;
  const auto now = std::chrono::steady_clock::now().time_since_epoch().count();
  secrets.start = foldedProduct(static_cast<uint64_t>(now) | 1, 0x9E3779B97F4A7C15U);
  secrets.left = foldedProduct(reinterpret_cast<uintptr_t>(&secrets), secrets.start | 1);
  secrets.right = foldedProduct(secrets.left | 1, 0xD1B54A32D192ED03U);
  return secrets;
}

}  // namespace

const HashSecrets& hashSecrets() {
  static const HashSecrets secrets = drawn();
  return secrets;
}

}  // namespace xquery
