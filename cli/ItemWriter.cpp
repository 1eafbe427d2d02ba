#include "ItemWriter.h"

#include <string_view>

namespace cli {
namespace {

using namespace xquery;

void writeData(std::string_view bytes, Output& output) {
  static constexpr char digits[] = "0123456789ABCDEF";
  for (const char byte : bytes) {
    const auto value = static_cast<unsigned char>(byte);
    const char pair[] = {digits[value >> 4], digits[value & 15]};
    output.append({pair, 2});
  }
}

void writeItem(const NSObject& item, bool types, Output& output) {
  if (types) {
    output.append(XQueryItemTypeName(item));
    output.append("\t");
  }
  if (item.isNode()) {
    cast<NSXMLNode>(&item)->writeXML(
        [&output](std::string_view xml) { return output.append(xml); });
  } else if (isa<NSData>(&item)) {
    writeData(cast<NSData>(&item)->bytes(), output);
  } else {
    output.append(XQueryItemStringValue(item));
  }
  output.append("\n");
}

}  // namespace

void writeItems(const Options& options, const NSArray& items, Output& output) {
  for (size_t i = 0; i < items.count() && output.error().empty(); i++) {
    writeItem(*items.objectAtIndex(i), options.types, output);
  }
}

}  // namespace cli
