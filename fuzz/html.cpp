// HTML text: whatever the bytes are, they are a document or an error. A document has html, head and
// body, what is written of it is read back as the same tree, and as HTML again it is HTML still.
#include "support/Failure.h"
#include "xquery/XMLNode.h"

#include <cstdint>
#include <string>

using namespace xquery;
using namespace xquery::fuzz;

namespace {

constexpr uint32_t keepsAll = NSXMLNodePreserveWhitespace | NSXMLNodePreserveCDATA;

const NSXMLNode* childNamed(const NSXMLNode* parent, std::string_view name) {
  const NSXMLNode* child = parent ? parent->firstChild() : nullptr;
  while (child && !(child->kind() == Kind::Element && child->localNameView() == name)) {
    child = child->nextSibling();
  }
  return child;
}

void checkFrame(const NSXMLDocument& document) {
  const NSXMLElement* root = document.rootElement();
  check(root && root->localNameView() == "html", "no html");
  check(childNamed(root, "head"), "no head");
  check(childNamed(root, "body") || childNamed(root, "frameset"), "no body");
}

Ref<NSXMLDocument> read(std::string_view bytes, uint32_t options, NSXMLParseError& error) {
  auto document = NSXMLDocument::documentWithData(bytes, options, &error);
  check(document || !error.message.empty(), "refused without a reason");
  return document;
}

// What takes too long or too much to read is no HTML that cannot be read.
bool isGivenUp(std::string_view reason) {
  for (const char* each : {"too much", "too deeply", "too many", "too long", "no thread"}) {
    if (reason.find(each) != reason.npos) return true;
  }
  return false;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  if (size == 0) return 0;
  const std::string_view bytes(reinterpret_cast<const char*>(data + 1), size - 1);
  uint32_t options = NSXMLDocumentTidyHTML;
  if (*data & 1U) options |= NSXMLNodePreserveWhitespace;
  if (*data & 2U) options |= NSXMLNodePreserveCDATA;
  NSXMLParseError error;
  const auto document = read(bytes, options, error);
  if (!document) return 0;
  checkFrame(*document);
  static_cast<void>(document->stringValue());
  std::string written;
  document->appendXMLTo(written);
  const auto again = NSXMLDocument::documentWithData(written, keepsAll, &error);
  if (!again) fail("written but not read: " + error.message, written);
  std::string rewritten;
  again->appendXMLTo(rewritten);
  checkEqual(rewritten, written, "read back as another tree");
  const auto html = read(written, options, error);
  if (html) checkFrame(*html);
  check(html || isGivenUp(error.message), "written but not read as HTML", error.message);
  return 0;
}
