// What may stand at the beginning of a document.
#pragma once

namespace xquery {

// Each answers the place behind what begins at `at`, or null where the text ends before it does,
// and throws NotTaken for what is not understood.
//
// "<?xml", which begins the text, up to "?>": version 1.0, in UTF-8 or ASCII.
struct XMLDeclaration {
  bool isASCII = false;
};
const char* readXMLDeclaration(const char* at, const char* end, XMLDeclaration& declaration);
// "<!DOCTYPE" up to ">", without declarations of its own. What it names is never read, so that
// nothing of it matters.
const char* readDocumentType(const char* at, const char* end);

}  // namespace xquery
