// Content that does not arrive where it was put.
#include "Check/Checking.h"
#include "Expr/Constructors/XQueryElementContentString.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQueryLists.h"
#include "Platform/Base/WorkMeter.h"
#include "Prolog/XQueryProlog.h"

#include <algorithm>
#include <vector>

namespace xquery {
namespace {

using ID = XQueryWarningID;
using namespace XQueryItems;

// What stands in the content of a constructor one behind the other: the parts, and those of lists.
std::vector<XQueryPlaceID> contentOf(const XQueryChecking& checking, XQueryPlaceID whole) {
  std::vector<XQueryPlaceID> content;
  std::vector<XQueryPlaceID> waiting;
  const auto addParts = [&](XQueryPlaceID of) {
    const size_t start = waiting.size();
    for (XQueryPlaceID part = checking.program.firstPart(of); part != XQueryNoPlace;
         part = checking.program.nextPart(part)) {
      const XQueryRole role = checking.at(part).role;
      if (role == XQueryRole::Content || role == XQueryRole::Element) waiting.push_back(part);
    }
    std::reverse(waiting.begin() + static_cast<ptrdiff_t>(start), waiting.end());
  };
  addParts(whole);
  while (!waiting.empty()) {
    checkWork();
    const XQueryPlaceID place = waiting.back();
    waiting.pop_back();
    if (checking.at(place).expr->kind() == Kind::ExprList) {
      addParts(place);
    } else {
      content.push_back(place);
    }
  }
  return content;
}

// A list is no expression of a constructor's own, so that a list of lists is looked at once.
bool isContent(const XQueryChecking& checking, XQueryPlaceID place) {
  const Kind kind = checking.at(place).expr->kind();
  if (kind == Kind::AttributeExpr || kind == Kind::NamespaceExpr) return false;
  if (const auto* literal = checking.as<XQueryLiteral>(place)) {
    const NSObject* value = literal->literalValue().get();
    const bool keepsSpace = checking.program.bodyOf(place).prolog->xmlSpacePreserve();
    if (const auto* run = dyn_cast<XQueryElementContentString>(value)) {
      return keepsSpace || !run->isXMLSpace();
    }
    return value && value->kind() != Kind::Null;
  }
  const XQueryFacts& facts = checking.factsOf(place);
  return facts.least > 0 && facts.most > 0 && !facts.mayBe(Attribute | Namespace | Other);
}

}  // namespace

void XQueryCheckElement(XQueryChecking& checking, XQueryPlaceID place) {
  bool hasContent = false;
  for (const XQueryPlaceID part : contentOf(checking, place)) {
    const XQueryFacts& facts = checking.factsOf(part);
    const Kind kind = checking.at(part).expr->kind();
    const bool isOwn = kind == Kind::AttributeExpr || kind == Kind::NamespaceExpr;
    if (!isOwn && hasContent && facts.most > 0 && facts.are(Attribute)) {
      checking.warn(part, ID::LateAttribute);
    }
    hasContent = hasContent || isContent(checking, part);
  }
}

void XQueryCheckDocument(XQueryChecking& checking, XQueryPlaceID place) {
  size_t elements = 0;
  for (const XQueryPlaceID part : contentOf(checking, place)) {
    const XQueryFacts& facts = checking.factsOf(part);
    if (facts.most > 0 && facts.are(Element)) elements += facts.least;
  }
  if (elements > 1) checking.warn(place, ID::DocumentElements);
}

}  // namespace xquery
