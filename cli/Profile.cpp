#include "Profile.h"

#include "Documents.h"
#include "Output.h"
#include "Places.h"
#include "Reports.h"
#include "Streams.h"

#include <filesystem>
#include <sys/resource.h>
#include <system_error>

namespace cli {
namespace {

using namespace xquery;

[[noreturn]] void failToWrite(const std::string& path, const std::string& reason) {
  throw Failure{StatusInput, "xquery: cannot write " + path + ": " + reason, {}};
}

// A pipe would be opened for its reader.
bool mayBeOpenedTwice(const std::string& path) {
  std::error_code unknown;
  const auto type = std::filesystem::status(path, unknown).type();
  return type == std::filesystem::file_type::not_found ||
         type == std::filesystem::file_type::regular ||
         type == std::filesystem::file_type::directory;
}

XQueryProfileFormat formatFor(const std::string& path) {
  if (path.ends_with(".json")) return XQueryProfileFormat::JSON;
  return path.ends_with(".html") ? XQueryProfileFormat::HTML : XQueryProfileFormat::Text;
}

uint64_t memoryPeak() {
  rusage usage;
  getrusage(RUSAGE_SELF, &usage);
  return static_cast<uint64_t>(usage.ru_maxrss) * 1024;
}

}  // namespace

Profile::Profile(const Options& options, const XQuery& query)
    : _options(options), _path(*options.profileFile), _profile(query) {
  if (!mayBeOpenedTwice(_path)) return;
  Output trial;
  if (!trial.open(_path)) failToWrite(_path, trial.error());
}

void Profile::add(const XQueryContext& context, bool hasFailed) {
  const std::lock_guard lock(_mutex);
  if (!_profile.add(context)) return;
  ++_inputs;
  _failures += hasFailed ? 1 : 0;
}

void Profile::write(const Phases& phases) {
  const std::lock_guard lock(_mutex);
  if (_isWritten || _profile.evaluations() == 0) return;
  _isWritten = true;
  XQueryProfileSurroundings surroundings;
  surroundings.name = queryName(_options);
  surroundings.reading = phases.parse.sum();
  surroundings.printing = phases.print.sum();
  if (_options.hasInputs()) surroundings.inputs = _inputs;
  surroundings.failures = _failures;
  surroundings.memoryPeak = memoryPeak();
  const std::string text = _profile.describe(formatFor(_path), surroundings);
  Output output;
  if (!output.open(_path) || !output.append(text) || !output.finish()) {
    failToWrite(_path, output.error());
  }
}

void Profile::writeAnyway(const Phases& phases) {
  try {
    write(phases);
  } catch (const Failure& failure) {
    writeMessage(report(_options, failure));
  }
}

}  // namespace cli
