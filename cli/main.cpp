// The xquery command.
#include "Options.h"
#include "Run.h"
#include "Signals.h"
#include "Stack.h"
#include "Streams.h"

int main(int argc, char** argv) {
  cli::takeLargeStack(argv);
  cli::prepareStandardStreams();
  cli::Options options;
  if (const auto status = cli::parseOptions(argc, argv, options)) return *status;
  cli::Status status = cli::StatusInput;
  cli::handleSignals();
  if (!cli::runOnLargeStack([&] { status = cli::run(options); })) {
    cli::writeMessage("xquery: cannot start a thread\n");
  }
  return status;
}
