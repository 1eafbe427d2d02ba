#include "Plan/Report.h"

#include "Expr/XQueryLists.h"
#include "Plan/Labels.h"
#include "Plan/Planning.h"
#include "Plan/Projection/XQueryProjectionPlan.h"
#include "Plan/Rules.h"
#include "Platform/Base/WorkMeter.h"
#include "Prolog/XQueryDeclarations.h"
#include "Prolog/XQueryProlog.h"
#include "Types/XQueryQName.h"
#include "xquery/URL.h"

#include <algorithm>
#include <utility>

namespace xquery {
namespace {

// The URL of an imported module that the place lies in; empty for the main one.
std::string moduleOf(const XQueryProgram& program, XQueryPlaceID place, const XQueryProlog& main) {
  const XQueryProlog* prolog = program.bodyOf(place).prolog;
  const bool isImported = prolog && prolog != &main && prolog->moduleURL();
  return isImported ? prolog->moduleURL()->absoluteString()->utf8() : std::string();
}

// Lists what is worth a line of its own: not the tests and types, which the labels tell, nor the
// lists of arguments and the parentheses around one expression, unless there is a note on them.
class Listing {
 public:
  Listing(const XQueryPlanning& planning, const XQueryProlog& main,
          std::vector<XQueryPlanNote> notes)
      : _planning(planning),
        _program(planning.program),
        _main(main),
        _notes(std::move(notes)),
        _depths(_program.placeCount()),
        _lines(_program.placeCount()),
        _roles(_program.placeCount()) {
    std::stable_sort(_notes.begin(), _notes.end(),
                     [](const auto& a, const auto& b) { return a.place < b.place; });
  }

  std::vector<XQueryPlanReport::Entry> entries() {
    WorkPacer pacer;
    auto body = _program.bodies().begin();
    for (XQueryPlaceID place = 0; place < _program.placeCount(); ++place) {
      pacer.turn();
      while (body != _program.bodies().end() && body->place == place) addBody(*body++);
      add(place);
    }
    return std::move(_entries);
  }

 private:
  void addBody(const XQueryProgramBody& body) {
    if (!body.expr) return;
    _module = moduleOf(_program, body.place, _main);
    std::string label = "query";
    if (body.function) {
      label = "function " + nameOf(*body.function->name(), *body.prolog) + "#" +
              std::to_string(body.function->params().size());
    } else if (body.variable) {
      label = "variable $" + nameOf(*body.variable->name(), *body.prolog);
    }
    const XQueryFacts& facts = _planning.facts[body.place];
    _entries.push_back(
        {0, {}, std::move(label), 0, _module, XQueryLabelOfItems(facts), {}, {}, body.place, true});
  }

  // With a prefix that the module has for the namespace; the one that was written is not known any
  // more.
  static std::string nameOf(const XQueryQName& name, const XQueryProlog& prolog) {
    const std::string local = name.localPart()->utf8();
    const auto& space = name.namespaceURI();
    if (!space || space->length() == 0) return local;
    const Value known = prolog.prefixesForID(prolog.namespaceID(space));
    const auto* several = dyn_cast<NSArray>(known);
    const auto* prefix = several && several->count() ? cast<NSString>(several->objectAtIndex(0))
                                                     : dyn_cast<NSString>(known);
    const bool isKnown = prefix && prefix->length() > 0;
    return (isKnown ? prefix->utf8() + ":" : "{" + space->utf8() + "}") + local;
  }

  void add(XQueryPlaceID place) {
    const XQueryPlace& at = _program[place];
    const bool isBody = at.parent == XQueryNoPlace;
    _depths[place] = isBody ? 0 : _depths[at.parent];
    // "." is one expression for all places, without a line.
    const int64_t before = isBody ? 0 : _lines[at.parent];
    _lines[place] = std::max(before, at.expr->exprLine() + 1);
    _roles[place] = XQueryLabelOf(at.role);
    if (_roles[place].empty() && !isBody) _roles[place] = std::exchange(_roles[at.parent], {});
    std::vector<XQueryPlanReport::Note> notes = notesOn(place);
    if (notes.empty() && isPassedOver(place)) return;
    ++_depths[place];
    const XQueryFacts& facts = _planning.facts[place];
    _entries.push_back({_depths[place], std::exchange(_roles[place], {}), XQueryLabelOf(*at.expr),
                        _lines[place], _module, XQueryLabelOfItems(facts),
                        XQueryLabelsOfDeeds(facts.deeds), std::move(notes), place, false});
  }

