#include "Plan/Joins/XQueryJoin.h"

#include "Context/KeptValues.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/XQuerySequence.h"
#include "Plan/Joins/XQueryIndexedItems.h"
#include "Plan/Joins/XQueryJoinPair.h"
#include "Plan/Operators/XQueryTentative.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/TreeHead.h"
#include "Types/XQueryAtomization.h"
#include "xquery/Number.h"
#include "xquery/XMLNode.h"

#include <algorithm>
#include <array>
#include <utility>
#include <vector>

namespace xquery {
namespace {

// Where it has to be known for every round.
bool isBrieflySettledAround(const Value& value) {
  constexpr size_t mostItems = 4096;
  return XQueryItemList(value.get()).count() <= mostItems && XQueryAreSettled({&value, 1}, true);
}

// Whether what is found outside the nodes is the same for the whole round, whatever is constructed
// meanwhile.
bool isInvariantInRound(const XQueryFacts& facts, XQueryContext& context) {
  const auto& dynamic = _internal(context);
  if (facts.does(XQueryDeeds::ReadsGlobals) || !facts.reads.isExact()) return false;
  const bool readsFocus = facts.does(XQueryDeeds::ReadsItem | XQueryDeeds::ReadsRoot);
  if (readsFocus && !isBrieflySettledAround(dynamic.contextItem())) return false;
  bool areSettled = true;
  facts.reads.forEach([&](int64_t varID) {
    areSettled = areSettled && isBrieflySettledAround(dynamic.variableForID(varID));
  });
  return areSettled;
}

enum class Truth : uint8_t { No, Yes, Failure };

// What the conditions, joined by "and", come to.
Truth truthOf(const std::vector<Ref<XQueryExpr>>& conditions, XQueryContext& context) {
  for (const auto& condition : conditions) {
    const Value value = XQueryValueOrNull(*condition, context);
    if (!value) return Truth::Failure;
    if (!XQueryIsTrue(XQueryEffectiveBooleanValue(value, context))) return Truth::No;
  }
  return Truth::Yes;
}

bool anyFails(const std::vector<Ref<XQueryExpr>>& exprs, XQueryContext& context) {
  return std::any_of(exprs.begin(), exprs.end(),
                     [&](const auto& expr) { return !XQueryValueOrNull(*expr, context); });
}

}  // namespace

// What a table is asked in this round.
struct XQueryJoin::Asked {
  XQueryJoinTable* table;
  XQueryJoinTable::Question question;
};

// The tables of one list of items, one for each term of the condition. That of the first term is
// made at once, those of others when it has picked as many items as making them takes.
class XQueryJoin::Tables final : public XQueryKeptValue {
 public:
  Tables(XQueryJoinTable::Items ofItems, size_t terms) : items(std::move(ofItems)), byTerm(terms) {}

  bool areAllTried() const { return next == byTerm.size(); }
  // Whether the tables that must answer do so for an item.
  bool answersFor(size_t position, const XQueryJoinCondition& condition) const {
    for (size_t term = 0; term < byTerm.size(); ++term) {
      const bool isAsked = condition.terms[term].mustAnswer && byTerm[term];
      if (isAsked && byTerm[term]->isIrregular(static_cast<uint32_t>(position))) return false;
    }
    return true;
  }

  // Whether no node comes up twice, which their order proves.
  bool holdsEachNodeOnce() {
    if (!_isAscending) {
      WorkPacer pacer;
      const auto breaksOrder = [&pacer](const Value& one, const Value& other) {
        pacer.turn();
        const auto* a = cast<NSXMLNode>(one.get());
        const auto* b = cast<NSXMLNode>(other.get());
        return !NSXMLNodeOrder::areComparable(a, b) ||
               NSXMLNodeOrder::number(*a) >= NSXMLNodeOrder::number(*b);
      };
      _isAscending = std::adjacent_find(items->begin(), items->end(), breaksOrder) == items->end();
    }
    return *_isAscending;
  }

  // What finds the items that meet both of two comparisons, if anything does; makes it when so many
  // items have been asked as that takes. The first of the two is then that of the rows.
  XQueryJoinPair* pairFor(std::vector<Asked>& asked) {
    if (asked.size() != 2) return nullptr;
    if (!XQueryJoinPair::isOfRows(*asked[0].table)) std::swap(asked[0], asked[1]);
    const Asked& first = asked[0];
    const Asked& second = asked[1];
    if (askedOfPicks >= items->size()) {
      askedOfPicks = 0;
      _pair = XQueryJoinPair::of(*first.table, first.question, *second.table, second.question);
      _areOfPair = {first.table, second.table};
    }
    const bool isPair = _pair && _areOfPair == std::array{first.table, second.table};
    return isPair && _pair->answersFor(first.question, second.question) ? _pair.get() : nullptr;
  }

