#include "ItemWriter.h"

#include <string_view>

namespace cli {
namespace {

using namespace xquery;

void writeData(std::string_view bytes, ResultPart& result) {
  static constexpr char digits[] = "0123456789ABCDEF";
  for (const char byte : bytes) {
    const auto value = static_cast<unsigned char>(byte);
    const char pair[] = {digits[value >> 4], digits[value & 15]};
    result.append({pair, 2});
  }
}

void writeItem(const NSObject& item, bool types, ResultPart& result) {
  if (types) {
    result.append(XQueryItemTypeName(item));
    result.append("\t");
  }
  if (item.isNode()) {
    cast<NSXMLNode>(&item)->writeXML(
        [&result](std::string_view xml) { return result.append(xml); });
  } else if (isa<NSData>(&item)) {
    writeData(cast<NSData>(&item)->bytes(), result);
  } else {
    result.append(XQueryItemStringValue(item));
  }
  result.append("\n");
}

}  // namespace

Framing framing(const Options&) {
  return {};
}

void writeItems(const Options& options, const std::string& inputName, const NSArray& items,
                ResultPart& result) {
  for (size_t i = 0; i < items.count() && !result.isStopped(); i++) {
    result.beginItem();
    if (options.withName) {
      result.append(inputName);
      result.append("\t");
    }
    writeItem(*items.objectAtIndex(i), options.types, result);
  }
}

}  // namespace cli
