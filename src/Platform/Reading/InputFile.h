// A file, or standard input, as it is read.
#pragma once

#include "xquery/XMLNode.h"

#include <cstddef>
#include <cstdint>
#include <functional>
#include <string>

namespace xquery {

// Open, and closed at the end unless it is standard input, whose path is "-".
class InputFile {
 public:
  explicit InputFile(const std::string& path);
  ~InputFile();
  InputFile(const InputFile&) = delete;
  InputFile& operator=(const InputFile&) = delete;

  bool isOpen() const { return _descriptor >= 0; }
  // `beforeWaiting`, if there is one, is called where nothing is there yet.
  ptrdiff_t read(char* buffer, size_t size, const NSXMLReadingProgress& progress,
                 const std::function<void()>& beforeWaiting = {});
  // 0 for what has none.
  uint64_t bytesInFile() const;
  // The number of the system's error; 0 where nothing failed.
  int failure() const { return _failure; }
  // Whether it has a beginning to go back to, as files have and pipes have not.
  bool isSeekable() const;
  bool rewind();

 private:
  int _descriptor;
  int _failure = 0;
  uint64_t _bytesRead = 0;
};

}  // namespace xquery
