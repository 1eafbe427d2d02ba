// Addresses that are no servers of the public network.
#pragma once

#include "xquery/Loading.h"

#include <optional>

struct sockaddr;

namespace xquery {

// Nothing for an address of the public network. An IPv4 address inside an IPv6 one counts for what
// it is by itself; what is no internet address at all is Special.
std::optional<XQueryAddressKind> kindOfAddress(const sockaddr& address);

}  // namespace xquery
