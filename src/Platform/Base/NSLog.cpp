#include "Platform/Base/NSLog.h"

#include <cerrno>
#include <cstdlib>
#include <string>
#include <unistd.h>

namespace xquery {

void NSLog(std::string_view text) {
  std::string line;
  line.reserve(text.size() + 1);
  for (const char character : text) {
    if (character == '\n') {
      line += "\\n";
    } else if (character == '\r') {
      line += "\\r";
    } else {
      line += character;
    }
  }
  line += '\n';
  // One write for the whole line keeps the lines of several threads apart.
  for (size_t written = 0; written < line.size();) {
    const ssize_t count = ::write(STDERR_FILENO, line.data() + written, line.size() - written);
    if (count > 0) {
      written += static_cast<size_t>(count);
    } else if (errno != EINTR) {
      return;  // nobody is left to tell
    }
  }
}

bool XQueryLogEnabled() {
  const char* value = std::getenv("XQUERY_LOG");
  return value && *value && std::string_view(value) != "0";
}

}  // namespace xquery
