// A profile as text: a line for each expression, with columns for its numbers, indented as the
// query nests, and below it what the rules of the plan did with it.
#include "Plan/Profile/ProfileNumbers.h"
#include "Plan/Profile/ProfileWriters.h"
#include "Platform/Base/WorkMeter.h"

#include <algorithm>
#include <array>
#include <utility>
#include <vector>

namespace xquery {
namespace {

constexpr size_t columns = 5;
using Row = std::array<std::string, columns>;

constexpr std::array<std::string_view, columns> heads = {"total ms", "own ms", "own %", "calls",
                                                         "items"};

std::string counted(uint64_t count, const char* one, const char* several) {
  return std::to_string(count) + " " + (count == 1 ? one : several);
}

class Writer {
 public:
  Writer(const XQueryProfileData& profile, const XQueryProfileSurroundings& surroundings)
      : _profile(profile), _surroundings(surroundings) {}

  std::string text() {
    addHead();
    addTable();
    if (_hasInside) {
      _text += "\n~  never evaluated by itself; an operator around it may do its work\n";
    }
    return std::move(_text);
  }

 private:
  void addHead() {
    const XQueryProfileCounts& counts = _profile.counts;
    if (!_surroundings.name.empty()) _text += XQueryVisibleText(_surroundings.name) + ": ";
    _text += counted(counts.evaluations(), "evaluation", "evaluations");
    if (_surroundings.inputs) _text += " for " + counted(*_surroundings.inputs, "input", "inputs");
    if (_surroundings.failures.value_or(0) > 0) {
      _text += ", " + std::to_string(*_surroundings.failures) + " failed";
    }
    _text += "\n";
    for (const auto& [name, time] : XQueryProfilePhases(_profile, _surroundings)) {
      _text += std::string(name) + " " + XQueryMilliseconds(time, 3) + " ms";
      _text += name == "planning" ? " of it, " : ", ";
    }
    _text.erase(_text.size() - 2);
    if (_surroundings.memoryPeak) {
      _text += "; at most " + std::to_string((*_surroundings.memoryPeak >> 20) + 1) + " MiB";
    }
    _text += "\n\n";
  }

  Row rowOf(const XQueryProfiledExpression& expression) {
    if (expression.counter == XQueryNoCounter) return {};
    const XQueryProfileCounter& counter = _profile.counts.counters()[expression.counter];
    if (counter.calls == 0) {
      _hasInside = _hasInside || expression.mayBeInside;
      return {"", "", "", expression.mayBeInside ? "~" : "0", ""};
    }
    return {XQueryMilliseconds(counter.total, 3), XQueryMilliseconds(counter.own, 3),
            XQueryPercent(counter.own, _profile.counts.nanoseconds()),
            std::to_string(counter.calls), std::to_string(counter.items)};
  }

  void addTable() {
    std::vector<Row> rows;
    std::array<size_t, columns> widths{};
    for (size_t i = 0; i < columns; ++i) widths[i] = heads[i].size();
    for (const XQueryProfiledExpression& expression : _profile.program->expressions) {
      rows.push_back(rowOf(expression));
      for (size_t i = 0; i < columns; ++i) widths[i] = std::max(widths[i], rows.back()[i].size());
    }
    Row head;
    for (size_t i = 0; i < columns; ++i) head[i] = heads[i];
    addRow(head, widths);
    _text += "expression\n";
    size_t left = 0;
    for (const size_t width : widths) left += width + 2;
    WorkPacer pacer;
    for (size_t i = 0; i < rows.size(); ++i) {
      pacer.turn();
      addRow(rows[i], widths);
      addExpression(_profile.program->expressions[i], left);
    }
  }

  void addRow(const Row& row, const std::array<size_t, columns>& widths) {
    for (size_t i = 0; i < columns; ++i) {
      _text += std::string(widths[i] - row[i].size(), ' ') + row[i] + "  ";
    }
  }

  void addExpression(const XQueryProfiledExpression& expression, size_t left) {
    // A query may nest as deep as memory goes.
    constexpr size_t mostIndents = 64;
    const std::string indent(2 * std::min(expression.depth, mostIndents), ' ');
    _text += indent;
    if (!expression.role.empty()) {
      _text += XQueryVisibleText(expression.role) + (expression.label.empty() ? "" : ": ");
    }
    _text += XQueryVisibleText(expression.label);
    if (expression.place.line > 0) {
      _text += "  (line " + std::to_string(expression.place.line);
      const std::string& module = expression.place.module;
      _text += module.empty() ? ")" : " of " + XQueryVisibleText(module) + ")";
    }
    addPeculiarities(expression);
    _text += "\n";
    for (const XQueryPlanReport::Note& note : expression.notes) {
      _text += std::string(left, ' ') + indent + (note.isRefusal ? "  - not " : "  + ") +
               std::string(note.rule) + ": " + std::string(note.text) + "\n";
    }
  }

  void addPeculiarities(const XQueryProfiledExpression& expression) {
    if (expression.counter == XQueryNoCounter) return;
    const XQueryProfileCounter& counter = _profile.counts.counters()[expression.counter];
    if (counter.failures) _text += "  " + std::to_string(counter.failures) + " failed";
    if (counter.recursions && expression.depth == 0) {
      _text += "  " + counted(counter.recursions, "call", "calls") + " within itself, " +
               std::to_string(counter.deepest) + " deep";
    }
  }

  const XQueryProfileData& _profile;
  const XQueryProfileSurroundings& _surroundings;
  std::string _text;
  bool _hasInside = false;
};

}  // namespace

std::string XQueryProfileText(const XQueryProfileData& profile,
                              const XQueryProfileSurroundings& surroundings) {
  return Writer(profile, surroundings).text();
}

}  // namespace xquery
