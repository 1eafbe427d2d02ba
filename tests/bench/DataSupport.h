// What the tests of the generated data have in common.
#pragma once

#include "xquery/xquery.h"

#include <algorithm>
#include <cstdint>
#include <iterator>
#include <map>
#include <set>
#include <string>
#include <vector>

namespace datatest {

inline uint64_t fingerprint(const std::string& text) {
  uint64_t hash = 0xCBF29CE484222325U;
  for (const char c : text) hash = (hash ^ static_cast<unsigned char>(c)) * 0x100000001B3U;
  return hash;
}

inline xquery::Ref<xquery::NSXMLDocument> parsed(const std::string& xml) {
  return xquery::NSXMLDocument::documentWithData(xml, xquery::NSXMLNodeOptionsNone);
}

// By the names as written.
inline std::map<std::string, size_t> elementCounts(const xquery::NSXMLDocument& document) {
  std::map<std::string, size_t> counts;
  for (const xquery::NSXMLNode* node = &document; node; node = node->nextNode()) {
    if (xquery::isa<xquery::NSXMLElement>(node)) counts[node->nameView().utf8()]++;
  }
  return counts;
}

// The values of the attributes with one of the names.
inline std::set<std::string> attributeValues(const xquery::NSXMLDocument& document,
                                             const std::set<std::string>& names) {
  std::set<std::string> values;
  for (const xquery::NSXMLNode* node = &document; node; node = node->nextNode()) {
    const auto* element =
        xquery::dyn_cast<xquery::NSXMLElement>(static_cast<const xquery::NSObject*>(node));
    if (!element) continue;
    for (const xquery::NSXMLNode* attribute = element->firstAttribute(); attribute;
         attribute = xquery::NSXMLElement::nextAttribute(attribute)) {
      if (names.count(attribute->nameView().utf8()) == 0) continue;
      values.insert(attribute->textView().utf8());
    }
  }
  return values;
}

// The string values of the elements with one of the names.
inline std::set<std::string> elementValues(const xquery::NSXMLDocument& document,
                                           const std::set<std::string>& names) {
  std::set<std::string> values;
  for (const xquery::NSXMLNode* node = &document; node; node = node->nextNode()) {
    if (!xquery::isa<xquery::NSXMLElement>(node)) continue;
    if (names.count(node->nameView().utf8()) > 0) values.insert(node->stringValue()->utf8());
  }
  return values;
}

inline std::vector<std::string> unresolved(const std::set<std::string>& references,
                                           const std::set<std::string>& targets) {
  std::vector<std::string> missing;
  std::set_difference(references.begin(), references.end(), targets.begin(), targets.end(),
                      std::back_inserter(missing));
  return missing;
}

}  // namespace datatest
