// Where an error arose, as a text to compare: "at 1:5+2 called local:f 3:1+9 called ...".
#pragma once

#include "xquery/xquery.h"

#include <optional>
#include <string>

namespace xquery {

inline std::string placeText(const std::optional<XQuerySourcePlace>& place) {
  if (!place) return "nowhere";
  return (place->moduleURL ? place->moduleURL->utf8() + " " : "") + std::to_string(place->line) +
         ":" + std::to_string(place->column) + "+" + std::to_string(place->length);
}

inline std::string placeText(const XQueryError& error) {
  std::string text = "at " + placeText(error.place());
  for (const XQueryErrorCall& call : error.calls()) {
    text += " called " + call.function->utf8() + " " + placeText(call.place);
  }
  if (error.callsLeftOut() > 0) text += " without " + std::to_string(error.callsLeftOut());
  return text;
}

}  // namespace xquery
