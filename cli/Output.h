// The place the result goes to: a file or standard output, written through one buffer. A reader of
// either that goes away ends the process.
#pragma once

#include "ResultFile.h"

#include <optional>
#include <string>
#include <string_view>

namespace cli {

class Output {
 public:
  // Without a path: standard output. False when the file cannot be opened; `error` says why.
  [[nodiscard]] bool open(const std::optional<std::string>& path);
  // From now on control characters are written as they are in messages.
  void makeVisible() { _isVisible = true; }
  // Drops what has not been written yet.
  void discard();
  // False after a failed write; from then on everything is dropped.
  bool append(std::string_view text);
  // Writes what is left and closes. False when anything at all could not be written: then a file
  // that was to be replaced is what it was.
  [[nodiscard]] bool finish();
  // The reason of the first failure, empty without one.
  const std::string& error() const { return _error; }
  // Writes what has been gathered. False after a failed write.
  bool flush();
  // Whether what was appended last ends a line; so does nothing at all.
  bool endsLine() const { return _last == '\n'; }

 private:
  bool appendBytes(std::string_view text);
  bool appendVisible(std::string_view text);
  bool write(std::string_view text);

  static constexpr size_t bufferSize = 256 * 1024;

  std::string _buffer;
  std::string _error;
  std::string _cut;  // the beginning of a character whose end has not come yet
  bool _isVisible = false;
  char _last = '\n';
  ResultFile _result;
  int _file = -1;
};

}  // namespace cli
