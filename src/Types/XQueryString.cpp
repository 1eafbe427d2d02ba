#include "Types/XQueryString.h"

#include "Platform/Base/WorkMeter.h"
#include "Types/NameCharacters.h"

namespace xquery {

namespace {

bool allIn(const XQueryCharSet& set, NSStringView text, uint32_t from) {
  WorkPacer pacer;
  for (uint32_t index = from; index < text.length(); ++index) {
    pacer.turn();
    if (!set.contains(text[index])) return false;
  }
  return true;
}

bool isNameOf(const XQueryCharSet& first, const XQueryCharSet& rest, NSStringView text) {
  return !text.isEmpty() && first.contains(text[0]) && allIn(rest, text, 1);
}

Ref<XQueryString> typedString(bool accepted, const NSString& text, XQueryTypeID type) {
  return accepted ? make<XQueryString>(text, type) : nullptr;
}

}  // namespace

bool XQueryString::isNormalizedString(NSStringView text) {
  WorkPacer pacer;
  for (uint32_t index = 0; index < text.length(); ++index) {
    pacer.turn();
    const char16_t unit = text[index];
    if (unit == u'\n' || unit == u'\r' || unit == u'\t') return false;
  }
  return true;
}

bool XQueryString::isToken(NSStringView text) {
  if (!isNormalizedString(text)) return false;
  bool afterSpace = true;  // a space may not come first
  WorkPacer pacer;
  for (uint32_t index = 0; index < text.length(); ++index) {
    pacer.turn();
    const bool space = text[index] == u' ';
    if (space && afterSpace) return false;
    afterSpace = space;
  }
  return text.isEmpty() || !afterSpace;
}

// No pattern is checked: any token is a language.
bool XQueryString::isLanguage(NSStringView text) {
  return isToken(text);
}

bool XQueryString::isName(NSStringView text) {
  return isNameOf(XQueryNameFirstCharSet, XQueryNameCharSet, text);
}

bool XQueryString::isNCName(NSStringView text) {
  return isNameOf(XQueryNCNameFirstCharSet, XQueryNCNameCharSet, text);
}

bool XQueryString::isID(NSStringView text) {
  return isNCName(text);
}
bool XQueryString::isIDRef(NSStringView text) {
  return isNCName(text);
}
bool XQueryString::isEntity(NSStringView text) {
  return isNCName(text);
}

// A name token takes no colon here.
bool XQueryString::isNMToken(NSStringView text) {
  return !text.isEmpty() && allIn(XQueryNCNameCharSet, text, 0);
}

Ref<XQueryString> XQueryString::stringWithString(const NSString& text) {
  return make<XQueryString>(text, XQueryTypeString);
}

Ref<XQueryString> XQueryString::stringWithView(NSStringView text) {
  return make<XQueryString>(text, XQueryTypeString);
}

Ref<XQueryString> XQueryString::normalizedStringWithString(const NSString& text) {
  return typedString(isNormalizedString(text.view()), text, XQueryTypeNormalizedString);
}

Ref<XQueryString> XQueryString::tokenWithString(const NSString& text) {
  return typedString(isToken(text.view()), text, XQueryTypeToken);
}

Ref<XQueryString> XQueryString::languageWithString(const NSString& text) {
  return typedString(isLanguage(text.view()), text, XQueryTypeLanguage);
}

Ref<XQueryString> XQueryString::nameWithString(const NSString& text) {
  return typedString(isName(text.view()), text, XQueryTypeName);
}

Ref<XQueryString> XQueryString::ncNameWithString(const NSString& text) {
  return typedString(isNCName(text.view()), text, XQueryTypeNCName);
}

Ref<XQueryString> XQueryString::idWithString(const NSString& text) {
  return typedString(isID(text.view()), text, XQueryTypeXSID);
}

Ref<XQueryString> XQueryString::idRefWithString(const NSString& text) {
  return typedString(isIDRef(text.view()), text, XQueryTypeIDREF);
}

Ref<XQueryString> XQueryString::entityWithString(const NSString& text) {
  return typedString(isEntity(text.view()), text, XQueryTypeENTITY);
}

Ref<XQueryString> XQueryString::nmTokenWithString(const NSString& text) {
  return typedString(isNMToken(text.view()), text, XQueryTypeNMTOKEN);
}

Ref<XQueryString> XQueryString::stringOfType(XQueryTypeID type, const NSString& text) {
  struct Row {
    XQueryTypeID type;
    Ref<XQueryString> (*factory)(const NSString&);
  };
  static constexpr Row rows[] = {
      {XQueryTypeString, stringWithString},
      {XQueryTypeNormalizedString, normalizedStringWithString},
      {XQueryTypeToken, tokenWithString},
      {XQueryTypeLanguage, languageWithString},
      {XQueryTypeName, nameWithString},
      {XQueryTypeNCName, ncNameWithString},
      {XQueryTypeXSID, idWithString},
      {XQueryTypeIDREF, idRefWithString},
      {XQueryTypeENTITY, entityWithString},
      {XQueryTypeNMTOKEN, nmTokenWithString},
  };
  for (const Row& row : rows) {
    if (row.type == type) return row.factory(text);
  }
  return nullptr;
}

}  // namespace xquery
