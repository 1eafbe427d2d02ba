#include "Platform/Loading/AddressKinds.h"

#include <gtest/gtest.h>

#include <arpa/inet.h>
#include <netinet/in.h>
#include <string>
#include <sys/socket.h>
#include <sys/un.h>

namespace xquery {
namespace {

std::string kindOf(const char* text) {
  sockaddr_in four = {};
  sockaddr_in6 address = {};
  std::optional<XQueryAddressKind> kind;
  if (::inet_pton(AF_INET, text, &four.sin_addr) == 1) {
    four.sin_family = AF_INET;
    kind = kindOfAddress(reinterpret_cast<const sockaddr&>(four));
  } else {
    EXPECT_EQ(::inet_pton(AF_INET6, text, &address.sin6_addr), 1) << text;
    address.sin6_family = AF_INET6;
    kind = kindOfAddress(reinterpret_cast<const sockaddr&>(address));
  }
  if (!kind) return "public";
  constexpr const char* names[] = {"loopback", "link-local", "private", "special"};
  return names[static_cast<size_t>(*kind)];
}

struct Row {
  const char* address;
  const char* kind;
};

// The first and the last of each network, and their neighbours.
constexpr Row rows[] = {
    {"0.0.0.0", "loopback"},
    {"0.255.255.255", "loopback"},
    {"1.0.0.0", "public"},
    {"127.0.0.1", "loopback"},
    {"127.255.255.255", "loopback"},
    {"126.255.255.255", "public"},
    {"128.0.0.0", "public"},
    {"::", "loopback"},
    {"::1", "loopback"},
    {"169.253.255.255", "public"},
    {"169.254.0.0", "link-local"},
    {"169.254.169.254", "link-local"},
    {"169.255.0.0", "public"},
    {"fe80::1", "link-local"},
    {"febf:ffff::", "link-local"},
    {"9.255.255.255", "public"},
    {"10.0.0.0", "private"},
    {"10.255.255.255", "private"},
    {"100.63.255.255", "public"},
    {"100.64.0.0", "private"},
    {"100.127.255.255", "private"},
    {"100.128.0.0", "public"},
    {"172.15.255.255", "public"},
    {"172.16.0.0", "private"},
    {"172.31.255.255", "private"},
    {"172.32.0.0", "public"},
    {"192.168.0.0", "private"},
    {"192.169.0.0", "public"},
    {"fc00::", "private"},
    {"fdff::1", "private"},
    {"fe00::", "public"},
    {"fec0::1", "private"},
    {"64:ff9b:1::1", "private"},
    {"192.0.0.1", "special"},
    {"198.18.0.0", "special"},
    {"198.19.255.255", "special"},
    {"198.20.0.0", "public"},
    {"223.255.255.255", "public"},
    {"224.0.0.1", "special"},
    {"240.0.0.1", "special"},
    {"255.255.255.255", "special"},
    {"ff02::1", "special"},
    {"2001::1", "special"},
    {"2001:db8::1", "special"},
    {"2001:4860:4860::8888", "public"},
    {"8.8.8.8", "public"},
    // IPv4 in other clothes
    {"::ffff:127.0.0.1", "loopback"},
    {"::ffff:10.1.2.3", "private"},
    {"::ffff:8.8.8.8", "public"},
    {"::127.0.0.1", "loopback"},
    {"64:ff9b::169.254.169.254", "link-local"},
    {"64:ff9b::8.8.8.8", "public"},
    {"2002:7f00:1::", "loopback"},
    {"2002:c0a8:101::1", "private"},
    {"2002:808:808::1", "public"},
};

TEST(AddressKinds, AreThoseOfTheNetworks) {
  for (const Row& row : rows) EXPECT_EQ(kindOf(row.address), row.kind) << row.address;
}

TEST(AddressKinds, WhatIsNoInternetAddressIsSpecial) {
  sockaddr_un address = {};
  address.sun_family = AF_UNIX;
  EXPECT_EQ(kindOfAddress(reinterpret_cast<const sockaddr&>(address)), XQueryAddressKind::Special);
}

}  // namespace
}  // namespace xquery
