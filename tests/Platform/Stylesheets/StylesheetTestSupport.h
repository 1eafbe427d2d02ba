// Stylesheets in few words, and what becomes of documents under them.
#pragma once

#include "Platform/Stylesheets/Stylesheet.h"
#include "xquery/Error.h"
#include "xquery/Loading.h"
#include "xquery/XMLNode.h"

#include <gtest/gtest.h>

#include <string>
#include <string_view>

namespace xquery {

// Of those top-level elements.
inline std::string stylesheet(std::string_view content, std::string_view attributes = "") {
  return "<xsl:stylesheet version='1.0' xmlns:xsl='http://www.w3.org/1999/XSL/Transform' " +
         std::string(attributes) + ">" + std::string(content) + "</xsl:stylesheet>";
}

// Of one template for the root.
inline std::string root(std::string_view content, std::string_view attributes = "") {
  return stylesheet("<xsl:template match='/'>" + std::string(content) + "</xsl:template>",
                    attributes);
}

// Calls itself twice on each of that many levels, after writing `content`: work and output that
// double with each.
inline std::string doubling(int levels, std::string_view content = "") {
  const std::string call =
      "<xsl:call-template name='t'><xsl:with-param name='n' select='$n - 1'/></xsl:call-template>";
  return stylesheet("<xsl:template match='/'><r><xsl:call-template name='t'/></r></xsl:template>"
                    "<xsl:template name='t'><xsl:param name='n' select='" +
                    std::to_string(levels) + "'/>" + std::string(content) + "<xsl:if test='$n'>" +
                    call + call + "</xsl:if></xsl:template>");
}

namespace stylesheettest {

inline const std::string copyOf = root("<xsl:copy-of select='.'/>");

inline Ref<NSXMLDocument> document(std::string_view xml) {
  const auto parsed = NSXMLDocument::documentWithData(xml, NSXMLNodePreserveWhitespace);
  EXPECT_TRUE(parsed) << xml.substr(0, 200);
  return parsed;
}

// The result as XML, "text " and the text, or "(none: why)".
inline std::string shown(const Value& result, const Ref<NSError>& error) {
  if (!result) return "(none: " + error->userInfo()->errorMessage->utf8() + ")";
  EXPECT_FALSE(error);
  if (const auto* text = dyn_cast<NSString>(result.get())) return "text " + text->utf8();
  EXPECT_EQ(result->kind(), Kind::Document);
  std::string text;
  for (const NSXMLNode* child = cast<NSXMLNode>(result.get())->firstChild(); child;
       child = child->nextSibling()) {
    child->appendXMLTo(text);
  }
  return text;
}

inline std::string applied(const NSXMLDocument& document, std::string_view style,
                           const XQueryLoading& loading = {},
                           const NSXMLDocument::XSLTArguments& arguments = {}) {
  Ref<NSError> error;
  const Value result = document.objectByApplyingXSLTString(NSString::stringWithUTF8(style),
                                                           arguments, loading, &error);
  return shown(result, error);
}
inline std::string applied(std::string_view xml, std::string_view style,
                           const XQueryLoading& loading = {},
                           const NSXMLDocument::XSLTArguments& arguments = {}) {
  return applied(*document(xml), style, loading, arguments);
}

inline bool fails(const std::string& shown) {
  return shown.starts_with("(none: ");
}

}  // namespace stylesheettest

}  // namespace xquery
