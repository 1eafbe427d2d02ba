// The standard streams of the command.
#pragma once

#include <string>
#include <string_view>
#include <sys/types.h>

namespace cli {

// Called once, before anything is opened: a stream that was closed gets a place that fails to be
// read or written, so that no file of the command's own takes its number and hears its messages.
// From then on a reader that has gone away and a file that grows too large are failed writes.
void prepareStandardStreams();

// Writes all of the text. A reader that has gone away ends the process; false, with errno, for any
// other failure.
[[nodiscard]] bool writeAll(int file, std::string_view text);

// Ends the process as the signal of a closed pipe does, which is what a shell expects of a command
// whose reader had enough; without a message.
[[noreturn]] void endOfClosedPipe();

// Makes a file that must not be left behind by a process that ends so, of which there may be two at
// a time; answers its descriptor, and -1 with errno where there is one of that name. And one that
// need not be removed any more.
[[nodiscard]] int makeUntilEnd(const std::string& path, mode_t mode);
void keepAtEnd(const std::string& path);

// The terminal on standard input is left by a process that ends so as it is now.
void restoreTerminalAtEnd();

// Ends the process as the signal does that nobody handles; also from within its handler.
[[noreturn]] void endBySignal(int signal);

// Writes to standard error; what cannot be written there cannot be reported anywhere.
void writeMessage(std::string_view text);

}  // namespace cli
