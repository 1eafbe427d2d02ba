#include "Functions/NodeText.h"

#include "Types/XQueryCasting.h"
#include "Types/XQueryNodeFunctions.h"
#include "Types/XQueryTypeTable.h"

#include <array>

namespace xquery {
namespace {

struct OptionLetter {
  char16_t letter;
  uint32_t bits;
};

// The bits are those of the document parser, which does not look at all of them.
constexpr auto optionLetters = std::to_array<OptionLetter>({
    {u'a', 0x200000},   // preserve the order of attributes
    {u'd', 0x1000000},  // preserve CDATA sections
    {u'e', 0x6},        // preserve the form of empty elements
    {u'h', 0x200},      // tidy HTML
    {u'n', 0x100000},   // preserve the order of namespaces
    {u'p', 0x800000},   // preserve prefixes
    {u'q', 0x18},       // preserve the style of quotes
    {u'r', 0x400000},   // preserve entities
    {u'w', 0x2000000},  // preserve white space
    {u'x', 0x400},      // tidy XML
    {u'T', 0x600},      // both ways to tidy
    {u'P', 0x3F00006},  // all that preserves
});

uint32_t optionsForLetters(NSStringView letters) {
  uint32_t options = 0;
  for (const OptionLetter& option : optionLetters) {
    if (letters.find(option.letter) != NSStringView::notFound) options |= option.bits;
  }
  return options;
}

const NSXMLNode* onlyNode(const Value* arguments, size_t count) {
  return count == 1 ? dyn_cast<NSXMLNode>(arguments[0].get()) : nullptr;
}

}  // namespace

Value ext_string_from_node(const Value* arguments, size_t count, XQueryContext&) {
  const NSXMLNode* node = onlyNode(arguments, count);
  return node ? Value(XQueryNodeStringRepresentaion(node)) : Value();
}

Value ext_node_from_string(const Value* arguments, size_t count, XQueryContext& context) {
  if (count < 1 || count > 2) return Value();
  const Value text = XQueryPromoteToString(arguments[0], context);
  uint32_t options = 0;
  if (count == 2) {
    const Value letters = XQueryPromoteToString(arguments[1], context);
    options = optionsForLetters(cast<NSString>(letters.get())->view());
  }
  return XQueryNodeFromString(*cast<NSString>(text.get()), options);
}

Value ext_xpath_for_node(const Value* arguments, size_t count, XQueryContext& context) {
  const NSXMLNode* node = onlyNode(arguments, count);
  return node ? XQueryCastAsTypeForContext(node->XPath(), XQueryTypeString, context) : Value();
}

}  // namespace xquery
