// What --profile asks for: where the time of all evaluations together went, written to a file.
#pragma once

#include "Options.h"
#include "Timing.h"
#include "xquery/xquery.h"

#include <cstdint>
#include <mutex>

namespace cli {

class Profile {
 public:
  // Throws Failure where the file could not be written, before anything is evaluated.
  Profile(const Options& options, const xquery::XQuery& query);

  // What has been evaluated in a context; by any thread, once for each context.
  void add(const xquery::XQueryContext& context, bool hasFailed);
  // Writes the file, which is replaced by a complete profile or not at all; where nothing was
  // evaluated it stays what it was. Once only: later calls do nothing. Throws Failure.
  void write(const Phases& phases);
  // The same where something else has failed: reports what it cannot do, and throws nothing.
  void writeAnyway(const Phases& phases);

 private:
  const Options& _options;
  const std::string _path;
  std::mutex _mutex;
  xquery::XQueryProfile _profile;
  uint64_t _inputs = 0;
  uint64_t _failures = 0;
  bool _isWritten = false;
};

}  // namespace cli
