// The file that a result is written to.
//
// A regular file is replaced by a complete result or not at all: what is written goes to a new file
// in the same folder, which at the end takes over the mode of the old one and its name. A symbolic
// link stays what it is, the file it leads to is replaced. Whatever else a path leads to, such as a
// device or a pipe, is written directly, and so is a file that is a standard stream of the command.
#pragma once

#include <string>
#include <sys/stat.h>

namespace cli {

class ResultFile {
 public:
  ResultFile() = default;
  // Without `finish` the old file stays, and the new one goes.
  ~ResultFile();
  ResultFile(const ResultFile&) = delete;
  ResultFile& operator=(const ResultFile&) = delete;

  // Where to write; -1 when there is no such place, and `error` says why.
  [[nodiscard]] int open(const std::string& path);
  // Closes, and puts the new file in the place of the old one.
  [[nodiscard]] bool finish();
  const std::string& error() const { return _error; }

 private:
  bool openPath(const std::string& path);
  bool openDirectly(const std::string& path);
  bool openBeside(const std::string& target, const struct stat* old);
  void inheritFrom(const struct stat& old);
  bool fail(const char* what = "");

  std::string _error;
  std::string _target;     // what will be replaced; empty for what is written directly
  std::string _temporary;  // not empty while there is such a file
  int _file = -1;
  bool _isOwned = true;  // whether the file has to be closed
};

}  // namespace cli
