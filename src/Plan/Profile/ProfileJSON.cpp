// A profile as JSON; docs/profile.md tells its shape.
#include "Plan/Profile/ProfileNumbers.h"
#include "Plan/Profile/ProfileWriters.h"
#include "Platform/Base/WorkMeter.h"

#include <vector>

namespace xquery {
namespace {

std::string milliseconds(int64_t nanoseconds) {
  return XQueryMilliseconds(nanoseconds, 6);
}

std::string numberMember(const char* name, uint64_t number) {
  return ",\"" + std::string(name) + "\":" + std::to_string(number);
}

std::string textMember(const char* name, std::string_view text) {
  return ",\"" + std::string(name) + "\":" + XQueryProfileJSONString(text);
}

std::string ofHead(const XQueryProfileData& profile,
                   const XQueryProfileSurroundings& surroundings) {
  std::string json = "{\"evaluations\":" + std::to_string(profile.counts.evaluations());
  if (!surroundings.name.empty()) json += textMember("name", surroundings.name);
  if (surroundings.inputs) json += numberMember("inputs", *surroundings.inputs);
  if (surroundings.failures) json += numberMember("failures", *surroundings.failures);
  if (surroundings.memoryPeak) json += numberMember("memoryPeak", *surroundings.memoryPeak);
  json += ",\"milliseconds\":{";
  bool isFirst = true;
  for (const auto& [name, time] : XQueryProfilePhases(profile, surroundings)) {
    json += (isFirst ? "\"" : ",\"") + std::string(name) + "\":" + milliseconds(time);
    isFirst = false;
  }
  return json + "}" + textMember("text", profile.program->source);
}

std::string ofCounter(const XQueryProfiledExpression& expression,
                      const XQueryProfileCounter& counter) {
  std::string json = numberMember("calls", counter.calls);
  if (counter.calls == 0 && expression.mayBeInside) json += ",\"inside\":true";
  json += numberMember("items", counter.items);
  json += numberMember("failures", counter.failures);
  json += ",\"total\":" + milliseconds(counter.total) + ",\"own\":" + milliseconds(counter.own);
  if (counter.recursions) {
    json += numberMember("recursions", counter.recursions);
    json += numberMember("deepest", counter.deepest);
  }
  return json;
}

std::string ofExpression(const XQueryProfiledExpression& expression,
                         const XQueryProfileCounts& counts) {
  std::string json = "{\"depth\":" + std::to_string(expression.depth);
  if (!expression.role.empty()) json += textMember("role", expression.role);
  json += textMember("label", expression.label);
  if (!expression.place.module.empty()) json += textMember("module", expression.place.module);
  if (expression.place.line > 0) {
    json += numberMember("line", static_cast<uint64_t>(expression.place.line));
  }
  if (expression.place.column > 0) {
    json += numberMember("column", static_cast<uint64_t>(expression.place.column));
    json += numberMember("length", static_cast<uint64_t>(expression.place.length));
  }
  json += ",\"notes\":[";
  for (size_t i = 0; i < expression.notes.size(); ++i) {
    const XQueryPlanReport::Note& note = expression.notes[i];
    json += (i ? ",{\"rule\":" : "{\"rule\":") + XQueryProfileJSONString(note.rule) +
            ",\"refused\":" + (note.isRefusal ? "true" : "false") +
            textMember("reason", note.text) + "}";
  }
  json += "]";
  if (expression.counter != XQueryNoCounter) {
    json += ofCounter(expression, counts.counters()[expression.counter]);
  }
  return json + "}";
}

std::string ofNode(const XQueryProfileNode& node, int64_t total,
                   const XQueryProfiledProgram& program) {
  std::string json;
  if (node.counter != XQueryNoCounter) {
    json += "{\"expression\":" + std::to_string(program.counted[node.counter]) +
            numberMember("parent", node.parent) + numberMember("calls", node.calls);
    json += numberMember("items", node.items);
  } else {
    json += "{\"calls\":" + std::to_string(node.calls);
  }
  if (node.folded) json += numberMember("folded", node.folded);
  return json + ",\"total\":" + milliseconds(total) + ",\"own\":" + milliseconds(node.own) + "}";
}

}  // namespace

std::string XQueryProfileJSON(const XQueryProfileData& profile,
                              const XQueryProfileSurroundings& surroundings) {
  WorkPacer pacer;
  std::string json = ofHead(profile, surroundings) + ",\n\"expressions\":[";
  const char* separator = "\n";
  for (const XQueryProfiledExpression& expression : profile.program->expressions) {
    pacer.turn();
    json += separator + ofExpression(expression, profile.counts);
    separator = ",\n";
  }
  json += "],\n\"calls\":[";
  const std::vector<int64_t> totals = XQueryProfileTotals(profile.counts);
  for (size_t i = 0; i < totals.size(); ++i) {
    pacer.turn();
    json += (i ? ",\n" : "\n") + ofNode(profile.counts.nodes()[i], totals[i], *profile.program);
  }
  return json + "]}\n";
}

}  // namespace xquery
