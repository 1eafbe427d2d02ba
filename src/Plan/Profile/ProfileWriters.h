// A profile as people and programs read it.
#pragma once

#include "Context/ProfileRecorder.h"
#include "Plan/Profile/XQueryProfiledProgram.h"
#include "xquery/Profile.h"

#include <memory>
#include <string>
#include <string_view>

namespace xquery {

struct XQueryProfileData {
  std::shared_ptr<const XQueryProfiledProgram> program;  // null: the query was not profiled
  XQueryProfileCounts counts;
};

std::string XQueryProfileText(const XQueryProfileData& profile,
                              const XQueryProfileSurroundings& surroundings);
std::string XQueryProfileJSON(const XQueryProfileData& profile,
                              const XQueryProfileSurroundings& surroundings);
std::string XQueryProfilePage(const XQueryProfileData& profile,
                              const XQueryProfileSurroundings& surroundings);

// The text with its control characters and those that turn the direction of text written as
// "\u001B"; bytes that are no UTF-8 become U+FFFD.
std::string XQueryVisibleText(std::string_view text);
// In quotes. Besides what JSON asks for, the same characters and those that mean something in HTML
// are escaped, so that it may stand in a script element.
std::string XQueryProfileJSONString(std::string_view text);
// Visible text with the characters replaced that mean something in HTML.
std::string XQueryEscapedHTML(std::string_view visible);

}  // namespace xquery
