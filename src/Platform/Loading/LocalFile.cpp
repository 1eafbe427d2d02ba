#include "Platform/Loading/LocalFile.h"

#include "Platform/Base/WorkMeter.h"

#include <cerrno>
#include <climits>
#include <cstring>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

namespace xquery {

namespace {

class Descriptor {
 public:
  explicit Descriptor(int number) : _number(number) {}
  ~Descriptor() {
    if (_number >= 0) ::close(_number);
  }
  Descriptor(const Descriptor&) = delete;
  Descriptor& operator=(const Descriptor&) = delete;
  int number() const { return _number; }

 private:
  int _number;
};

// Where the open file lies, links resolved; empty when the system does not tell.
std::string placeOf(const Descriptor& file) {
  const std::string link = "/proc/self/fd/" + std::to_string(file.number());
  std::string place(PATH_MAX, '\0');
  const ssize_t length = ::readlink(link.c_str(), place.data(), place.size());
  place.resize(length > 0 ? static_cast<size_t>(length) : 0);
  return place;
}

bool hasLocalPath(const NSURL& URL, const std::string& path) {
  const std::string host = URL.host();
  return (host.empty() || host == "localhost") && !path.empty() && path[0] == '/' &&
         path.find('\0') == path.npos;
}

// What has been read counts as memory while it is gathered.
class CountedBytes {
 public:
  CountedBytes() = default;
  ~CountedBytes() { uncountValueBytes(_bytes); }
  CountedBytes(const CountedBytes&) = delete;
  CountedBytes& operator=(const CountedBytes&) = delete;
  void add(size_t bytes) {
    countValueBlock(bytes);
    _bytes += bytes;
  }

 private:
  size_t _bytes = 0;
};

constexpr const char* tooLong = "more bytes than allowed";

std::optional<std::string> readAll(const Descriptor& file, uint64_t size, uint64_t mostBytes,
                                   std::string& failure) {
  std::string data;
  if (size <= mostBytes) data.reserve(size);
  CountedBytes counted;
  char piece[65536];
  for (;;) {
    checkWork();
    const ssize_t count = ::read(file.number(), piece, sizeof piece);
    if (count < 0 && errno == EINTR) continue;
    if (count < 0) failure = std::strerror(errno);
    if (count < 0) return std::nullopt;
    if (count == 0) return data;
    // The size that a file tells need not be true.
    if (data.size() + static_cast<size_t>(count) > mostBytes) {
      failure = tooLong;
      return std::nullopt;
    }
    counted.add(static_cast<size_t>(count));
    data.append(piece, static_cast<size_t>(count));
  }
}

}  // namespace

std::optional<std::string> readLocalFile(const NSURL& URL, const XQueryLoadingPolicy& policy,
                                         uint64_t mostBytes, std::string& failure) {
  const auto fail = [&](const char* reason) {
    failure = reason;
    return std::nullopt;
  };
  const std::string path = URL.path();
  if (!hasLocalPath(URL, path)) return fail("not the URL of a local file");
  const Descriptor file(::open(path.c_str(), O_RDONLY | O_NONBLOCK | O_NOCTTY | O_CLOEXEC));
  if (file.number() < 0) return fail(std::strerror(errno));
  struct stat status = {};
  if (::fstat(file.number(), &status) != 0) return fail(std::strerror(errno));
  if (!S_ISREG(status.st_mode)) return fail("not a regular file");
  if (!policy.allowsScheme("file") && !policy.isBelowAllowedFolder(placeOf(file))) {
    return fail("not allowed");
  }
  const auto size = static_cast<uint64_t>(status.st_size);
  if (size > mostBytes) return fail(tooLong);
  return readAll(file, size, mostBytes, failure);
}

}  // namespace xquery