  const XQueryJoinTable::Items items;
  std::shared_ptr<const XQueryIndexedItems> indexed;     // in place of the only table, or null
  std::vector<std::unique_ptr<XQueryJoinTable>> byTerm;  // null for one that is not there
  size_t next = 0;                                       // the one that is made next
  size_t picked = 0;                                     // items, since the last one was made
  size_t askedOfPicks = 0;  // how many items that one table picked another one was asked of

 private:
  std::optional<bool> _isAscending;  // none before it is asked
  std::unique_ptr<XQueryJoinPair> _pair;
  std::array<XQueryJoinTable*, 2> _areOfPair{};
};

std::unique_ptr<const XQueryJoin> XQueryJoin::ofClause(const XQueryExpr& owner, int64_t varID,
                                                       XQueryJoinCondition condition) {
  return std::unique_ptr<const XQueryJoin>(
      new XQueryJoin(owner, varID, std::move(condition), false));
}

std::unique_ptr<const XQueryJoin> XQueryJoin::ofStep(const XQueryExpr& owner,
                                                     XQueryJoinCondition condition,
                                                     bool looksAround) {
  return std::unique_ptr<const XQueryJoin>(
      new XQueryJoin(owner, 0, std::move(condition), looksAround));
}

bool XQueryJoin::pick(const Value& source, const Lister& listItems, XQueryContext& context,
                      XQueryPicks& picks) const {
  if (!source || _internal(context).showsErrors()) return false;
  if (_varID != 0 && XQueryItemList(source.get()).count() < XQueryJoinTable::fewestItems) {
    return false;
  }
  const auto found = tables(source, listItems, context);
  if (!found) return false;
  const bool areInvariant =
      std::all_of(_condition.outward.begin(), _condition.outward.end(),
                  [&](const XQueryFacts& facts) { return isInvariantInRound(facts, context); });
  if (!areInvariant || anyFails(_condition.needed, context)) return false;
  const Truth guards = truthOf(_condition.guards, context);
  if (guards == Truth::Failure) return false;
  if (guards == Truth::No && _condition.terms.front().relation.isComplement) return false;
  if (found->indexed && pickIndexed(*found, guards == Truth::Yes, context, picks)) return true;
  std::vector<Asked> asked;
  if (!askEach(*found, guards == Truth::Yes, context, asked)) return false;
  const bool areAll = asked.size() == _condition.terms.size();
  const bool areSure = areAll && _condition.isWhole;
  picks.items = found->items;
  if (areSure) picks.number = numberOf(*found, asked, picks.wantedNumber);
  if (!picks.number) select(*found, asked, areSure, picks);
  found->picked += picks.number.value_or(picks.chosen.size());
  if (!areAll && !found->areAllTried() && found->picked >= found->items->size()) {
    addTable(*found, context);
  }
  return true;
}

// The tables that are kept, or new ones when they are worth it; null for the plain way.
std::shared_ptr<XQueryJoin::Tables> XQueryJoin::tables(const Value& source, const Lister& listItems,
                                                       XQueryContext& context) const {
  auto& keptValues = _internal(context).keptValues();
  if (keptValues.looksAway(_owner)) return nullptr;
  std::shared_ptr<XQueryKeptValue> kept;
  switch (keptValues.use(_owner, {&source, 1}, _looksAroundSource, kept)) {
    case XQueryKeptValues::Use::First: {
      auto made = indexed(source, listItems, context);
      if (made) keptValues.keep(_owner, {&source, 1}, made);
      return made;
    }
    case XQueryKeptValues::Use::Second: {
      auto made = makeTables(listItems, context);
      keptValues.keep(_owner, {&source, 1}, made);
      return made;
    }
    case XQueryKeptValues::Use::Further:
      break;
  }
  return std::static_pointer_cast<Tables>(kept);
}

// The way by which the index of a tree may answer in place of a table; null for none. What has to
// be asked of items that are left out needs a table.
const XQueryValueWay* XQueryJoin::indexedWay() const {
  const XQueryJoinTerm& term = _condition.terms.front();
  const bool isAlone =
      _condition.terms.size() == 1 && _condition.checks.empty() && !_condition.filtersMayFail;
  return isAlone && term.way && !term.mustNotFail && !term.mustAnswer ? &*term.way : nullptr;
}

// What the index of the tree answers costs no table, so that it need not be known whether the items
// come again. Null where it does not.
std::shared_ptr<XQueryJoin::Tables> XQueryJoin::indexed(const Value& source,
                                                        const Lister& listItems,
                                                        XQueryContext& context) const {
  const XQueryValueWay* way = indexedWay();
  const XQueryItemList list(source.get());
  if (!way || list.count() < XQueryIndexedItems::fewestItems) return nullptr;
  if (!XQueryIndexedItems::mayAnswer(list[0], *way, context)) return nullptr;
  if (!XQueryAreSettled({&source, 1}, _looksAroundSource)) return nullptr;
  auto made = tablesOf(listItems);
  if (made) made->indexed = XQueryIndexedItems::of(made->items, *way, context);
  return made && made->indexed ? made : nullptr;
}

// Picks by the index; false where a table, or the plain way, has to answer.
bool XQueryJoin::pickIndexed(Tables& tables, bool withProbes, XQueryContext& context,
                             XQueryPicks& picks) const {
  const auto indexed = tables.indexed;
  const XQueryJoinTerm& term = _condition.terms.front();
  if (term.outward && !isInvariantInRound(*term.outward, context)) return false;
  const bool areSure = _condition.isWhole && _condition.filters.empty();
  std::vector<uint32_t> positions;
  if (withProbes) {
    const Value probe = XQueryValueOrNull(*term.probe, context);
    const XQueryItemList probes(probe.get());
    const bool isError = term.relation.isValueComparison && probes.count() > 1;
    const bool isFound =
        probe && !isError &&
        indexed->find(probes, picks.wantsFirst && areSure, positions, tables.picked);
    if (!isFound) return prepareTable(tables, context);
  }
  if (indexed->isWorthATable(tables.picked)) prepareTable(tables, context);
  picks.items = tables.items;
  if (areSure && picks.wantedNumber != XQueryPicks::Number::Unwanted) {
    picks.number = positions.size();
    return true;
  }
  picks.chosen.reserve(positions.size());
  for (const uint32_t position : positions) picks.chosen.push_back({position, areSure});
  return true;
}

// From now on a table answers in place of the index, if it can be made. Always false.
bool XQueryJoin::prepareTable(Tables& tables, XQueryContext& context) const {
  tables.indexed = nullptr;
  if (!tables.byTerm.front()) addTable(tables, context);
  return false;
}

std::shared_ptr<XQueryJoin::Tables> XQueryJoin::makeTables(const Lister& listItems,
                                                           XQueryContext& context) const {
  auto made = tablesOf(listItems);
  if (!made) return nullptr;
  if (const XQueryValueWay* way = indexedWay()) {
    made->indexed = XQueryIndexedItems::of(made->items, *way, context);
    if (made->indexed) return made;
    XQueryIndexedItems::noteAsked(*made->items, *way);
  }
  return addTable(*made, context) ? made : nullptr;
}

// Without any table yet; null for items that have none.
std::shared_ptr<XQueryJoin::Tables> XQueryJoin::tablesOf(const Lister& listItems) const {
  auto items = std::make_shared<std::vector<Value>>();
  if (!listItems(*items)) return nullptr;
  if (items->size() < XQueryJoinTable::fewestItems || items->size() > XQueryJoinTable::mostItems) {
    return nullptr;
  }
  // Of one of them alone somebody may have to know.
  const bool holdErrors = std::any_of(items->begin(), items->end(),
                                      [](const Value& item) { return isa<XQueryError>(item); });
  if (holdErrors) return nullptr;
  if (_condition.looksOutOfItems && !XQueryAreSettled(*items, true)) return nullptr;
  return std::make_shared<Tables>(std::move(items), _condition.terms.size());
}

// Makes the next table that can be made, if any.
bool XQueryJoin::addTable(Tables& tables, XQueryContext& context) const {
  const auto& items = *tables.items;
  const auto& terms = _condition.terms;
  tables.picked = 0;
  while (!tables.areAllTried()) {
    const size_t term = tables.next++;
    const bool looksOut = std::any_of(terms.begin(), terms.end(), [&](const XQueryJoinTerm& each) {
      return each.looksOutOfItems && (each.mustNotFail || &each == &terms[term]);
    });
    // Without a table that must answer there are none behind it.
    const size_t nextOfAll = tables.next;
    if (terms[term].mustAnswer) tables.next = terms.size();
    if (looksOut && !XQueryAreSettled(items, true)) continue;
    auto& dynamic = _internal(context);
    const Value item = dynamic.contextItem();
    const int64_t position = dynamic.position();
    auto made =
        std::make_unique<XQueryJoinTable>(terms[term].relation, tables.items, [&](size_t index) {
          if (!tables.answersFor(index, _condition)) return Value();
          return keyOf(items[index], index, term, context);
        });
    if (_varID == 0) dynamic.setContextItem(item, position);
    if (!made->isComplete()) continue;
    tables.next = nextOfAll;
    // Reading keys may have begun other rounds over the same items, some of which are being asked.
    if (!tables.byTerm[term]) tables.byTerm[term] = std::move(made);
    return true;
  }
  return false;
}

Value XQueryJoin::keyOf(const Value& item, size_t position, size_t term,
                        XQueryContext& context) const {
  auto& dynamic = _internal(context);
  if (_varID != 0) {
    dynamic.setVariable(item, _varID);
  } else {
    dynamic.setContextItem(item, static_cast<int64_t>(position) + 1);
  }
  if (anyFails(_condition.checks, context)) return {};
  Value key;
  for (const XQueryJoinTerm& each : _condition.terms) {
    if (!each.mustNotFail) continue;
    Value read = XQueryValueOrNull(*each.key, context);
    if (!read) return {};
    if (&each == &_condition.terms[term]) key = std::move(read);
  }
  switch (truthOf(_condition.filters, context)) {
    case Truth::Yes:
      return key ? key : XQueryValueOrNull(*_condition.terms[term].key, context);
    case Truth::No:  // as an item without a key, it meets nothing
      return Value(NSNull::null());
    default:
      return {};
  }
}

// Makes the questions for those tables that can be asked; false for the plain way. Without probes,
// which is how nothing is met, what may be an error has still to be asked: the guard that does not
// hold may stand behind it.
bool XQueryJoin::askEach(const Tables& tables, bool withProbes, XQueryContext& context,
                         std::vector<Asked>& asked) const {
  for (size_t index = 0; index < tables.byTerm.size(); ++index) {
    const XQueryJoinTerm& term = _condition.terms[index];
    XQueryJoinTable* table = tables.byTerm[index].get();
    if (!table && !term.mustNotFail) continue;
    if (term.outward && !isInvariantInRound(*term.outward, context)) {
      if (term.mustNotFail) return false;
      if (term.mustAnswer) break;
      continue;
    }
    static const Value nothing = NSNull::null();
    Value probe =
        withProbes || term.mustNotFail ? XQueryValueOrNull(*term.probe, context) : nothing;
    if (!probe && term.mustNotFail) return false;
    auto question = table ? table->questionOf(withProbes ? probe : nothing) : std::nullopt;
    const bool answers = question && table->isRegularFor(*question);
    if (question) asked.push_back({table, std::move(*question)});
    if (term.mustAnswer && !answers) break;
  }
  return !asked.empty();
}

// How many items a table or a pair picks, if that can be told without a list of them.
std::optional<uint64_t> XQueryJoin::numberOf(Tables& tables, std::vector<Asked>& asked,
                                             XQueryPicks::Number wanted) {
  using Number = XQueryPicks::Number;
  if (wanted == Number::Unwanted || asked.size() > 2) return std::nullopt;
  if (wanted == Number::OfNodes && !tables.holdsEachNodeOnce()) return std::nullopt;
  if (asked.size() == 1) return asked.front().table->numberFor(asked.front().question);
  XQueryJoinPair* pair = tables.pairFor(asked);
  return pair ? std::optional(pair->numberFor(asked[0].question, asked[1].question)) : std::nullopt;
}

// The table that the fewest items meet picks, and the others are asked of these.
void XQueryJoin::select(Tables& tables, std::vector<Asked>& asked, bool areSure,
                        XQueryPicks& picks) {
  const bool wantsFirst = picks.wantsFirst && areSure;
  if (XQueryJoinPair* pair = tables.pairFor(asked)) {
    return pair->select(asked[0].question, asked[1].question, areSure, wantsFirst, picks.chosen);
  }
  const auto isFewer = [](Asked& a, Asked& b) {
    return a.table->estimateFor(a.question) < b.table->estimateFor(b.question);
  };
  if (asked.size() > 1) {
    std::iter_swap(asked.begin(), std::min_element(asked.begin(), asked.end(), isFewer));
  }
  asked.front().table->select(asked.front().question, picks.chosen,
                              wantsFirst && asked.size() == 1);
  if (asked.size() == 1 && areSure) return;
  if (asked.size() > 1) tables.askedOfPicks += picks.chosen.size();
  WorkPacer pacer;
  size_t count = 0;
  for (const XQueryPick& pick : picks.chosen) {
    pacer.turn();
    bool isSure = pick.isSure;
    const bool isExcluded = std::any_of(asked.begin() + 1, asked.end(), [&](Asked& each) {
      const auto isMet = each.table->isMetBy(each.question, pick.position);
      isSure = isSure && isMet;
      return isMet == false;
    });
    if (isExcluded) continue;
    picks.chosen[count++] = {pick.position, isSure && areSure};
    if (wantsFirst && isSure) break;
  }
  picks.chosen.resize(count);
}

}  // namespace xquery
