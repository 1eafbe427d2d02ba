#include "Platform/Loading/AddressKinds.h"

#include <algorithm>
#include <arpa/inet.h>
#include <array>
#include <cstring>
#include <netinet/in.h>
#include <sys/socket.h>
#include <vector>

namespace xquery {

namespace {

using AddressKind = XQueryAddressKind;

// IPv4 addresses are written as IPv6 does, after the prefix that maps them.
using Bytes = std::array<uint8_t, 16>;
constexpr size_t bytesBeforeIPv4 = 12;
constexpr Bytes mapped = {0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0xFF, 0xFF};

struct Row {
  const char* network;
  int bits;
  AddressKind kind;
};

constexpr Row rows[] = {
    {"0.0.0.0", 8, AddressKind::Loopback},
    {"127.0.0.0", 8, AddressKind::Loopback},
    {"::", 128, AddressKind::Loopback},
    {"::1", 128, AddressKind::Loopback},
    {"169.254.0.0", 16, AddressKind::LinkLocal},
    {"fe80::", 10, AddressKind::LinkLocal},
    {"10.0.0.0", 8, AddressKind::Private},
    {"100.64.0.0", 10, AddressKind::Private},  // between a provider and its customers
    {"172.16.0.0", 12, AddressKind::Private},
    {"192.168.0.0", 16, AddressKind::Private},
    {"fc00::", 7, AddressKind::Private},
    {"fec0::", 10, AddressKind::Private},
    {"64:ff9b:1::", 48, AddressKind::Private},  // translation inside a site
    {"192.0.0.0", 24, AddressKind::Special},
    {"192.0.2.0", 24, AddressKind::Special},
    {"198.18.0.0", 15, AddressKind::Special},
    {"198.51.100.0", 24, AddressKind::Special},
    {"203.0.113.0", 24, AddressKind::Special},
    {"224.0.0.0", 4, AddressKind::Special},
    {"240.0.0.0", 4, AddressKind::Special},
    {"100::", 64, AddressKind::Special},
    {"2001::", 32, AddressKind::Special},  // tunnels, whose ends are not in the open
    {"2001:db8::", 32, AddressKind::Special},
    {"ff00::", 8, AddressKind::Special},
};

// IPv6 addresses that stand for IPv4 ones, and where they hold them.
struct Embedding {
  const char* network;
  int bits;
  size_t offset;
};
constexpr Embedding embeddings[] = {{"::", 96, 12}, {"64:ff9b::", 96, 12}, {"2002::", 16, 2}};

Bytes fromIPv4(const uint8_t* bytes) {
  Bytes all = mapped;
  std::copy_n(bytes, all.size() - bytesBeforeIPv4, all.begin() + bytesBeforeIPv4);
  return all;
}

struct Network {
  Bytes bytes = {};
  int bits = 0;

  Network(const char* text, int length) : bits(length) {
    if (::inet_pton(AF_INET6, text, bytes.data()) == 1) return;
    uint8_t ipv4[4] = {};
    ::inet_pton(AF_INET, text, ipv4);
    bytes = fromIPv4(ipv4);
    bits += static_cast<int>(bytesBeforeIPv4) * 8;
  }
  bool contains(const Bytes& address) const {
    const auto whole = static_cast<size_t>(bits / 8);
    if (!std::equal(bytes.begin(), bytes.begin() + whole, address.begin())) return false;
    if (bits % 8 == 0) return true;
    return (bytes[whole] ^ address[whole]) >> (8 - bits % 8) == 0;
  }
};

std::optional<AddressKind> kindOf(const Bytes& address) {
  for (const Row& row : rows) {
    if (Network(row.network, row.bits).contains(address)) return row.kind;
  }
  for (const Embedding& row : embeddings) {
    if (!Network(row.network, row.bits).contains(address)) continue;
    return kindOf(fromIPv4(address.data() + row.offset));
  }
  return std::nullopt;
}

}  // namespace

std::optional<XQueryAddressKind> kindOfAddress(const sockaddr& address) {
  Bytes bytes = {};
  if (address.sa_family == AF_INET) {
    const auto& internet = reinterpret_cast<const sockaddr_in&>(address);
    return kindOf(fromIPv4(reinterpret_cast<const uint8_t*>(&internet.sin_addr)));
  }
  if (address.sa_family != AF_INET6) return AddressKind::Special;
  const auto& internet = reinterpret_cast<const sockaddr_in6&>(address);
  std::memcpy(bytes.data(), &internet.sin6_addr, bytes.size());
  return kindOf(bytes);
}

}  // namespace xquery
