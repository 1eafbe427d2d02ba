#include "Platform/Loading/LocalFile.h"

#include "Platform/Base/WorkMeter.h"
#include "Platform/Loading/FolderWalk.h"
#include "Platform/Loading/GatheredBytes.h"
#include "Platform/Loading/LocalPath.h"

#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <sys/stat.h>
#include <vector>

namespace xquery {

namespace {

constexpr const char* tooLong = "more bytes than allowed";
constexpr int readOnly = O_RDONLY | O_NONBLOCK | O_NOCTTY | O_CLOEXEC;

Descriptor find(const XQueryLoadingPolicy& policy, const std::string& path) {
  if (policy.allowsScheme("file")) return Descriptor(::open(path.c_str(), O_PATH | O_CLOEXEC));
  return findBelowAllowedFolders(policy, path);
}

// What was looked at, and nothing that has taken its place meanwhile.
Descriptor openFound(const Descriptor& found) {
  const std::string link = "/proc/self/fd/" + std::to_string(found.number());
  return Descriptor(::open(link.c_str(), readOnly));
}

std::optional<std::string> readAll(const Descriptor& file, uint64_t size, uint64_t mostBytes,
                                   std::string& failure) {
  GatheredBytes data(size);
  std::vector<char> piece(65536);  // not on a host's stack, which may be small
  for (;;) {
    checkWork();
    const ssize_t count = ::read(file.number(), piece.data(), piece.size());
    if (count < 0 && errno == EINTR) continue;
    if (count < 0) failure = std::strerror(errno);
    if (count < 0) return std::nullopt;
    if (count == 0) return data.take();
    // The size that a file tells need not be true.
    if (data.size() + static_cast<size_t>(count) > mostBytes) {
      failure = tooLong;
      return std::nullopt;
    }
    data.append({piece.data(), static_cast<size_t>(count)});
  }
}

}  // namespace

std::optional<std::string> readLocalFile(const NSURL& URL, const XQueryLoadingPolicy& policy,
                                         uint64_t mostBytes, std::string& failure) {
  const auto fail = [&](const char* reason) {
    failure = reason;
    return std::nullopt;
  };
  const auto path = localPathOf(URL);
  if (!path) return fail("not the URL of a local file");
  const Descriptor found = find(policy, *path);
  if (!found.isOpen()) return fail(errno == EXDEV ? "not allowed" : std::strerror(errno));
  // To open a pipe or a device can have effects, and takes as long as it takes.
  struct stat status = {};
  if (::fstat(found.number(), &status) != 0) return fail(std::strerror(errno));
  if (!S_ISREG(status.st_mode)) return fail("not a regular file");
  const Descriptor file = openFound(found);
  if (!file.isOpen()) return fail(std::strerror(errno));
  const auto size = static_cast<uint64_t>(status.st_size);
  if (size > mostBytes) return fail(tooLong);
  return readAll(file, size, mostBytes, failure);
}

}  // namespace xquery
