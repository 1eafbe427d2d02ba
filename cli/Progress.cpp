#include "Progress.h"

#include "Streams.h"
#include "Width.h"

#include <algorithm>
#include <cstdio>
#include <initializer_list>
#include <unistd.h>
#include <utility>

namespace cli {
namespace {

constexpr auto untilShown = std::chrono::seconds(1);
constexpr auto betweenLines = std::chrono::milliseconds(200);

struct Unit {
  const char* name;
  double bytes;
};

constexpr Unit units[] = {{"GB", 1e9}, {"MB", 1e6}, {"kB", 1e3}};

Unit unitFor(double bytes) {
  for (const Unit& unit : units) {
    if (bytes >= unit.bytes) return unit;
  }
  return {"B", 1};
}

std::string number(double value, int decimals = 1) {
  char text[32];
  std::snprintf(text, sizeof text, "%.*f", decimals, value);
  return text;
}

std::string size(double bytes, const Unit& unit) {
  return number(bytes / unit.bytes, unit.bytes == 1 ? 0 : 1);
}

std::string duration(double seconds) {
  if (seconds < 100) return number(seconds, 0) + " s";
  if (seconds < 6000) return number(seconds / 60, 0) + " min";
  return number(seconds / 3600, 1) + " h";
}

// The end of a path tells most.
std::string shortened(const std::string& name, size_t room) {
  const std::string cut = "...";
  if (name.size() <= room) return name;
  size_t first = room > cut.size() ? name.size() - (room - cut.size()) : name.size();
  while (first < name.size() && (static_cast<unsigned char>(name[first]) & 0xC0) == 0x80) ++first;
  return cut + name.substr(first);
}

// What can be said, with the most telling last to go where there is little room.
struct Figures {
  std::string amount;
  std::string share;  // this and the time left are empty where the size is not known
  std::string rate;
  std::string left;
};

Figures figuresOf(double done, double all, bool isKnown, double seconds) {
  const double rate = done / std::max(seconds, 1e-9);
  const Unit unit = unitFor(isKnown ? all : done);
  Figures figures;
  figures.amount = size(done, unit);
  if (isKnown) figures.amount += " of " + size(all, unit);
  figures.amount += std::string(" ") + unit.name;
  if (isKnown) figures.share = number(100 * done / all, 0) + " %";
  figures.rate = size(rate, unitFor(rate)) + " " + unitFor(rate).name + "/s";
  if (isKnown && rate > 0) figures.left = duration((all - done) / rate) + " left";
  return figures;
}

std::string joined(std::initializer_list<std::string> parts) {
  std::string all;
  for (const std::string& part : parts) {
    if (!all.empty() && !part.empty()) all += ", ";
    all += part;
  }
  return all;
}

}  // namespace

std::string progressText(const std::string& name, uint64_t bytes, uint64_t whole,
                         std::chrono::duration<double> elapsed, size_t columns) {
  const Figures figures = figuresOf(static_cast<double>(bytes), static_cast<double>(whole),
                                    whole > 0 && bytes <= whole, elapsed.count());
  const std::string all = joined({figures.amount, figures.share, figures.rate, figures.left});
  const std::string head = "xquery: reading ", between = ": ";
  const size_t taken = head.size() + between.size() + all.size();
  constexpr size_t shortestName = 8;
  if (columns >= taken + std::min(shortestName, name.size())) {
    return head + shortened(name, columns - taken) + between + all;
  }
  const std::string shorter[] = {
      all,
      joined({figures.share, figures.rate, figures.left}),
      joined({figures.share, figures.left}),
      figures.share.empty() ? figures.amount : figures.share,
  };
  for (const std::string& text : shorter) {
    if (!text.empty() && text.size() <= columns) return text;
  }
  return {};
}

ProgressLine::ProgressLine(std::string name)
    : _name(std::move(name)),
      _isOnTerminal(isatty(STDERR_FILENO) == 1),
      _next(_start + untilShown) {}

ProgressLine::~ProgressLine() {
  if (_shown > 0) write({});
}

void ProgressLine::show(uint64_t bytes, uint64_t whole) {
  if (!_isOnTerminal) return;
  const Clock::time_point now = Clock::now();
  if (now < _next) return;
  _next = now + betweenLines;
  // The last column stays free: some terminals go on to the next line behind it.
  const size_t columns = columnsOfTerminal(STDERR_FILENO) - 1;
  write(progressText(_name, bytes, whole, now - _start, columns));
}

// In place of what is shown.
void ProgressLine::write(const std::string& text) {
  std::string line = "\r" + text;
  if (text.size() < _shown) line += std::string(_shown - text.size(), ' ') + "\r";
  _shown = text.size();
  if (!writeAll(STDERR_FILENO, line)) _shown = 0;
}

}  // namespace cli
