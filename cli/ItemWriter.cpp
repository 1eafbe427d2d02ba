#include "ItemWriter.h"

#include "HTMLWriter.h"
#include "JSON.h"
#include "Messages.h"

#include <algorithm>
#include <iterator>
#include <string_view>

namespace cli {
namespace {

using namespace xquery;

// An item that is no node, as text.
std::string valueOf(const NSObject& item) {
  if (!isa<NSData>(&item)) return XQueryItemStringValue(item);
  static constexpr char digits[] = "0123456789ABCDEF";
  std::string text;
  for (const char byte : cast<NSData>(&item)->bytes()) {
    const auto value = static_cast<unsigned char>(byte);
    text += digits[value >> 4];
    text += digits[value & 15];
  }
  return text;
}

// XML has no place for most control characters.
bool isPlainText(const std::string& name) {
  const bool hasControls = std::any_of(name.begin(), name.end(), [](char byte) {
    return (byte >= 0 && byte < 0x20 && byte != '\t' && byte != '\n') || byte == 0x7F;
  });
  return !hasControls && NSString::stringWithUTF8(name);
}

// Numbers and booleans are those of JSON, but for what it has none for, such as NaN.
std::string jsonValue(const std::string& type, const std::string& value) {
  static constexpr std::string_view numbers[] = {"xs:integer", "xs:decimal", "xs:double",
                                                 "xs:float"};
  const bool isNumber =
      std::find(std::begin(numbers), std::end(numbers), type) != std::end(numbers);
  if ((isNumber && isJSONNumber(value)) || type == "xs:boolean") return value;
  return jsonString(value);
}

}  // namespace

Framing framing(const Options& options) {
  switch (options.format) {
    case Format::XML:
      return {"<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<results>\n", "", "</results>\n"};
    case Format::JSON:
      return {"[", ",\n", "]\n"};
    default:
      return options.separator ? Framing{"", *options.separator, ""} : Framing{};
  }
}

void ItemWriter::write(const NSArray& items) {
  for (size_t i = 0; i < items.count() && !_result.isStopped(); i++) {
    write(*items.objectAtIndex(i));
  }
}

void ItemWriter::write(const NSObject& item) {
  _result.beginItem();
  writeItem(item);
}

void ItemWriter::writeItem(const NSObject& item) {
  switch (_options.format) {
    case Format::XML:
      return writeXMLItem(item);
    case Format::JSON:
      return writeJSONItem(item);
    default:
      return writeLine(item);
  }
}

std::string ItemWriter::documentedInputName() const {
  if (isPlainText(_inputName)) return _inputName;
  const Ref<NSURL> URL = NSURL::fileURLWithPath(_inputName);
  return URL ? URL->absoluteString()->utf8() : visibleName(_inputName);
}

// --- lines ---------------------------------------------------------------------------------------

void ItemWriter::writeLine(const NSObject& item) {
  if (_options.withName) _result.append(_inputName + "\t");
  if (_options.types) _result.append(XQueryItemTypeName(item) + "\t");
  writeValue(item);
  if (!_options.separator) _result.append("\n");
}

void ItemWriter::writeValue(const NSObject& item) {
  if (_options.format == Format::Text) {
    _result.append(valueOf(item));
  } else if (item.isNode() && _options.format == Format::HTML) {
    writeHTML(*cast<NSXMLNode>(&item), _result);
  } else if (item.isNode()) {
    writeXML(*cast<NSXMLNode>(&item));
  } else if (_options.format == Format::HTML) {
    const Ref<NSString> text = NSString::stringWithUTF8(valueOf(item));
    writeXML(*NSXMLNode::textWithStringValue(text->view()));
  } else {
    _result.append(valueOf(item));
  }
}

void ItemWriter::writeXML(const NSXMLNode& node) {
  const auto write = [this](std::string_view xml) { return _result.append(xml); };
  if (_options.indent) {
    XQueryWriteIndentedXML(node, write);
  } else {
    node.writeXML(write);
  }
}

// --- one XML document ----------------------------------------------------------------------------

void ItemWriter::writeAttribute(const char* name, const std::string& value) {
  const Ref<NSString> text = NSString::stringWithUTF8(value);
  _result.append(" ");
  writeXML(*NSXMLNode::attributeWithName(NSStringView::ascii(name), text->view(), {}));
}

// An element for each item. Attributes and what else has no place in content are written as text,
// with their name.
void ItemWriter::writeXMLItem(const NSObject& item) {
  _result.append("<item");
  writeAttribute("type", XQueryItemTypeName(item));
  if (_options.withName) writeAttribute("input", documentedInputName());
  const auto* node = item.isNode() ? cast<NSXMLNode>(&item) : nullptr;
  const bool isProperty =
      node && (node->kind() == Kind::Attribute || node->kind() == Kind::Namespace);
  if (isProperty) writeAttribute("name", node->nameView().utf8());
  _result.append(">");
  if (node && node->kind() == Kind::Document) {
    for (const NSXMLNode* child = node->firstChild(); child; child = child->nextSibling()) {
      writeXML(*child);
    }
  } else if (node && !isProperty) {
    writeXML(*node);
  } else {
    const Ref<NSString> text = NSString::stringWithUTF8(valueOf(item));
    writeXML(*NSXMLNode::textWithStringValue(text->view()));
  }
  _result.append("</item>\n");
}

// --- JSON ----------------------------------------------------------------------------------------

void ItemWriter::writeJSONItem(const NSObject& item) {
  const std::string type = XQueryItemTypeName(item);
  _result.append("{\"type\":" + jsonString(type));
  if (_options.withName) _result.append(",\"input\":" + jsonString(documentedInputName()));
  _result.append(",\"value\":" + jsonValue(type, valueOf(item)));
  if (item.isNode()) {
    const auto* node = cast<NSXMLNode>(&item);
    if (node->hasName()) _result.append(",\"name\":" + jsonString(node->nameView().utf8()));
    if (!node->URIView().isEmpty()) {
      _result.append(",\"namespace\":" + jsonString(node->URIView().utf8()));
    }
    // Of a stream nobody knows what was beside the node.
    if (!_options.stream) _result.append(",\"place\":" + jsonString(_places.place(*node)));
    if (node->kind() == Kind::Element || node->kind() == Kind::Document) {
      std::string xml;
      const auto gather = [&xml](std::string_view piece) {
        xml += piece;
        return true;
      };
      _options.indent ? XQueryWriteIndentedXML(*node, gather) : node->writeXML(gather);
      _result.append(",\"xml\":" + jsonString(xml));
    }
  }
  _result.append("}");
}

}  // namespace cli
