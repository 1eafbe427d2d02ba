// A plan to be looked at: the expressions of a program as they were written, what is known of each,
// and what the rules did with it or did not do, and why.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace xquery {

class XQueryPlanning;
class XQueryProlog;
struct XQueryPlanNote;
struct XQueryProjectionPlan;

class XQueryPlanReport {
 public:
  struct Note {
    std::string_view rule;  // its name
    std::string_view text;
    bool isRefusal;
  };
  struct Entry {
    size_t depth;           // 0 for the body of a query or a function, or the value of a variable
    std::string_view role;  // in its whole, where the label of that does not tell; or empty
    std::string label;
    int64_t line;        // from 1; 0 where it is not known
    std::string module;  // the URL of the imported one that it is in; empty for the main one
    std::string items;
    std::vector<std::string_view> deeds;
    std::vector<Note> notes;  // in the order of the rules
    uint32_t place = 0;       // in the program
    bool isBody = false;      // the body as a whole, which has a line of its own before its place
  };

  XQueryPlanReport() = default;
  // The rules have been applied.
  XQueryPlanReport(const XQueryPlanning& planning, const XQueryProlog& main,
                   std::vector<XQueryPlanNote> notes);
  // The last entry: what is read of the document, if anything looks at it.
  void addInput(const XQueryPlanning& planning, const XQueryProlog& main,
                const XQueryProjectionPlan& projection);

  // Wholes before their parts; last, what is read of the document, if anything looks at it.
  const std::vector<Entry>& entries() const { return _entries; }

  // UTF-8. One line for each entry, indented by its depth, and below it "+" with what was done and
  // "-" with what was refused.
  std::string text() const;
  // An array of objects with label, line, module, role, items, deeds, notes and parts, which are
  // objects of the same shape.
  std::string JSON() const;
  // A graph for the tools that draw DOT: boxes, filled where a rule has done something.
  std::string DOT() const;

 private:
  std::vector<Entry> _entries;
};

}  // namespace xquery
