// XML text: whatever the bytes are, they are a document or an error. A document can be walked and
// written, and what is written is read back as the same tree.
#include "xquery/XMLNode.h"

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <string>

using namespace xquery;

namespace {

constexpr uint32_t keepsAll = NSXMLNodePreserveWhitespace | NSXMLNodePreserveCDATA;

[[noreturn]] void fail(const char* what, const std::string& written) {
  std::fprintf(stderr, "%s\n%s\n", what, written.c_str());
  std::abort();
}

bool areAlike(const NSXMLNode* one, const NSXMLNode* other) {
  return one->kind() == other->kind() && one->nameView() == other->nameView() &&
         one->URIView() == other->URIView() && one->textView() == other->textView();
}

// Written where they are needed, declarations may stand in another place.
bool haveAlikeAttributes(const NSXMLElement* one, const NSXMLElement* other) {
  const NSXMLNode* a = one->firstAttribute();
  const NSXMLNode* b = other->firstAttribute();
  for (; a && b; a = NSXMLElement::nextAttribute(a), b = NSXMLElement::nextAttribute(b)) {
    if (!areAlike(a, b)) return false;
  }
  return !a && !b;
}

bool isSameShape(const NSXMLNode* one, const NSXMLNode* other) {
  return !one->firstChild() == !other->firstChild() && !one->nextSibling() == !other->nextSibling();
}

bool areSameTrees(const NSXMLNode* one, const NSXMLNode* other) {
  for (; one && other; one = one->nextNode(), other = other->nextNode()) {
    if (!areAlike(one, other) || !isSameShape(one, other)) return false;
    const auto* element = dyn_cast<NSXMLElement>(one);
    if (element && !haveAlikeAttributes(element, cast<NSXMLElement>(other))) return false;
  }
  return !one && !other;
}

std::string written(const NSXMLDocument& document) {
  std::string text;
  document.appendXMLTo(text);
  return text;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  const std::string_view bytes(reinterpret_cast<const char*>(data), size);
  NSXMLParseError error;
  const auto dropping = NSXMLDocument::documentWithData(bytes, 0, &error);
  if (!dropping && error.message.empty()) fail("refused without a reason", "");
  const auto document = NSXMLDocument::documentWithData(bytes, keepsAll, &error);
  if (!dropping != !document) fail("white space decides whether it is read", error.message);
  if (!document) return 0;
  static_cast<void>(dropping->stringValue());

  const std::string text = written(*document);
  const auto again = NSXMLDocument::documentWithData(text, keepsAll, &error);
  if (!again) fail(("written but not read: " + error.message).c_str(), text);
  if (!areSameTrees(document.get(), again.get())) fail("read back as another tree", text);
  if (!areSameTrees(document.get(), cast<NSXMLDocument>(document->copy().get()))) {
    fail("copied as another tree", text);
  }
  return 0;
}
