#include "Progress.h"

#include "Streams.h"

#include <algorithm>
#include <cstdio>
#include <sys/ioctl.h>
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

size_t columnsOfTerminal() {
  constexpr size_t usual = 80;
  winsize window = {};
  return ioctl(STDERR_FILENO, TIOCGWINSZ, &window) == 0 && window.ws_col ? window.ws_col : usual;
}

}  // namespace

std::string progressText(const std::string& name, uint64_t bytes, uint64_t whole,
                         std::chrono::duration<double> elapsed, size_t columns) {
  const auto done = static_cast<double>(bytes), all = static_cast<double>(whole);
  const double rate = done / std::max(elapsed.count(), 1e-9);
  const bool isKnown = bytes <= whole;
  const Unit unit = unitFor(isKnown ? all : done);
  std::string figures = size(done, unit);
  if (isKnown) figures += " of " + size(all, unit);
  figures += std::string(" ") + unit.name;
  if (isKnown && whole > 0) figures += ", " + number(100 * done / all, 0) + " %";
  figures += ", " + size(rate, unitFor(rate)) + " " + unitFor(rate).name + "/s";
  if (isKnown && rate > 0) figures += ", " + duration((all - done) / rate) + " left";

  const std::string head = "xquery: reading ", between = ": ";
  const size_t taken = head.size() + between.size() + figures.size();
  // The end of a path tells most.
  const std::string cut = "...";
  std::string shown = name;
  const size_t room = columns > taken ? columns - taken : 0;
  if (shown.size() > room) {
    size_t first = room > cut.size() ? shown.size() - (room - cut.size()) : shown.size();
    while (first < shown.size() && (static_cast<unsigned char>(shown[first]) & 0xC0) == 0x80) {
      ++first;
    }
    shown = cut + shown.substr(first);
  }
  return head + shown + between + figures;
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
  const size_t columns = columnsOfTerminal() - 1;
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
