// The contents of file URLs.
#pragma once

#include "xquery/Loading.h"

#include <cstdint>
#include <optional>
#include <string>

namespace xquery {

// Reads a whole file of at most `mostBytes`. Only regular files are read, and nothing else is even
// opened: that of a pipe or a device might never end. Below allowed folders, no link leads out of
// them, whenever it is put in place. The system has to have /proc. Nothing, and why in `failure`,
// when the file cannot be had.
std::optional<std::string> readLocalFile(const NSURL& URL, const XQueryLoadingPolicy& policy,
                                         uint64_t mostBytes, std::string& failure);

}  // namespace xquery
