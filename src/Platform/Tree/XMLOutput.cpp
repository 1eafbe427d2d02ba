#include "Platform/Tree/XMLOutput.h"

namespace xquery {

namespace {

constexpr std::string_view replacement = "\xEF\xBF\xBD";

constexpr XMLEscapes illegalReplaced() {
  XMLEscapes table{};
  for (size_t unit = 0; unit < ' '; ++unit) {
    if (unit != '\t' && unit != '\n' && unit != '\r') table[unit] = replacement.data();
  }
  return table;
}

constexpr XMLEscapes markupEscapes() {
  XMLEscapes table = illegalReplaced();
  table['&'] = "&amp;";
  table['<'] = "&lt;";
  table['\r'] = "&#xD;";
  return table;
}

constexpr XMLEscapes textEscapes() {
  XMLEscapes table = markupEscapes();
  table['>'] = "&gt;";
  return table;
}

constexpr XMLEscapes attributeEscapes() {
  XMLEscapes table = markupEscapes();
  table['"'] = "&quot;";
  table['\t'] = "&#x9;";
  table['\n'] = "&#xA;";
  return table;
}

// A section cannot refer to characters: it is closed for a carriage return.
constexpr XMLEscapes CDATAEscapes() {
  XMLEscapes table = illegalReplaced();
  table['\r'] = "]]>&#xD;<![CDATA[";
  return table;
}

void writeNarrow(XMLOutput& out, std::string_view text, const XMLEscapes& escapes) {
  inBlocks(text, [&](std::string_view block) {
    size_t start = 0;
    for (size_t at = 0; at < block.size(); ++at) {
      const char* escape = escapes[static_cast<unsigned char>(block[at])];
      if (!escape) continue;
      out.write(block.substr(start, at - start));
      out.write(std::string_view(escape));
      start = at + 1;
    }
    out.write(block.substr(start));
  });
}

// Runs without anything to replace are converted as a whole; so are surrogate pairs within them.
void writeWide(XMLOutput& out, NSStringView text, const XMLEscapes& escapes) {
  constexpr uint32_t runLength = 8192;
  uint32_t start = 0;
  const auto writeRun = [&](uint32_t end) { out.write(text.substring(start, end - start)); };
  for (uint32_t at = 0; at < text.length(); ++at) {
    const char16_t unit = text.wideUnits()[at];
    const char* escape = unit < 0x80      ? escapes[unit]
                         : unit >= 0xFFFE ? replacement.data()
                                          : nullptr;
    if (escape) {
      writeRun(at);
      out.write(std::string_view(escape));
      start = at + 1;
    } else if (at - start >= runLength && (unit < 0xDC00 || unit >= 0xE000)) {
      writeRun(at);  // not between the halves of a pair
      start = at;
      checkWork();
    }
  }
  writeRun(text.length());
}

}  // namespace

constinit const XMLEscapes XMLPlainEscapes = illegalReplaced();
constinit const XMLEscapes XMLTextEscapes = textEscapes();
constinit const XMLEscapes XMLAttributeEscapes = attributeEscapes();
constinit const XMLEscapes XMLCDATAEscapes = CDATAEscapes();

void XMLWriteEscaped(XMLOutput& out, NSStringView text, const XMLEscapes& escapes) {
  if (text.isWide()) {
    writeWide(out, text, escapes);
  } else {
    writeNarrow(out, {text.asciiUnits(), text.length()}, escapes);
  }
}

void XMLWriteSeparated(XMLOutput& out, NSStringView text, std::string_view separated, uint32_t keep,
                       std::string_view between, const XMLEscapes& escapes) {
  uint32_t start = 0;
  while (true) {
    const uint32_t found = text.find(NSStringView::ascii(separated), start);
    if (found == NSStringView::notFound) break;
    XMLWriteEscaped(out, text.substring(start, found + keep - start), escapes);
    out.write(between);
    start = found + keep;
  }
  XMLWriteEscaped(out, text.substring(start), escapes);
}

}  // namespace xquery
