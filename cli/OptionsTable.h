// Every option of the command, one row each: the command line is read by this table, and the help
// and the completions of shells are made from it.
#pragma once

#include "Options.h"

#include <span>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

namespace cli {

// What an option is given that it cannot take; the message begins with the option's name.
struct WrongUsage : std::runtime_error {
  using std::runtime_error::runtime_error;
};

enum class Takes {
  Nothing,
  Value,      // once
  Values,     // as often as one likes, one each time
  MaybeValue  // after "=", one of several words; without it the first of them
};

// What a shell offers as a value.
enum class Offers { Nothing, Words, Files, Folders };

struct OptionRow {
  const char* group;
  const char* name;
  Takes takes;
  const char* value;  // as the help names it; the words of Offers::Words with "|" between
  Offers offers;
  const char* help;
  // Throws WrongUsage.
  void (*apply)(const OptionRow& row, const std::string& value, Options& options);
};

std::span<const OptionRow> optionRows();

// The words that a row with Offers::Words takes.
std::vector<std::string> words(const OptionRow& row);

}  // namespace cli
