// Runs the built command as a process.
#pragma once

#include <cstddef>
#include <filesystem>
#include <string>
#include <vector>

namespace command {

struct Outcome {
  int status = -1;  // the exit status; minus the signal's number when one ended the process
  std::string out;
  std::string err;
  size_t mostMemory = 0;  // in bytes, at any time
  double processorSeconds = 0;
};

// Where a program's output goes.
enum class Sink { Captured, ClosedPipe, FullDevice };

// Starts a program, of the build directory when its name has no slash, with `input` as its standard
// input.
Outcome start(const std::string& program, const std::vector<std::string>& arguments,
              const std::string& input = "", Sink standardOutput = Sink::Captured,
              Sink standardError = Sink::Captured);

// The xquery command.
Outcome xquery(const std::vector<std::string>& arguments, const std::string& input = "");

// A shell runs `script`, in which "$0" is the xquery command and "$1" and so on are the arguments.
Outcome shell(const std::string& script, const std::vector<std::string>& arguments = {});

// For a script: waits until the condition, a command of the shell, holds; half a minute at most.
std::string waitUntil(const std::string& condition);

// What standard error says without the lines that tell where in the query an error arose.
std::string withoutPlaces(const std::string& err);

// A directory of its own for each object, removed with it.
class TemporaryDirectory {
 public:
  TemporaryDirectory();
  ~TemporaryDirectory();
  TemporaryDirectory(const TemporaryDirectory&) = delete;
  TemporaryDirectory& operator=(const TemporaryDirectory&) = delete;

  std::string path(const std::string& name) const { return (_path / name).string(); }
  // Writes a file and answers its path.
  std::string write(const std::string& name, const std::string& text) const;

 private:
  std::filesystem::path _path;
};

std::string readFile(const std::string& path);

// The document of the examples.
std::string books();

}  // namespace command
