#include "Reports.h"

#include "JSON.h"
#include "Messages.h"
#include "Places.h"

#include <cstdlib>
#include <set>
#include <string_view>
#include <unistd.h>

namespace cli {
namespace {

using namespace xquery;

// NO_COLOR is what people set who want none anywhere.
bool usesColor(const Options& options) {
  if (options.color != Color::Auto) return options.color == Color::Always;
  const char* const none = std::getenv("NO_COLOR");
  const char* const terminal = std::getenv("TERM");
  if (none && *none) return false;
  return isatty(STDERR_FILENO) && terminal && std::string_view(terminal) != "dumb";
}

// The beginning of each line that says what kind of failure it is.
std::string colored(const std::string& text) {
  static constexpr std::string_view heads[] = {"XQueryError:", "xquery:"};
  std::string result;
  for (std::string_view rest = text; !rest.empty();) {
    const size_t end = std::min(rest.find('\n'), rest.size() - 1) + 1;
    std::string_view line = rest.substr(0, end);
    for (const std::string_view head : heads) {
      const size_t at = line.find(head);
      if (at == line.npos) continue;
      const size_t stop = std::min(line.find(' ', at), line.size() - 1);
      result += line.substr(0, at);
      result += "\033[1;31m" + std::string(line.substr(at, stop - at)) + "\033[0m";
      line.remove_prefix(stop);
      break;
    }
    result += line;
    rest.remove_prefix(end);
  }
  return result;
}

// The line of a library module stands as it is.
int64_t lineOf(const XQueryError& error, const Options& options) {
  const auto place = error.place();
  const bool isOfModule = error.moduleURL() || (place && place->moduleURL);
  return isOfModule ? error.line() : lineAsEntered(error.line(), options);
}

std::string jsonOfError(const NSError& error, const Options& options) {
  const auto* own = dyn_cast<XQueryError>(&error);
  const Ref<NSString> text = own ? own->msg() : error.localizedDescription();
  std::string json = "\"code\":" + std::to_string(error.code());
  if (text) json += ",\"message\":" + jsonString(text->utf8());
  if (own && own->line() > 0) json += ",\"line\":" + std::to_string(lineOf(*own, options));
  if (own && own->column() > 0) json += ",\"column\":" + std::to_string(own->column());
  if (own && own->moduleURL()) json += ",\"module\":" + jsonString(own->moduleURL()->utf8());
  if (own) json += jsonOfPlace(*own, options);
  return json;
}

// One error may be found twice.
std::vector<Ref<NSError>> distinct(const std::vector<Ref<NSError>>& errors) {
  std::vector<Ref<NSError>> result;
  std::set<std::string> told;
  for (const Ref<NSError>& error : errors) {
    if (told.insert(description(*error)).second) result.push_back(error);
  }
  return result;
}

// The description; where the place is told below it, without the line that names the module alone.
std::string firstLines(const NSError& error, const Options& options) {
  std::string text = description(error);
  const auto* own = dyn_cast<XQueryError>(&error);
  const std::string line = own ? " at line:" + std::to_string(own->line()) : "";
  if (own && own->line() > 0 && text.ends_with(line)) {
    text.erase(text.size() - line.size());
    text += " at line:" + std::to_string(lineOf(*own, options));
  }
  if (own && own->moduleURL() && own->place()) text.erase(text.rfind("\n  at "));
  return text;
}

std::string asJSON(const Options& options, const Failure& failure, const std::string& input) {
  const std::string rest = (input.empty() ? "" : ",\"input\":" + jsonString(input)) +
                           ",\"status\":" + std::to_string(failure.status) + "}\n";
  if (failure.errors.empty()) {
    return "{\"message\":" + jsonString(failure.message) + rest;
  }
  std::string lines;
  for (const Ref<NSError>& error : distinct(failure.errors))
    lines += "{" + jsonOfError(*error, options) + rest;
  return lines;
}

}  // namespace

std::string report(const Options& options, const Failure& failure, const std::string& input) {
  if (options.format == Format::JSON) return asJSON(options, failure, input);
  const bool isNamed = !input.empty() && failure.status == StatusQueryError;
  const bool hasColor = usesColor(options);
  const auto head = [&](const std::string& text) {
    const std::string safe = visible(text);
    return hasColor ? colored(safe) : safe;
  };
  const std::string name = isNamed ? visibleName(input) + ": " : "";
  if (failure.errors.empty()) return head(name + failure.message) + "\n";
  const Marks marks = hasColor ? Marks{"\033[1;31m", "\033[0m"} : Marks{};
  std::string text;
  for (const Ref<NSError>& error : distinct(failure.errors)) {
    text += head((text.empty() ? name : "") + firstLines(*error, options));
    const auto* own = dyn_cast<XQueryError>(error);
    if (own) text += linesOfPlace(*own, options, marks);
    text += "\n";
  }
  return text;
}

std::string warning(const Options& options, const XQueryMissingDocument& document) {
  const std::string what = "cannot load " + document.URL + ": " + document.reason;
  if (options.format == Format::JSON) {
    return "{\"warning\":" + jsonString(what) + ",\"url\":" + jsonString(document.URL) +
           ",\"reason\":" + jsonString(document.reason) + "}\n";
  }
  const std::string text = "xquery: warning: " + visibleName(what) + "\n";
  return usesColor(options) ? colored(text) : text;
}

std::string warningOfMore(const Options& options) {
  const std::string what = "more documents cannot be loaded";
  if (options.format == Format::JSON) return "{\"warning\":" + jsonString(what) + "}\n";
  const std::string text = "xquery: warning: " + what + "\n";
  return usesColor(options) ? colored(text) : text;
}

namespace {

bool isExpected(const Options& options, const XQueryWarning& warning) {
  return warning.identifier == "undeclared-prefix" && warning.name &&
         options.namespaces.contains(warning.name->utf8());
}

std::string asJSON(const XQueryWarning& warning) {
  std::string json = "{\"warning\":" + jsonString(warning.identifier) +
                     ",\"message\":" + jsonString(warning.text->utf8());
  if (warning.line > 0) json += ",\"line\":" + std::to_string(warning.line);
  if (warning.column > 0) json += ",\"column\":" + std::to_string(warning.column);
  if (warning.length > 0) json += ",\"length\":" + std::to_string(warning.length);
  if (warning.module) json += ",\"module\":" + jsonString(warning.module->utf8());
  return json + "}\n";
}

std::string asText(const Options& options, const XQueryWarning& warning) {
  std::string place =
      moduleName(warning.module, options) + ":" + std::to_string(warning.line) + ":";
  if (warning.column > 0) place += std::to_string(warning.column) + ":";
  const std::string head = usesColor(options) ? "\033[1;35mwarning:\033[0m " : "warning: ";
  return visible(place) + " " + head + visible(warning.text->utf8()) + " [" +
         std::string(warning.identifier) + "]\n";
}

}  // namespace

std::string report(const Options& options, const std::vector<XQueryWarning>& warnings) {
  std::string text;
  for (const XQueryWarning& warning : warnings) {
    if (isExpected(options, warning)) continue;
    text += options.format == Format::JSON ? asJSON(warning) : asText(options, warning);
  }
  return text;
}

}  // namespace cli
