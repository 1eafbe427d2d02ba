// The contents of file URLs.
#pragma once

#include "xquery/Loading.h"

#include <cstdint>
#include <optional>
#include <string>

namespace xquery {

// Reads a whole file of at most `mostBytes`. Only regular files are read: opening a pipe or reading
// a device might never end. The policy judges the file that was opened, so that no link put in
// place meanwhile leads elsewhere. Nothing, and why in `failure`, when it cannot be had.
std::optional<std::string> readLocalFile(const NSURL& URL, const XQueryLoadingPolicy& policy,
                                         uint64_t mostBytes, std::string& failure);

}  // namespace xquery
