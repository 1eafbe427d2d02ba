#include "History.h"

#include "Streams.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <fcntl.h>
#include <filesystem>
#include <sys/stat.h>
#include <system_error>
#include <unistd.h>

namespace cli {
namespace {

namespace fs = std::filesystem;

constexpr mode_t ownersOnly = 0600;

// The folder is made where it is missing; empty where it cannot be.
std::string historyPath() {
  const char* const state = std::getenv("XDG_STATE_HOME");
  const char* const home = std::getenv("HOME");
  fs::path folder;
  if (state && *state == '/') {
    folder = state;
  } else if (home && *home == '/') {
    folder = fs::path(home) / ".local" / "state";
  } else {
    return {};
  }
  folder /= "xquery";
  const mode_t former = umask(077);
  std::error_code failure;
  fs::create_directories(folder, failure);
  umask(former);
  return failure ? std::string() : (folder / "history").string();
}

std::string escaped(std::string_view entry) {
  std::string line;
  for (const char byte : entry) {
    if (byte == '\n') {
      line += "\\n";
    } else if (byte == '\\') {
      line += "\\\\";
    } else {
      line += byte;
    }
  }
  return line + "\n";
}

std::string unescaped(std::string_view line) {
  std::string entry;
  for (size_t at = 0; at < line.size(); ++at) {
    if (line[at] == '\\' && at + 1 < line.size()) {
      ++at;
      entry += line[at] == 'n' ? '\n' : line[at];
    } else {
      entry += line[at];
    }
  }
  return entry;
}

// A file that is no regular one, such as a pipe, is not waited for.
int openOwn(const std::string& path, int flags) {
  const int file = open(path.c_str(), flags | O_CLOEXEC | O_NONBLOCK | O_NOCTTY, ownersOnly);
  struct stat status;
  if (file < 0 || (fstat(file, &status) == 0 && S_ISREG(status.st_mode))) return file;
  close(file);
  return -1;
}

}  // namespace

History::History() : _path(historyPath()) {
  if (!_path.empty()) read();
}

void History::read() {
  const int file = openOwn(_path, O_RDONLY);
  if (file < 0) return;
  std::string text;
  char piece[65536];
  ssize_t count = 0;
  while (text.size() < mostBytes && (count = ::read(file, piece, sizeof piece)) > 0) {
    text.append(piece, static_cast<size_t>(count));
  }
  fchmod(file, ownersOnly);
  close(file);
  for (std::string_view rest = text; !rest.empty();) {
    const size_t end = std::min(rest.find('\n'), rest.size());
    if (end > 0) _entries.push_back(unescaped(rest.substr(0, end)));
    rest.remove_prefix(std::min(end + 1, rest.size()));
  }
  if (_entries.size() <= mostEntries && text.size() < mostBytes) return;
  const size_t excess = _entries.size() - std::min(_entries.size(), mostEntries);
  _entries.erase(_entries.begin(), _entries.begin() + static_cast<ptrdiff_t>(excess));
  rewrite();
}

void History::rewrite() const {
  std::string text;
  for (const std::string& entry : _entries) text += escaped(entry);
  const std::string temporary = _path + "-" + std::to_string(getpid());
  const int file = openOwn(temporary, O_WRONLY | O_CREAT | O_TRUNC);
  if (file < 0) return;
  const bool isWritten = writeAll(file, text);
  if (close(file) != 0 || !isWritten || std::rename(temporary.c_str(), _path.c_str()) != 0) {
    unlink(temporary.c_str());
  }
}

void History::add(const std::string& entry) {
  const bool isRepeated = !_entries.empty() && _entries.back() == entry;
  if (entry.size() > longestEntry || isRepeated) return;
  _entries.push_back(entry);
  if (_path.empty()) return;
  // In one piece, so that those of two sessions do not mix.
  const int file = openOwn(_path, O_WRONLY | O_CREAT | O_APPEND);
  if (file < 0) return;
  if (!writeAll(file, escaped(entry))) _path.clear();
  close(file);
}

}  // namespace cli
