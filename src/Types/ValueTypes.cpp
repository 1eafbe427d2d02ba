// The types of items as hosts know them. Their numbers are the type identifiers, and 64 and the
// kind for nodes.
#include "Types/XQueryQName.h"
#include "Types/XQueryTypeTable.h"
#include "xquery/Values.h"
#include "xquery/XQuery.h"

namespace xquery {

namespace {

constexpr uint8_t firstNodeType = 64;

static_assert(static_cast<int>(XQueryItemType::UntypedAtomic) == XQueryTypeUntypedAtomic);
static_assert(static_cast<int>(XQueryItemType::DateTime) == XQueryTypeDateTime);
static_assert(static_cast<int>(XQueryItemType::Notation) == XQueryTypeNotation);
static_assert(static_cast<int>(XQueryItemType::DayTimeDuration) == XQueryTypeDayTimeDuration);
static_assert(static_cast<int>(XQueryItemType::NMTOKENS) == XQueryTypeNMTOKENS);
static_assert(static_cast<int>(XQueryItemType::UnsignedByte) == XQueryTypeUnsignedByte);
static_assert(static_cast<int>(XQueryItemType::Document) ==
              firstNodeType + static_cast<int>(Kind::Document));
static_assert(static_cast<int>(XQueryItemType::Text) ==
              firstNodeType + static_cast<int>(Kind::Text));

constexpr std::string_view nodeTypeNames[] = {
    "document-node()",          "element()", "attribute()", "namespace()",
    "processing-instruction()", "comment()", "text()",
};

}  // namespace

XQueryItemType XQueryTypeOfItem(const NSObject& item) {
  if (item.isNode()) {
    return static_cast<XQueryItemType>(firstNodeType + static_cast<uint8_t>(item.kind()));
  }
  const XQueryTypeID type = XQueryObjectTypeID(&item);
  return type >= XQueryTypeUntypedAtomic && type <= XQueryTypeUnsignedByte
             ? static_cast<XQueryItemType>(type)
             : XQueryItemType::None;
}

std::string XQueryNameOfType(XQueryItemType type) {
  if (XQueryIsNodeType(type)) {
    const size_t index = static_cast<size_t>(type) - static_cast<size_t>(XQueryItemType::Document);
    return index < std::size(nodeTypeNames) ? std::string(nodeTypeNames[index]) : "item()";
  }
  const Ref<XQueryQName> name = XQueryQNameForTypeID(static_cast<XQueryTypeID>(type));
  if (!name) return "item()";
  const Ref<XQueryQName> schemaName = XQueryQNameForTypeID(XQueryTypeAnyType);
  const bool inSchema = name->namespaceURI() == schemaName->namespaceURI();
  return (inSchema ? "xs:" : "xdt:") + name->localPart()->utf8();
}

std::optional<XQueryItemType> XQueryTypeNamed(std::string_view name) {
  for (XQueryTypeID id = XQueryTypeUntypedAtomic; id <= XQueryTypeUnsignedByte; ++id) {
    const auto type = static_cast<XQueryItemType>(id);
    if (XQueryNameOfType(type) == name) return type;
  }
  return std::nullopt;
}

std::string XQueryItemTypeName(const NSObject& item) {
  return XQueryNameOfType(XQueryTypeOfItem(item));
}

}  // namespace xquery
