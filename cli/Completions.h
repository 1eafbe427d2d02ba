// What shells offer for a command line that is being typed.
#pragma once

#include <optional>
#include <string>

namespace cli {

// The script for bash, zsh or fish, made from the table of options; nothing for another shell.
std::optional<std::string> completions(const std::string& shell);

}  // namespace cli
