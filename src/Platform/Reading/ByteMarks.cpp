#include "Platform/Reading/ByteMarks.h"

namespace xquery {

void markBytesPlainly(const char* bytes, size_t count, ByteMarks* marks) {
  for (; count; --count, bytes += bytesPerMarks) {
    ByteMarks found = {};
    for (size_t index = 0; index < bytesPerMarks; ++index) {
      const auto byte = static_cast<uint8_t>(bytes[index]);
      const auto classes =
          static_cast<uint8_t>(byteclasses::lower[byte & 15U] & byteclasses::upper[byte >> 4]);
      found.text |= uint64_t{(classes & byteclasses::ofText) != 0} << index;
      found.value |= uint64_t{(classes & byteclasses::ofValue) != 0} << index;
      found.name |= uint64_t{(classes & byteclasses::ofName) != 0} << index;
      found.wide |= uint64_t{byte >= 0x80} << index;
    }
    *marks++ = found;
  }
}

}  // namespace xquery
