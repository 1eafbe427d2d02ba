#include "cli/Command.h"

#include <algorithm>
#include <cstdlib>
#include <fcntl.h>
#include <fstream>
#include <iterator>
#include <stdexcept>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

namespace command {
namespace {

// A file that already is at the stream's place, where that was closed, only has to stay open.
void attach(int file, int stream) {
  if (file == stream) {
    fcntl(file, F_SETFD, 0);
  } else {
    dup2(file, stream);
  }
}

// In the child: standard streams, then the program.
[[noreturn]] void become(const std::string& program, const std::vector<std::string>& arguments,
                         int in, int out, int err) {
  attach(in, STDIN_FILENO);
  attach(out, STDOUT_FILENO);
  attach(err, STDERR_FILENO);
  std::vector<char*> argv{const_cast<char*>(program.c_str())};
  for (const std::string& argument : arguments) argv.push_back(const_cast<char*>(argument.c_str()));
  argv.push_back(nullptr);
  execv(program.c_str(), argv.data());
  _exit(127);
}

int openFile(const std::string& path, int flags) {
  const int file = open(path.c_str(), flags | O_CLOEXEC, 0600);
  if (file < 0) throw std::runtime_error("cannot open " + path);
  return file;
}

int closedPipe() {
  int ends[2];
  if (pipe2(ends, O_CLOEXEC) != 0) throw std::runtime_error("cannot make a pipe");
  close(ends[0]);
  return ends[1];
}

int openOutput(Sink kind, const std::string& captured) {
  switch (kind) {
    case Sink::ClosedPipe:
      return closedPipe();
    case Sink::FullDevice:
      return openFile("/dev/full", O_WRONLY);
    default:
      return openFile(captured, O_WRONLY | O_CREAT);
  }
}

}  // namespace

Outcome start(const std::string& program, const std::vector<std::string>& arguments,
              const std::string& input, Sink standardOutput, Sink standardError) {
  const TemporaryDirectory directory;
  const std::string out = directory.path("out"), err = directory.path("err");
  const int inFile = openFile(directory.write("in", input), O_RDONLY);
  const int outFile = openOutput(standardOutput, out);
  const int errFile = openOutput(standardError, err);
  const pid_t child = fork();
  if (child == 0) {
    const bool own = program.find('/') == std::string::npos;
    become(own ? XQUERY_BINARY_DIR "/" + program : program, arguments, inFile, outFile, errFile);
  }
  for (const int file : {inFile, outFile, errFile}) close(file);

  Outcome outcome;
  int status = 0;
  rusage usage = {};
  wait4(child, &status, 0, &usage);
  const auto seconds = [](const timeval& time) {
    return static_cast<double>(time.tv_sec) + 1e-6 * static_cast<double>(time.tv_usec);
  };
  outcome.processorSeconds = seconds(usage.ru_utime) + seconds(usage.ru_stime);
  outcome.mostMemory = static_cast<size_t>(usage.ru_maxrss) * 1024;
  outcome.status = WIFEXITED(status) ? WEXITSTATUS(status) : -WTERMSIG(status);
  outcome.out = readFile(out);
  outcome.err = readFile(err);
  return outcome;
}

Outcome xquery(const std::vector<std::string>& arguments, const std::string& input) {
  return start("xquery", arguments, input);
}

Outcome shell(const std::string& script, const std::vector<std::string>& arguments) {
  std::vector<std::string> all{"-c", script, XQUERY_BINARY_DIR "/xquery"};
  all.insert(all.end(), arguments.begin(), arguments.end());
  return start("/bin/sh", all);
}

std::string waitUntil(const std::string& condition) {
  return "n=0; until " + condition + " || [ $n -gt 3000 ]; do sleep 0.01; n=$((n + 1)); done; ";
}

std::string withoutPlaces(const std::string& err) {
  std::string result;
  for (size_t at = 0; at < err.size();) {
    const size_t end = std::min(err.find('\n', at), err.size() - 1) + 1;
    if (err.compare(at, 2, "  ") != 0) result += err.substr(at, end - at);
    at = end;
  }
  return result;
}

TemporaryDirectory::TemporaryDirectory() {
  std::string name = (std::filesystem::temp_directory_path() / "xquery-test-XXXXXX").string();
  if (!mkdtemp(name.data())) throw std::runtime_error("cannot make a directory");
  _path = name;
}

TemporaryDirectory::~TemporaryDirectory() {
  std::error_code ignored;
  std::filesystem::remove_all(_path, ignored);
}

std::string TemporaryDirectory::write(const std::string& name, const std::string& text) const {
  std::ofstream(_path / name, std::ios::binary) << text;
  return path(name);
}

std::string readFile(const std::string& path) {
  std::ifstream file(path, std::ios::binary);
  return {std::istreambuf_iterator<char>(file), {}};
}

std::string books() {
  return XQUERY_SOURCE_DIR "/examples/books.xml";
}

}  // namespace command
