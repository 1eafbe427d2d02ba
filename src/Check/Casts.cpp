// Casts whose answer is known: those of literals. Literals that are not what they look like.
//
// What a text can be cast to here is asked of the cast itself; what XQuery 1.0 makes of it follows
// from the lexical forms that it allows.
#include "Check/Checking.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/Constructors/XQueryElementContentString.h"
#include "Expr/TypeTests/XQueryTypeExprs.h"
#include "Expr/XQueryAsking.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQuerySequence.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Labels.h"
#include "Platform/Base/NSLog.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryTypeTable.h"
#include "xquery/Number.h"
#include "xquery/XQuery.h"

#include <algorithm>
#include <cctype>
#include <cmath>
#include <string>
#include <string_view>

namespace xquery {
namespace {

using ID = XQueryWarningID;
using namespace XQueryItems;

// --- lexical forms -------------------------------------------------------------------------------

bool isSpace(char c) {
  return c == ' ' || c == '\t' || c == '\n' || c == '\r';
}

std::string_view trimmed(std::string_view text) {
  while (!text.empty() && isSpace(text.front())) text.remove_prefix(1);
  while (!text.empty() && isSpace(text.back())) text.remove_suffix(1);
  return text;
}

size_t takeDigits(std::string_view& text) {
  size_t count = 0;
  while (count < text.size() && text[count] >= '0' && text[count] <= '9') ++count;
  text.remove_prefix(count);
  return count;
}

bool takeOne(std::string_view& text, std::string_view of) {
  if (text.empty() || of.find(text.front()) == of.npos) return false;
  text.remove_prefix(1);
  return true;
}

// Whether the whole text is a number as XQuery 1.0 reads it.
bool isNumber(std::string_view text, bool mayHaveFraction, bool mayHaveExponent) {
  text = trimmed(text);
  if (mayHaveExponent && (text == "INF" || text == "-INF" || text == "NaN")) return true;
  takeOne(text, "+-");
  size_t digits = takeDigits(text);
  if (mayHaveFraction && takeOne(text, ".")) digits += takeDigits(text);
  if (digits == 0) return false;
  if (mayHaveExponent && takeOne(text, "eE")) {
    takeOne(text, "+-");
    if (takeDigits(text) == 0) return false;
  }
  return text.empty();
}

bool isNumberOf(XQueryTypeID type, std::string_view text) {
  const bool isFloating = type == XQueryTypeDouble || type == XQueryTypeFloat;
  return isNumber(text, isFloating || type == XQueryTypeDecimal, isFloating);
}

// ".05": the digits behind the point begin with a zero and are not all zeros.
bool hasLateFraction(std::string_view text) {
  const size_t point = text.find(".0");
  if (point == text.npos) return false;
  text.remove_prefix(point + 1);
  return text.find_first_of("123456789") < text.find_first_not_of("0123456789");
}

bool isTimeType(XQueryTypeID type) {
  return type == XQueryTypeTime || type == XQueryTypeDateTime;
}

// What a date or time holds that XQuery 1.0 refuses.
bool isBeyondClock(XQueryTypeID type, std::string_view text) {
  const bool isDay = type == XQueryTypeDate || type == XQueryTypeDateTime;
  if (isDay && (text.starts_with("0000-") || text.starts_with("-0000-"))) return true;
  if (!isDay && !isTimeType(type)) return false;
  const size_t zone = text.size() > 6 ? text.size() - 6 : text.npos;
  const bool hasZone =
      zone != text.npos && (text[zone] == '+' || text[zone] == '-') && text[zone + 3] == ':';
  if (hasZone && text.substr(zone + 1) > "14:00") return true;
  const size_t time = text.find(':');
  return isTimeType(type) && time != text.npos && text.substr(time + 3).starts_with(":60");
}

bool isBeyond32Bits(XQueryTypeID type, double number) {
  constexpr double mostInt = 2147483647, mostUnsigned = 4294967295;
  if (type == XQueryTypeInt) return number > mostInt || number < -mostInt - 1;
  return type == XQueryTypeUnsignedInt && number > mostUnsigned;
}

bool isLanguage(std::string_view text) {
  return std::all_of(text.begin(), text.end(), [](char c) {
    return c == '-' || (c >= '0' && c <= '9') || (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z');
  });
}

// What XQuery 1.0 does not count among the digits of base 64.
bool isBase64(std::string_view text) {
  return std::all_of(text.begin(), text.end(), [](char c) {
    return isSpace(c) || std::isalnum(static_cast<unsigned char>(c)) || c == '+' || c == '/' ||
           c == '=';
  });
}

bool isHexadecimal(std::string_view text) {
  text = trimmed(text);
  return std::none_of(text.begin(), text.end(), isSpace);
}

// White space around it is dropped, and of tokens each run inside is one space.
std::string collapsed(std::string_view text) {
  std::string form;
  for (const char c : trimmed(text)) {
    if (!isSpace(c)) {
      form += c;
    } else if (form.back() != ' ') {
      form += ' ';
    }
  }
  return form;
}

// What is accepted here in the place of a text that XQuery 1.0 may accept as it is written.
std::string acceptedForm(XQueryTypeID type, std::string_view text) {
  constexpr std::string_view midnight = "24:00:00";
  std::string form = collapsed(text);
  if (type == XQueryTypeGMonth && form.size() >= 4 && form.substr(4, 2) != "--") {
    form.insert(4, "--");
  }
  if (type == XQueryTypeNMTOKEN) std::replace(form.begin(), form.end(), ':', '.');
  const size_t time = isTimeType(type) ? form.find(midnight) : form.npos;
  if (time != form.npos && (time == 0 || form[time - 1] == 'T')) form.replace(time, 2, "00");
  return form;
}

// --- casts ---------------------------------------------------------------------------------------

struct Cast {
  XQueryTypeID type = XQueryTypeNone;
  std::string label;
  XQueryPlaceID operand = XQueryNoPlace;
};

Cast castIn(const XQueryChecking& checking, XQueryPlaceID place) {
  Cast cast;
  if (const auto* typed = checking.as<XQueryTypedExpr>(place)) {
    cast = {typed->type().typeID(), XQueryLabelOf(typed->type()),
            checking.program.part(place, XQueryRole::Operand)};
    if (typed->type().occuranceType() != XQueryTypeDeclaration::ExactlyOne) cast.label.pop_back();
    return cast;
  }
  const auto* call = checking.as<XQueryFunctionCall>(place);
  const auto* builtIn = call->builtIn();
  if (!builtIn || checking.argumentCount(place) != 1) return cast;
  const auto& row = builtIn->row();
  if (row.namespaceID != XQueryNamespaceXS && row.namespaceID != XQueryNamespaceXDT) return cast;
  const auto name = XQueryQName::qname(NSString::stringWithASCII(row.localName),
                                       XQueryModules::builtinNamespaceForID(row.namespaceID));
  return {XQueryTypeIDForQName(*name), call->name()->utf8(), checking.argument(place, 0)};
}

// What a cast of a literal answers; null when it fails.
template <class Answer>
Value tried(Answer answer) {
  const auto context = XQueryContext::xqueryContext();
  const Value value = normalised(answer(*context));
  if (!XQueryHasFailed(value, *context)) return value;
  if (_internal(*context).isFailingForGood()) _internal(*context).throwFailure();
  _internal(*context).passOverFailure(nullptr);
  return {};
}

Value valueOf(const XQueryChecking& checking, XQueryPlaceID place) {
  return tried([&](XQueryContext& context) {
    return checking.at(place).expr->evaluateWithContext(context);
  });
}

// The text that a text becomes, cast to a type where the expression stands; empty when it cannot be
// cast.
std::string castText(const XQueryExpr& expr, const std::string& text, XQueryTypeID type) {
  const Value value = tried([&](XQueryContext& context) {
    return XQueryAsk(expr, context, [&] {
      return XQueryCastObject(NSString::stringWithUTF8Replacing(text), type, context, false);
    });
  });
  return value ? XQueryItemStringValue(*value) : std::string();
}

bool isNumericType(XQueryTypeID type) {
  return type != XQueryTypeNone && XQueryIsNumericTypeID(type);
}

bool isAcceptedHereAlone(const Cast& cast, const NSObject& literal) {
  if (const auto* number = dyn_cast<NSNumber>(&literal)) {
    const double value = number->doubleValue();
    const bool isCutToZero = cast.type == XQueryTypePositiveInteger && value > 0 && value < 1;
    return isCutToZero || isBeyond32Bits(cast.type, value);
  }
  const auto* text = dyn_cast<NSString>(&literal);
  if (!text) return false;
  const std::string written = text->utf8();
  if (cast.type == XQueryTypeNotation) return true;
  if (cast.type == XQueryTypeHexBinary) return !isHexadecimal(written);
  if (cast.type == XQueryTypeLanguage) return !isLanguage(written);
  if (cast.type == XQueryTypeBase64Binary) return !isBase64(written);
  if (isNumericType(cast.type)) {
    return written.size() < 300 && isNumber(written, false, false) &&
           isBeyond32Bits(cast.type, std::strtod(written.c_str(), nullptr));
  }
  return isBeyondClock(cast.type, written);
}

std::string shown(const XQueryChecking& checking, const Cast& cast) {
  return checking.labelOf(cast.operand);
}

// Of a text that is no number: the number at its front is read.
bool checkNumber(XQueryChecking& checking, XQueryPlaceID place, const Cast& cast,
                 const NSObject* literal) {
  const auto* text = dyn_cast<NSString>(literal);
  if (!text || !isNumericType(cast.type) || isNumberOf(cast.type, text->utf8())) return false;
  checking.warn(place, ID::NumberFromFront, {shown(checking, cast)});
  return true;
}

void checkName(XQueryChecking& checking, XQueryPlaceID place, const Cast& cast,
               const NSObject& literal) {
  const auto* name = dyn_cast<NSString>(&literal);
  if (!name || !checking.hasUnknownPrefix(*name, place)) return;
  checking.warn(place, ID::CastFails, {shown(checking, cast), cast.label});
}

// --- how values are written ----------------------------------------------------------------------

// A general duration in the form that XQuery 1.0 gives it: the months and the rest as the two
// ordered durations write them. Empty where that cannot be told.
std::string formOfDuration(const XQueryExpr& expr, std::string_view text) {
  const bool isNegative = text.starts_with('-');
  if (isNegative) text.remove_prefix(1);
  if (!text.starts_with('P')) return {};
  const std::string_view date = text.substr(0, text.find('T'));
  const size_t last = date.find_last_of("YM");
  const size_t end = last == date.npos ? 1 : last + 1;
  std::string form;
  const auto add = [&](const std::string& part, XQueryTypeID type, std::string_view nothing) {
    const std::string written = part == "P" ? std::string(nothing) : castText(expr, part, type);
    if (written != nothing) form += written.substr(std::min<size_t>(written.size(), 1));
  };
  add(std::string(text.substr(0, end)), XQueryTypeYearMonthDuration, "P0M");
  add("P" + std::string(text.substr(end)), XQueryTypeDayTimeDuration, "PT0S");
  if (form.empty()) return "PT0S";
  return (isNegative ? "-P" : "P") + form;
}

// Of a fraction of seconds all six digits are written.
std::string formOfTime(std::string form) {
  const size_t point = form.find('.');
  if (point == form.npos) return form;
  const size_t end = std::min(form.find_first_not_of("0123456789", point + 1), form.size());
  const size_t kept = form.find_last_not_of('0', end - 1) + 1;
  return form.erase(kept, end - kept);
}

// Where the value is compared, calculated with or taken apart, nobody sees how it is written.
bool mayBeWritten(const XQueryChecking& checking, XQueryPlaceID place) {
  for (int level = 0; level < XQueryChecking::mostLevels; ++level) {
    const XQueryPlace& at = checking.at(place);
    if (at.parent == XQueryNoPlace) return true;
    if (at.role == XQueryRole::Argument) {
      const std::string_view name = checking.functionCalledIn(checking.at(at.parent).parent);
      return name == "string" || name == "concat" || name == "data";
    }
    if (checking.program.withoutParentheses(at.parent) != place) {
      return checking.at(at.parent).expr->kind() != Kind::OperatorExpr;
    }
    place = at.parent;
  }
  return false;
}

void checkForm(XQueryChecking& checking, XQueryPlaceID place, const Cast& cast,
               const NSString& text, const std::string& written) {
  std::string form = written;
  if (cast.type == XQueryTypeDuration) form = formOfDuration(*checking.at(place).expr, text.utf8());
  if (isTimeType(cast.type)) form = formOfTime(written);
  if (form.empty() || form == written || !mayBeWritten(checking, place)) return;
  checking.warn(place, ID::WrittenOtherwise, {shown(checking, cast), written, form});
}

bool isPlain(const NSObject& literal) {
  return literal.kind() == Kind::Null || isa<NSString>(&literal) || isa<NSNumber>(&literal);
}

void checkLiteralCast(XQueryChecking& checking, XQueryPlaceID place, const Cast& cast,
                      const NSObject& literal) {
  if (cast.type == XQueryTypeQName) return checkName(checking, place, cast, literal);
  // Diagnostics show each error as it is made.
  if (XQueryLogEnabled() || !isPlain(literal)) return;
  const Value value = valueOf(checking, place);
  if (!value) {
    checking.warn(place, ID::CastFails, {shown(checking, cast), cast.label});
    return;
  }
  if (checkNumber(checking, place, cast, &literal)) return;
  if (isAcceptedHereAlone(cast, literal)) {
    checking.warn(place, ID::CastAccepts, {shown(checking, cast), cast.label});
  }
  const auto* text = dyn_cast<NSString>(&literal);
  const bool isDuration = cast.type == XQueryTypeDuration || cast.type == XQueryTypeDayTimeDuration;
  if (text && isDuration && hasLateFraction(text->utf8())) {
    checking.warn(place, ID::DurationFraction,
                  {shown(checking, cast), XQueryItemStringValue(*value)});
  } else if (text) {
    checkForm(checking, place, cast, *text, XQueryItemStringValue(*value));
  }
}

// Whether XQuery 1.0 accepts a text that is refused here.
bool isAcceptedElsewhere(const XQueryExpr& expr, XQueryTypeID type, const std::string& text) {
  if (type == XQueryTypeAnyURI) return true;
  if (isNumericType(type)) return isNumberOf(type, text);
  const std::string form = acceptedForm(type, text);
  return form != text && !castText(expr, form, type).empty();
}

void checkLiteralCastable(XQueryChecking& checking, XQueryPlaceID place, const Cast& cast,
                          const NSObject& literal) {
  if (cast.type == XQueryTypeQName || XQueryLogEnabled() || !isPlain(literal)) return;
  const Value answer = valueOf(checking, place);
  if (!answer) return;
  const auto* text = dyn_cast<NSString>(&literal);
  if (!XQueryIsTrue(answer)) {
    if (!text || !isAcceptedElsewhere(*checking.at(place).expr, cast.type, text->utf8())) return;
    checking.warn(place, ID::CastableRefused, {shown(checking, cast), cast.label});
  } else if (!checkNumber(checking, place, cast, &literal) && isAcceptedHereAlone(cast, literal)) {
    checking.warn(place, ID::CastAccepts, {shown(checking, cast), cast.label});
  }
}

// A QName becomes no token; in XQuery 1.0 its text does.
void checkCastOfName(XQueryChecking& checking, XQueryPlaceID place, const Cast& cast) {
  const XQueryFacts& facts = checking.factsOf(cast.operand);
  const bool isToken =
      cast.type != XQueryTypeString && XQueryIsKindOfType(cast.type, XQueryTypeString);
  if (!isToken || facts.most == 0 || !facts.are(QName)) return;
  checking.warn(place, ID::CastFails, {"a QName", cast.label});
}

void checkCastable(XQueryChecking& checking, XQueryPlaceID place, const Cast& cast) {
  const XQueryFacts& facts = checking.factsOf(cast.operand);
  if (facts.least > 1) {
    checking.warn(place, ID::CastableOfSeveral);
    return;
  }
  if (const NSObject* literal = checking.literalIn(cast.operand)) {
    checkLiteralCastable(checking, place, cast, *literal);
  } else if (isNumericType(cast.type) && facts.most > 0 && facts.mayBe(Node | Untyped | String)) {
    checking.warn(place, ID::CastableNumber, {cast.label});
  }
}

}  // namespace

void XQueryCheckCast(XQueryChecking& checking, XQueryPlaceID place) {
  const Cast cast = castIn(checking, place);
  if (cast.type == XQueryTypeNone || cast.operand == XQueryNoPlace) return;
  if (checking.at(place).expr->kind() == Kind::CastableExpr) {
    checkCastable(checking, place, cast);
  } else if (const NSObject* literal = checking.literalIn(cast.operand)) {
    checkLiteralCast(checking, place, cast, *literal);
  } else {
    checkCastOfName(checking, place, cast);
  }
}

// --- literals ------------------------------------------------------------------------------------

namespace {

// Half of a character alone, which is what is left of one beyond U+FFFF.
bool hasLoneHalf(NSStringView text) {
  for (uint32_t i = 0; i < text.length(); ++i) {
    if ((text[i] & 0xF800) != 0xD800) continue;
    const bool isPair =
        (text[i] & 0xFC00) == 0xD800 && i + 1 < text.length() && (text[i + 1] & 0xFC00) == 0xDC00;
    if (!isPair) return true;
    ++i;
  }
  return false;
}

void checkText(XQueryChecking& checking, XQueryPlaceID place, NSStringView text) {
  // No other way leads to U+0000.
  if (text.find(u'\0') != NSStringView::notFound) {
    checking.warn(place, ID::LostCharacter, {"write it itself, in a string"});
  } else if (hasLoneHalf(text)) {
    checking.warn(place, ID::LostCharacter, {"write it in a string in braces"});
  }
}

}  // namespace

void XQueryCheckLiteral(XQueryChecking& checking, XQueryPlaceID place) {
  const NSObject* value = checking.as<XQueryLiteral>(place)->literalValue().get();
  if (const auto* text = dyn_cast<NSString>(value)) {
    checkText(checking, place, text->view());
  } else if (const auto* run = dyn_cast<XQueryElementContentString>(value)) {
    checkText(checking, place, run->view());
  } else if (const auto* number = dyn_cast<NSNumber>(value)) {
    const bool isDouble = XQueryObjectTypeID(value) == XQueryTypeDouble;
    if (isDouble && std::isinf(number->doubleValue())) checking.warn(place, ID::LiteralTooLarge);
  }
}

}  // namespace xquery
