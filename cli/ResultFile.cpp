#include "ResultFile.h"

#include "Streams.h"

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <fcntl.h>
#include <filesystem>
#include <system_error>
#include <unistd.h>
#include <utility>

namespace cli {
namespace {

bool isSame(const struct stat& a, const struct stat& b) {
  return a.st_dev == b.st_dev && a.st_ino == b.st_ino;
}

// The standard output or error that the file is; -1 for another file, and where the stream only
// stands for one that was closed.
int standardStream(const struct stat& file) {
  for (const int stream : {STDOUT_FILENO, STDERR_FILENO}) {
    struct stat status;
    const bool isWritable = (fcntl(stream, F_GETFL) & O_ACCMODE) != O_RDONLY;
    if (isWritable && fstat(stream, &status) == 0 && isSame(status, file)) return stream;
  }
  return -1;
}

// Where the symbolic links of a path end; nothing need be there.
std::filesystem::path linkTarget(std::filesystem::path place) {
  constexpr int mostLinks = 40;  // as the system's own limit
  for (int links = 0; links < mostLinks; ++links) {
    std::error_code isNoLink;
    const auto next = std::filesystem::read_symlink(place, isNoLink);
    if (isNoLink) break;
    place = place.parent_path() / next;
  }
  return place;
}

}  // namespace

ResultFile::~ResultFile() {
  if (_isOwned && _file >= 0) close(_file);
  if (_temporary.empty()) return;
  unlink(_temporary.c_str());
  keepAtEnd(_temporary);
}

int ResultFile::open(const std::string& path) {
  return openPath(path) ? _file : -1;
}

bool ResultFile::openPath(const std::string& path) {
  struct stat old;
  const bool exists = stat(path.c_str(), &old) == 0;
  if (!exists && errno != ENOENT) return fail();
  const std::string target = linkTarget(path).string();
  if (!exists) return openBeside(target, nullptr);

  _file = standardStream(old);
  _isOwned = _file < 0;
  if (!_isOwned) return true;
  // A link in /proc to an open file names a place where by now another file may be, or none.
  struct stat found;
  const bool isThere = lstat(target.c_str(), &found) == 0 && isSame(found, old);
  if (!S_ISREG(old.st_mode) || !isThere) return openDirectly(path);
  if (access(target.c_str(), W_OK) != 0) return fail();
  return openBeside(target, &old);
}

bool ResultFile::openDirectly(const std::string& path) {
  _file = ::open(path.c_str(), O_WRONLY | O_TRUNC | O_NOCTTY | O_CLOEXEC);
  return _file >= 0 || fail();
}

bool ResultFile::openBeside(const std::string& target, const struct stat* old) {
  const auto folder = std::filesystem::path(target).parent_path();
  const std::string start = ".xquery-" + std::to_string(getpid()) + "-";
  // What will have the mode of another file is meanwhile nobody else's to read.
  const mode_t mode = old ? 0600 : 0666;
  constexpr int mostNames = 1000;  // that others may have taken
  for (int n = 0; n < mostNames && _file < 0; ++n) {
    _temporary = (folder / (start + std::to_string(n))).string();
    _file = makeUntilEnd(_temporary, mode);
    if (_file < 0 && errno != EEXIST) break;
  }
  if (_file < 0) {
    _temporary.clear();
    return fail(old ? "no new file can be made beside it: " : "");
  }
  _target = target;
  if (old) inheritFrom(*old);
  return true;
}

// A file system without owners and modes has none to keep. Only the owner may keep what lets others
// run the file in his name.
void ResultFile::inheritFrom(const struct stat& old) {
  const bool keepsOwner = fchown(_file, old.st_uid, old.st_gid) == 0;
  if (fchmod(_file, old.st_mode & (keepsOwner ? 07777 : 0777)) != 0) return;
}

bool ResultFile::finish() {
  const int file = std::exchange(_file, -1);
  // Some file systems report a full disk only here.
  if (_isOwned && file >= 0 && close(file) != 0) return fail();
  if (_temporary.empty()) return true;
  if (std::rename(_temporary.c_str(), _target.c_str()) != 0) return fail();
  keepAtEnd(_temporary);
  _temporary.clear();
  return true;
}

bool ResultFile::fail(const char* what) {
  _error = std::string(what) + std::strerror(errno);
  return false;
}

}  // namespace cli
