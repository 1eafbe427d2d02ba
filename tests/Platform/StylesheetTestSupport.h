// Stylesheets in few words.
#pragma once

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
  return stylesheet(
      "<xsl:template match='/'><r><xsl:call-template name='t'/></r></xsl:template>"
      "<xsl:template name='t'><xsl:param name='n' select='" +
      std::to_string(levels) + "'/>" + std::string(content) + "<xsl:if test='$n'>" + call + call +
      "</xsl:if></xsl:template>");
}

}  // namespace xquery
