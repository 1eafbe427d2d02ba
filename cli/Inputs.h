// The documents that a query is evaluated for: files, what folders hold, lists of names.
#pragma once

#include "Options.h"

#include <string>
#include <vector>

namespace cli {

struct Input {
  std::string path;     // "-": standard input
  std::string failure;  // why there is nothing to be read, such as of a folder; usually empty
};

// Whether the name of the file says that it is XML, packed or not.
bool isNamedXML(const std::string& path);

// Whether the name of the file says that it is a document, and where HTML is read one of HTML too.
bool isNamedDocument(const std::string& path, bool html);

// Throws Failure where standard output is a file and the input is that same file, whose reading and
// writing would get in each other's way.
void refuseOutputAsInput(const Options& options, const std::string& path);

// In the order that they are given; those of a folder by their names. Throws Failure where the
// list of names cannot be read.
// Standard input has one reader: what names it again is an input that fails.
//
// Of a folder and the folders below it, those files are taken whose names end as those of such
// documents do, packed or not; what begins with a dot is left out, and links to folders are not
// followed.
std::vector<Input> inputsOf(const Options& options);

}  // namespace cli
