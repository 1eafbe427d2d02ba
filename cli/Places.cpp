#include "Places.h"

#include "JSON.h"
#include "Messages.h"
#include "Width.h"

#include <algorithm>
#include <cstdlib>
#include <string_view>
#include <unistd.h>
#include <vector>

namespace cli {
namespace {

using namespace xquery;

constexpr size_t mostCallsAtEachEnd = 5;
constexpr size_t leastWidth = 20;
constexpr size_t leastText = 12;  // of a line that is cut

int64_t lineOf(const XQuerySourcePlace& place, const Options& options) {
  return place.moduleURL ? place.line : lineAsEntered(place.line, options);
}

std::string shown(const XQuerySourcePlace& place, const Options& options) {
  return visible(moduleName(place.moduleURL, options)) + ":" +
         std::to_string(lineOf(place, options)) + ":" + std::to_string(place.column);
}

std::string shownIn(const std::vector<XQueryErrorCall>& calls, size_t index) {
  if (index >= calls.size() || !calls[index].function) return "";
  return ", in " + visible(calls[index].function->utf8());
}

// The characters of a line, each as it is shown: a tab is one blank, so that marks fit below.
std::vector<std::string> shownCharacters(std::string_view line) {
  std::vector<std::string> characters;
  for (size_t at = 0; at < line.size();) {
    size_t length = 1;
    while (at + length < line.size() && (line[at + length] & 0xC0) == 0x80) ++length;
    const std::string_view character = line.substr(at, length);
    characters.push_back(character == "\t" ? " " : visible(character));
    at += length;
  }
  return characters;
}

// How many columns a character takes that `visible` has shown.
size_t widthOf(const std::string& character) {
  const bool isEscape = character.size() > 1 && character[0] == '\\';
  return isEscape ? character.size() : widthOfCharacter(character);
}

// The characters from `first` on that fit. What is drawn over the last one belongs to it.
size_t endOfWhatFits(const std::vector<std::string>& characters, size_t first, size_t width) {
  size_t used = 0, end = first;
  while (end < characters.size() && used + widthOf(characters[end]) <= width) {
    used += widthOf(characters[end++]);
  }
  return end;
}

struct MarkedLine {
  std::string text, blanks, mark;
};

// As much of the line as fits, around the place; "..." stands for what does not.
MarkedLine markedLine(const XQuerySourcePlace& place, size_t width) {
  static constexpr std::string_view cut = "...";
  const auto characters = shownCharacters(place.sourceLine->utf8());
  const size_t start = std::min(static_cast<size_t>(place.column - 1), characters.size());
  const auto length = static_cast<size_t>(std::max<int64_t>(place.length, 1));
  const size_t stop = std::min(start + std::min(length, characters.size() - start + 1),
                               std::max(characters.size(), start + 1));
  MarkedLine line;
  size_t first = 0, end = endOfWhatFits(characters, 0, width);
  if (end < characters.size()) {
    const size_t room = width - 2 * cut.size();
    // A third of the room shows what stands before the place.
    size_t before = 0;
    first = start;
    while (first > 0 && before + widthOf(characters[first - 1]) <= room / 3) {
      before += widthOf(characters[--first]);
    }
    end = endOfWhatFits(characters, first, room);
  }
  if (first > 0) line.text = line.blanks = std::string(cut);
  if (first > 0) line.blanks.assign(cut.size(), ' ');
  for (size_t index = first; index < end; ++index) line.text += characters[index];
  if (end < characters.size()) line.text += cut;
  for (size_t index = first; index < start; ++index) {
    line.blanks.append(widthOf(characters[index]), ' ');
  }
  for (size_t index = start; index < std::min(stop, end); ++index) {
    line.mark.append(widthOf(characters[index]), '^');
  }
  // The end of a line, where something is missing, is no character.
  if (line.mark.empty()) line.mark = "^";
  return line;
}

std::string sourceLines(const XQuerySourcePlace& place, const Options& options,
                        const Marks& marks) {
  const std::string number = std::to_string(lineOf(place, options));
  const size_t gutter = number.size() + 5;
  const size_t width = std::max(columnsOfTerminal(STDERR_FILENO), leastWidth);
  const MarkedLine line = markedLine(place, std::max(width - std::min(width, gutter), leastText));
  return "\n  " + number + " | " + line.text + "\n  " + std::string(number.size(), ' ') + " | " +
         line.blanks + marks.before + line.mark + marks.after;
}

std::string jsonOf(const XQuerySourcePlace& place, const Options& options) {
  return (place.moduleURL ? "\"module\":" + jsonString(place.moduleURL->utf8()) + "," : "") +
         "\"line\":" + std::to_string(lineOf(place, options)) +
         ",\"column\":" + std::to_string(place.column) +
         ",\"length\":" + std::to_string(place.length);
}

std::string_view nameOf(XQueryErrorCategory category) {
  switch (category) {
    case XQueryErrorCategory::Syntax:
      return "syntax";
    case XQueryErrorCategory::Names:
      return "names";
    case XQueryErrorCategory::Types:
      return "types";
    case XQueryErrorCategory::Values:
      return "values";
    case XQueryErrorCategory::Loading:
      return "loading";
    case XQueryErrorCategory::Limit:
      return "limit";
    case XQueryErrorCategory::RaisedByQuery:
      return "raised by the query";
    case XQueryErrorCategory::Internal:
      break;
  }
  return "internal";
}

}  // namespace

std::string queryName(const Options& options) {
  if (options.queryText || options.isSession) return "query";
  return options.queryFile == "-" ? "standard input" : options.queryFile;
}

std::string moduleName(const Ref<NSString>& URL, const Options& options) {
  if (!URL) return queryName(options);
  const auto parsed = NSURL::URLWithString(URL);
  return parsed && parsed->scheme() == "file" ? parsed->path() : URL->utf8();
}

int64_t lineAsEntered(int64_t line, const Options& options) {
  const auto before = static_cast<int64_t>(options.linesBefore);
  return line > before ? line - before : line;
}

std::string linesOfPlace(const XQueryError& error, const Options& options, const Marks& marks) {
  const auto place = error.place();
  if (!place) return "";
  const auto calls = error.calls();
  std::string text = "\n  at " + shown(*place, options) + shownIn(calls, 0);
  text += sourceLines(*place, options, marks);
  const bool isLong = calls.size() > 2 * mostCallsAtEachEnd;
  for (size_t index = 0; index < calls.size(); ++index) {
    if (isLong && index == mostCallsAtEachEnd) {
      index = calls.size() - mostCallsAtEachEnd;
      const auto leftOut = static_cast<int64_t>(index - mostCallsAtEachEnd) + error.callsLeftOut();
      text += "\n  ... " + std::to_string(leftOut) + " calls between";
    }
    if (!calls[index].place) continue;
    text += "\n  called at " + shown(*calls[index].place, options) + shownIn(calls, index + 1);
  }
  return text;
}

std::string jsonOfPlace(const XQueryError& error, const Options& options) {
  std::string json = ",\"category\":" + jsonString(nameOf(error.category()));
  if (const auto place = error.place()) json += ",\"place\":{" + jsonOf(*place, options) + "}";
  std::string calls;
  for (const XQueryErrorCall& call : error.calls()) {
    calls += calls.empty() ? "{" : ",{";
    calls += "\"function\":" + jsonString(call.function ? call.function->utf8() : "");
    if (call.place) calls += "," + jsonOf(*call.place, options);
    calls += "}";
  }
  if (!calls.empty()) json += ",\"calls\":[" + calls + "]";
  if (error.callsLeftOut() > 0) {
    json += ",\"callsLeftOut\":" + std::to_string(error.callsLeftOut());
  }
  return json;
}

}  // namespace cli