  bool isPassedOver(XQueryPlaceID place) const {
    const XQueryPlace& at = _program[place];
    if (XQueryTraitsOf(at.role).isNoValue || at.role == XQueryRole::Arguments) return true;
    // The label of a path shows a literal position and begins with what it starts from.
    if (at.role == XQueryRole::Predicate && !at.slot) return true;
    const Kind kind = at.expr->kind();
    if (at.role == XQueryRole::Name && kind == Kind::QNameReference) return true;
    if (at.role == XQueryRole::FirstStep) {
      return kind == Kind::RootStepExpr || kind == Kind::Variable || kind == Kind::ContextItemExpr;
    }
    const auto* list = dyn_cast<XQueryExprList>(at.expr);
    return list && list->count() == 1;
  }

  std::vector<XQueryPlanReport::Note> notesOn(XQueryPlaceID place) {
    std::vector<XQueryPlanReport::Note> found;
    for (; _next < _notes.size() && _notes[_next].place == place; ++_next) {
      const XQueryPlanNote& note = _notes[_next];
      found.push_back({note.rule->name, note.text, note.isRefusal});
    }
    return found;
  }

  const XQueryPlanning& _planning;
  const XQueryProgram& _program;
  const XQueryProlog& _main;
  std::string _module;                 // of the body at hand
  std::vector<XQueryPlanNote> _notes;  // by place, those of one place in the order of the rules
  size_t _next = 0;
  std::vector<size_t> _depths;  // of places; of what is passed over that of its whole
  std::vector<int64_t> _lines;
  // Of places; empty once an entry has it. What is passed over leaves its own to what is inside.
  std::vector<std::string_view> _roles;
  std::vector<XQueryPlanReport::Entry> _entries;
};

std::string joined(const std::vector<std::string_view>& words) {
  std::string text;
  for (const std::string_view word : words) {
    if (!text.empty()) text += ", ";
    text += word;
  }
  return text;
}

// --- JSON ----------------------------------------------------------------------------------------

// RFC 8259, section 7.
std::string quoted(std::string_view text) {
  constexpr std::string_view digits = "0123456789abcdef";
  std::string result = "\"";
  for (const char each : text) {
    const auto byte = static_cast<unsigned char>(each);
    if (byte < 0x20) {
      result += "\\u00";
      result += digits[byte >> 4];
      result += digits[byte & 15];
      continue;
    }
    if (each == '"' || each == '\\') result += '\\';
    result += each;
  }
  return result + "\"";
}

std::string JSONOf(const XQueryPlanReport::Note& note) {
  return "{\"rule\":" + quoted(note.rule) + ",\"refused\":" + (note.isRefusal ? "true" : "false") +
         ",\"reason\":" + quoted(note.text) + "}";
}

// Of an entry what comes before its parts.
std::string JSONOf(const XQueryPlanReport::Entry& entry) {
  std::string text = "{\"label\":" + quoted(entry.label);
  if (entry.line) text += ",\"line\":" + std::to_string(entry.line);
  if (!entry.module.empty()) text += ",\"module\":" + quoted(entry.module);
  if (!entry.role.empty()) text += ",\"role\":" + quoted(entry.role);
  text += ",\"items\":" + quoted(entry.items) + ",\"deeds\":[";
  for (size_t i = 0; i < entry.deeds.size(); ++i) text += (i ? "," : "") + quoted(entry.deeds[i]);
  text += "],\"notes\":[";
  for (size_t i = 0; i < entry.notes.size(); ++i) text += (i ? "," : "") + JSONOf(entry.notes[i]);
  return text + "],\"parts\":[";
}

// In a label of DOT quotes and backslashes are written with a backslash, "\l" ends a line.
std::string labelLine(std::string_view text) {
  std::string result;
  for (const char each : text) {
    if (each == '"' || each == '\\') result += '\\';
    result += each == '\n' ? ' ' : each;
  }
  return result + "\\l";
}

}  // namespace

XQueryPlanReport::XQueryPlanReport(const XQueryPlanning& planning, const XQueryProlog& main,
                                   std::vector<XQueryPlanNote> notes)
    : _entries(Listing(planning, main, std::move(notes)).entries()) {}

void XQueryPlanReport::addInput(const XQueryPlanning& planning, const XQueryProlog& main,
                                const XQueryProjectionPlan& projection) {
  constexpr std::string_view rule = "projection";
  if (!projection.isPossible()) {
    const XQueryExpr& expr = *planning.program[projection.refusedAt].expr;
    _entries.push_back({0,
                        {},
                        "input",
                        expr.exprLine() + 1,
                        moduleOf(planning.program, projection.refusedAt, main),
                        "all of it, for " + XQueryLabelOf(expr),
                        {},
                        {{rule, projection.reason, true}}});
  } else if (projection.isUsed) {
    std::string paths = projection.projection.description();
    if (paths.empty()) paths = "the document element";
    _entries.push_back({0, {}, "input", 0, {}, std::move(paths), {}, {}});
  }
}

std::string XQueryPlanReport::text() const {
  // A query may nest as deep as memory goes.
  constexpr size_t mostIndents = 64;
  std::string text;
  WorkPacer pacer;
  for (const Entry& entry : _entries) {
    pacer.turn();
    const std::string indent(2 * std::min(entry.depth, mostIndents), ' ');
    text += indent;
    if (!entry.role.empty()) text += std::string(entry.role) + ": ";
    text += entry.label;
    if (entry.line) {
      text += "  (line " + std::to_string(entry.line);
      text += (entry.module.empty() ? "" : " of " + entry.module) + ")";
    }
    text += "  " + entry.items;
    if (!entry.deeds.empty()) text += "; " + joined(entry.deeds);
    text += "\n";
    for (const Note& note : entry.notes) {
      text += indent + (note.isRefusal ? "  - not " : "  + ") + std::string(note.rule) + ": " +
              std::string(note.text) + "\n";
    }
  }
  return text;
}

std::string XQueryPlanReport::JSON() const {
  std::string text = "[";
  WorkPacer pacer;
  for (size_t i = 0; i < _entries.size(); ++i) {
    pacer.turn();
    if (i && _entries[i - 1].depth >= _entries[i].depth) text += ",";
    text += "\n" + JSONOf(_entries[i]);
    const size_t next = i + 1 < _entries.size() ? _entries[i + 1].depth : 0;
    for (size_t depth = _entries[i].depth + 1; depth > next; --depth) text += "]}";
  }
  return text + "]\n";
}

std::string XQueryPlanReport::DOT() const {
  std::string text = "digraph plan {\n  node [shape=box, fontname=\"monospace\", style=filled,";
  text += " fillcolor=white];\n";
  std::vector<size_t> above;  // the entries around the present one
  WorkPacer pacer;
  for (size_t i = 0; i < _entries.size(); ++i) {
    pacer.turn();
    const Entry& entry = _entries[i];
    above.resize(entry.depth);
    std::string label =
        labelLine((entry.role.empty() ? "" : std::string(entry.role) + ": ") + entry.label);
    label += labelLine(entry.items);
    bool isChanged = false;
    for (const Note& note : entry.notes) {
      isChanged = isChanged || !note.isRefusal;
      label += labelLine(std::string(note.isRefusal ? "- not " : "+ ") + std::string(note.rule) +
                         ": " + std::string(note.text));
    }
    text += "  n" + std::to_string(i) + " [label=\"" + label + "\"";
    text += isChanged ? ", fillcolor=lightblue];\n" : "];\n";
    if (entry.depth) {
      text += "  n" + std::to_string(above.back()) + " -> n" + std::to_string(i) + ";\n";
    }
    above.push_back(i);
  }
  return text + "}\n";
}

}  // namespace xquery
