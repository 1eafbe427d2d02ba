// Opens files below the folders that a policy allows, without ever stepping out of them.
//
// Checking where a path leads and opening it afterwards would leave time to put a link in place,
// and asking the file system about a path that leads out would tell what is there. So the path is
// judged by its text first, and then followed from the folder on: by the kernel where it can hold a
// path below a folder, otherwise name by name. A link whose target is written as an absolute path,
// which the kernel does not take even where it stays below, is followed name by name as well: its
// text is judged like that of any path.
//
// What is answered is a place: it can be looked at, and opened once it is known to be a file.
#pragma once

#include "Platform/Loading/Descriptor.h"
#include "xquery/Loading.h"

#include <string>

namespace xquery {

// A descriptor that was opened with O_PATH; none, and why in errno, when there is nothing: EXDEV
// where the path lies, or a link of it leads, outside all folders. The path is one of localPathOf.
Descriptor findBelowAllowedFolders(const XQueryLoadingPolicy& policy, const std::string& path);

// The same without the kernel's help.
Descriptor walkBelowAllowedFolders(const XQueryLoadingPolicy& policy, const std::string& path);

}  // namespace xquery
