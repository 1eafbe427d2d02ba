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
#include <vector>

using namespace xquery;
using namespace xquery::fuzz;
using plantest::Outcome;

namespace {

constexpr uint32_t options = NSXMLNodePreserveWhitespace;
using Lines = std::vector<std::string>;

XQueryLoading nothing() {
  XQueryLoading loading;
  loading.policy = XQueryLoadingPolicy::denyAll();
  return loading;
}

XQueryLimits limits(std::chrono::milliseconds duration) {
  XQueryLimits found;
  found.duration = duration;
  found.memoryCeiling = uint64_t{64} << 20;
  return found;
}
constexpr std::chrono::milliseconds plainDuration(500);
constexpr std::chrono::milliseconds otherDuration(8000);

bool endedAtLimit(const Lines& lines) {
  return std::any_of(lines.begin(), lines.end(), [](const std::string& line) {
    return line.starts_with("error 0 ") && line.find("limit: ") != std::string::npos;
  });
}

// What depends on the moment. (Documents and the network are out of reach.)
bool isRepeatable(std::string_view program) {
  return program.find("current-") == program.npos && program.find("real-date") == program.npos;
}

// Without the focus that is left behind, whose document may be less than whole.
Lines answerOf(Lines lines) {
  std::erase_if(lines, [](const std::string& line) { return line.starts_with("left "); });
  return lines;
}

std::string shown(const Lines& lines) {
  std::string text;
  for (const std::string& line : lines) text += "  " + line + "\n";
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
    const Lines expected = outcome(*plain, document, plainDuration);
    if (endedAtLimit(expected)) return;
    const auto planned = compiled(XQueryWay::Planned);
    compare(expected, outcome(*planned, document, otherDuration), "planned");
    compare(expected, outcome(*compiled(XQueryWay::Profiled), document, otherDuration), "profiled");
    const auto part = XQueryProjectedDocumentWithData(*planned, _xml, options, &failure);
    check(part != nullptr, "refused where only a part is needed", failure.message);
    compare(answerOf(expected), answerOf(outcome(*planned, part, otherDuration)), "projected");
    compareStream(answerOf(outcome(*plain, document, otherDuration, true)));
  }

 private:
  Ref<XQuery> compiled(XQueryWay way) const {
    return XQuery::xqueryWithSource(_program, nothing(), limits(otherDuration), way);
  }

  Lines outcome(const XQuery& query, const Value& document, std::chrono::milliseconds duration,
                bool isForStream = false) const {
    const auto context = XQueryContext::xqueryContext();
    context->contextSetLoading(nothing());
    context->contextSetLimits(limits(duration));
    if (!isForStream) return plantest::outcomeIn(*context, query, document).lines;
    Ref<XQueryError> error;
    const auto items = context->evaluateXQuery(query, {}, document, &error);
    return linesOf(items, error);
  }

  static Lines linesOf(const Ref<NSArray>& items, const Ref<XQueryError>& error) {
    Lines lines;
    if (error) return {errorLine(*error)};
    for (size_t i = 0; items && i < items->count(); ++i) {
      lines.push_back(plantest::shownItem(*items->objectAtIndex(i)));
    }
    return lines;
  }

  static std::string errorLine(const XQueryError& error) {
    return "error " + std::to_string(error.err()) + " " + (error.msg() ? error.msg()->utf8() : "");
  }

  void compare(const Lines& expected, const Lines& found, const char* way) const {
    if (expected == found || endedAtLimit(expected) || endedAtLimit(found)) return;
    fail(std::string(way) + " otherwise than plain",
         std::string(_program) + "\n" + std::string(_xml) + "\nfound\n" + shown(found) +
             "expected\n" + shown(expected));
  }

  void compareStream(const Lines& expected) const {
    const auto query = compiled(XQueryWay::Streamed);
    if (query->parseErrors()) return;
    XQueryStreamInput input;
    input.options = options;
    input.read = [left = _xml](char* buffer, size_t size) mutable {
      const size_t count = left.copy(buffer, std::min(size, size_t{13}));
      left.remove_prefix(count);
      return static_cast<ptrdiff_t>(count);
    };
    const auto context = XQueryContext::xqueryContext();
    context->contextSetLoading(nothing());
    context->contextSetLimits(limits(otherDuration));
    XQueryStreamFailure failure;
    Lines found;
    const bool isComplete = context->evaluateStream(
        *query, {}, input,
        [&](const Value& item) {
          found.push_back(plantest::shownItem(*item));
          return true;
        },
        failure);
    if (!isComplete && !failure.error) return;  // a document that is not read so
    if (failure.error) found = {errorLine(*failure.error)};
    // The names of the way to the records are looked up before the first is read, even those that
    // the document has no place for.
    if (failure.error && failure.error->number() == XQueryErrorNumber::UnresolvedName) return;
    compare(expected, found, "streamed");
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
