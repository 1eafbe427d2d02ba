// The place the result goes to: a file or standard output, written through one buffer.
#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace cli {

class Output {
 public:
  Output();
  ~Output();
  Output(const Output&) = delete;
  Output& operator=(const Output&) = delete;

  // Without a path: standard output. False when the file cannot be opened; `error` says why.
  [[nodiscard]] bool open(const std::optional<std::string>& path);
  // False after a failed write; from then on everything is dropped.
  bool append(std::string_view text);
  // Writes what is left and closes. False when anything at all could not be written.
  [[nodiscard]] bool finish();
  // The reason of the first failure, empty without one.
  const std::string& error() const { return _error; }

 private:
  bool flush();
  bool writeAll(std::string_view text);
  bool fail();

  static constexpr size_t bufferSize = 256 * 1024;

  std::string _buffer;
  std::string _error;
  int _file = -1;
  bool _owned = false;
};

}  // namespace cli
