// Whole programs over whole documents, under limits: a program, a zero byte and a document. Planned
// and plain, profiled, over a document of which only that is read what is needed, and record by
// record where that can be done, the answers are the same, with their errors and places; what ends
// at a limit is compared with nothing. Mutations keep most of the grammar, and some take what the
// generator of random programs makes.
#include "Plan/Outcome.h"
#include "Plan/ProgramGenerator.h"
#include "support/Failure.h"
#include "support/QueryMutator.h"
#include "xquery/Projection.h"
#include "xquery/xquery.h"

#include <algorithm>
#include <chrono>
#include <cstring>
#include <string>

using namespace xquery;
using namespace xquery::fuzz;
using plantest::Outcome;

namespace {

constexpr uint32_t options = NSXMLNodePreserveWhitespace;

XQueryLoading nothing() {
  XQueryLoading loading;
  loading.policy = XQueryLoadingPolicy::denyAll();
  return loading;
}

XQueryLimits limits(std::chrono::milliseconds duration) {
  return plantest::boundedBy(duration, uint64_t{64} << 20);
}
constexpr std::chrono::milliseconds plainDuration(500);
constexpr std::chrono::milliseconds otherDuration(8000);

// What depends on the moment. (Documents and the network are out of reach.)
bool isRepeatable(std::string_view program) {
  return program.find("current-") == program.npos && program.find("real-date") == program.npos;
}

std::string shown(const Outcome& outcome) {
  std::string text;
  for (const std::string& line : outcome.lines) text += "  " + line + "\n";
  return text;
}

class Comparison {
 public:
  Comparison(std::string_view program, std::string_view xml) : _program(program), _xml(xml) {}

  void run() {
    const auto plain = compiled(XQueryWay::Plain);
    if (plain->parseErrors()) return;
    NSXMLParseError failure;
    const auto document = NSXMLDocument::documentWithData(_xml, options, &failure);
    if (!document) return;
    const Outcome expected = outcome(*plain, document, plainDuration);
    if (plantest::endedAtLimit(expected)) return;
    const auto planned = compiled(XQueryWay::Planned);
    compare(expected, outcome(*planned, document, otherDuration), "planned");
    compare(expected, outcome(*compiled(XQueryWay::Profiled), document, otherDuration), "profiled");
    const auto part = XQueryProjectedDocumentWithData(*planned, _xml, options, &failure);
    check(part != nullptr, "refused where only a part is needed", failure.message);
    compare(withoutFocus(expected), withoutFocus(outcome(*planned, part, otherDuration)),
            "projected");
    compareStream(withoutIdentity(withoutFocus(expected)));
  }

 private:
  Ref<XQuery> compiled(XQueryWay way) const {
    return XQuery::xqueryWithSource(_program, nothing(), limits(otherDuration), way);
  }

  Outcome outcome(const XQuery& query, const Value& document,
                  std::chrono::milliseconds duration) const {
    return plantest::outcomeIn(*newContext(duration), query, document);
  }

  static Ref<XQueryContext> newContext(std::chrono::milliseconds duration) {
    auto context = XQueryContext::xqueryContext();
    context->contextSetLoading(nothing());
    context->contextSetLimits(limits(duration));
    return context;
  }

  void compare(const Outcome& expected, const Outcome& found, const char* way) const {
    if (expected == found || plantest::endedAtLimit(found)) return;
    fail(std::string(way) + " otherwise than plain",
         std::string(_program) + "\n" + std::string(_xml) + "\nfound\n" + shown(found) +
             "expected\n" + shown(expected));
  }

  void compareStream(const Outcome& whole) const {
    const auto query = compiled(XQueryWay::Streamed);
    if (query->parseErrors()) return;
    XQueryStreamFailure failure;
    Outcome found;
    const bool isComplete = stream(*query, found, failure);
    // A query without a value ends without a reason.
    const std::string& reason = failure.reading.message;
    check(isComplete || reason.empty(), "read as a whole, but not record by record", reason);
    if (failure.error) {
      if (isRefusal(*failure.error)) return;
      found = plantest::outcomeOf(*failure.error);  // items before it were handed out
    }
    if (isComplete && failed(whole) && mayEndEarly(*query)) return;
    // Of several errors another one may be met first: a fold fails before later records do.
    if (failure.error && failed(whole) && hasFold(*query)) return;
    compare(whole, found, "streamed");
  }

  static bool failed(const Outcome& outcome) {
    return !outcome.lines.empty() && outcome.lines.front().starts_with("error ");
  }

  // Errors behind the record that decides are not met.
  static bool mayEndEarly(const XQuery& query) {
    const std::string description = XQueryStreamDescription(query);
    const std::string_view result =
        std::string_view(description).substr(description.find("result: ") + 8);
    for (const char* each : {"exists", "empty", "some", "every", "items from position"}) {
      if (result.starts_with(each)) return true;
    }
    return false;
  }

  static bool hasFold(const XQuery& query) {
    return XQueryStreamDescription(query).find("\nresult: items as they are found") ==
           std::string::npos;
  }

  bool stream(const XQuery& query, Outcome& found, XQueryStreamFailure& failure) const {
    XQueryStreamInput input;
    input.options = options;
    input.read = [left = _xml](char* buffer, size_t size) mutable {
      const size_t count = left.copy(buffer, std::min(size, size_t{13}));
      left.remove_prefix(count);
      return static_cast<ptrdiff_t>(count);
    };
    const auto receive = [&](const Value& item) {
      found.lines.push_back(plantest::shownItem(*item));
      return true;
    };
    return newContext(otherDuration)->evaluateStream(query, {}, input, receive, failure);
  }

  // Of prefixes on the way to the records, which are looked up before the first is read.
  static bool isRefusal(const XQueryError& error) {
    return error.msg()->utf8().starts_with("cannot be evaluated as a stream: ");
  }

  std::string_view _program;
  std::string_view _xml;
};

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  const std::string_view text(reinterpret_cast<const char*>(data), size);
  const size_t end = text.find('\0');
  if (end == text.npos) return 0;
  const std::string_view program = text.substr(0, end);
  if (isRepeatable(program)) Comparison(program, text.substr(end + 1)).run();
  return 0;
}

extern "C" size_t LLVMFuzzerMutate(uint8_t* data, size_t size, size_t most);

namespace {

std::string mutatedBytes(std::string text, size_t most) {
  const size_t size = text.size();
  text.resize(std::max(most, size));
  text.resize(LLVMFuzzerMutate(reinterpret_cast<uint8_t*>(text.data()), size, text.size()));
  std::erase(text, '\0');
  return text;
}

}  // namespace

extern "C" size_t LLVMFuzzerCustomMutator(uint8_t* data, size_t size, size_t most, unsigned seed) {
  const std::string_view text(reinterpret_cast<const char*>(data), size);
  const size_t end = std::min(text.find('\0'), size);
  std::string program(text.substr(0, end));
  std::string document(text.substr(std::min(end + 1, size)));
  plantest::ProgramGenerator generator(seed);
  const unsigned choice = seed % 16;
  if (document.empty() || choice == 0) document = generator.document();
  if (program.empty() || choice == 1) program = generator.program();
  if (choice == 2) document = mutatedBytes(document, most / 2);
  if (choice == 3) program = mutatedBytes(program, most / 2);
  if (choice > 3) program = QueryMutator(seed).mutated(program, most / 2);
  std::string changed = program + '\0' + document;
  if (changed.size() > most) return LLVMFuzzerMutate(data, size, most);
  std::memcpy(data, changed.data(), changed.size());
  return changed.size();
}
