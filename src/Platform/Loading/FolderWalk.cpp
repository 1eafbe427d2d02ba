#include "Platform/Loading/FolderWalk.h"

#include "Platform/Loading/LocalPath.h"

#include <cerrno>
#include <climits>
#include <fcntl.h>
#include <linux/openat2.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <utility>
#include <vector>

namespace xquery {

namespace {

// As many as the kernel follows.
constexpr int mostLinks = 40;
constexpr int lookOnly = O_PATH | O_CLOEXEC;

Descriptor none(int error) {
  errno = error;
  return Descriptor();
}

Descriptor openFolder(const std::string& folder) {
  const char* path = folder.empty() ? "/" : folder.c_str();
  return Descriptor(::open(path, lookOnly | O_DIRECTORY | O_NOFOLLOW));
}

class Walk {
 public:
  explicit Walk(const XQueryLoadingPolicy& policy) : _policy(policy) {}
  Descriptor find(const std::string& path);

 private:
  // Each of these is whether the walk goes on; errno says why not.
  bool begin(const std::string& path);
  bool step(const std::string& name);
  bool follow(const Descriptor& link);
  bool climb();

  void postpone(std::string_view path);
  std::string postponed() const;
  int folder() const { return _found.back().number(); }

  const XQueryLoadingPolicy& _policy;
  std::string _root;                // the allowed folder
  std::vector<Descriptor> _found;   // it, what lies between, and where the walk is
  std::vector<std::string> _names;  // that are still to be gone to; the next one last
  int _links = 0;
};

Descriptor Walk::find(const std::string& path) {
  if (!begin(path)) return Descriptor();
  while (!_names.empty()) {
    const std::string name = std::move(_names.back());
    _names.pop_back();
    if (!step(name)) return Descriptor();
  }
  return std::move(_found.back());
}

bool Walk::begin(const std::string& path) {
  const auto place = _policy.placeBelowFolder(path);
  errno = EXDEV;
  if (!place) return false;
  _root = place->folder;
  _found.clear();
  _found.push_back(openFolder(_root));
  _names.clear();
  postpone(place->path);
  return _found.back().isOpen();
}

bool Walk::step(const std::string& name) {
  if (name.empty() || name == ".") return true;
  if (name == "..") return climb();
  Descriptor next(::openat(folder(), name.c_str(), lookOnly | O_NOFOLLOW));
  struct stat status = {};
  if (!next.isOpen() || ::fstat(next.number(), &status) != 0) return false;
  if (S_ISLNK(status.st_mode)) return follow(next);
  errno = ENOTDIR;
  if (!_names.empty() && !S_ISDIR(status.st_mode)) return false;
  _found.push_back(std::move(next));
  return true;
}

bool Walk::climb() {
  if (_found.size() > 1) {
    _found.pop_back();
    return true;
  }
  return begin(withoutDots(_root + "/.." + postponed()));
}

bool Walk::follow(const Descriptor& link) {
  errno = ELOOP;
  if (++_links > mostLinks) return false;
  std::string target(PATH_MAX, '\0');
  const ssize_t length = ::readlinkat(link.number(), "", target.data(), target.size());
  if (length < 0) return false;
  target.resize(static_cast<size_t>(length));
  if (target.starts_with('/')) return begin(withoutDots(target + postponed()));
  postpone(target);
  return true;
}

void Walk::postpone(std::string_view path) {
  while (!path.empty()) {
    const size_t slash = path.rfind('/');
    const size_t start = slash == path.npos ? 0 : slash + 1;
    _names.emplace_back(path.substr(start));
    path = path.substr(0, slash == path.npos ? 0 : slash);
  }
}

std::string Walk::postponed() const {
  std::string path;
  for (auto name = _names.rbegin(); name != _names.rend(); ++name) path.append("/").append(*name);
  return path;
}

// Where the kernel cannot do it, or a link needs more thought than it takes.
bool needsWalk(int error) {
  return error == EXDEV || error == ENOSYS || error == EPERM || error == EINVAL || error == EAGAIN;
}

}  // namespace

Descriptor walkBelowAllowedFolders(const XQueryLoadingPolicy& policy, const std::string& path) {
  return Walk(policy).find(path);
}

Descriptor findBelowAllowedFolders(const XQueryLoadingPolicy& policy, const std::string& path) {
  const auto place = policy.placeBelowFolder(path);
  if (!place) return none(EXDEV);
  const Descriptor folder = openFolder(place->folder);
  if (!folder.isOpen()) return Descriptor();
  open_how how = {};
  how.flags = static_cast<uint64_t>(lookOnly);
  how.resolve = RESOLVE_BENEATH | RESOLVE_NO_MAGICLINKS;
  Descriptor found(static_cast<int>(
      ::syscall(SYS_openat2, folder.number(), place->path.c_str(), &how, sizeof how)));
  if (found.isOpen() || !needsWalk(errno)) return found;
  return walkBelowAllowedFolders(policy, path);
}

}  // namespace xquery
