// The page about the command and the completions of shells know the same options as the help.
#include "cli/Command.h"
#include "cli/OptionsTable.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>
#include <sstream>

using command::Outcome;
using command::TemporaryDirectory;
using testing::HasSubstr;

namespace {

std::string page() {
  return command::readFile(XQUERY_SOURCE_DIR "/docs/command.md");
}

TEST(CommandPage, NamesEveryOption) {
  const std::string text = page(), help = command::xquery({"--help"}).out;
  for (const cli::OptionRow& row : cli::optionRows()) {
    const bool isChoice = row.offers == cli::Offers::Words && row.takes == cli::Takes::Value;
    const std::string value = isChoice ? cli::words(row).front() : row.value;
    const bool hasValue = row.takes == cli::Takes::Value || row.takes == cli::Takes::Values;
    EXPECT_THAT(text, HasSubstr(std::string("`") + row.name + (hasValue ? " " + value : "")));
    EXPECT_THAT(help, HasSubstr(std::string("  ") + row.name));
  }
}

TEST(CommandPage, HasExamplesThatSucceed) {
  std::istringstream lines(page());
  int count = 0;
  for (std::string line; std::getline(lines, line);) {
    const size_t at = line.find("xquery --"), other = line.find("xquery -e");
    const size_t start = std::min(at, other);
    if (start == line.npos || line.find('`') != line.npos) continue;
    const std::string script = "cd '" XQUERY_SOURCE_DIR "' && " + line.substr(0, start) +
                               XQUERY_BINARY_DIR "/" + line.substr(start) + " > /dev/null";
    EXPECT_EQ(std::system(script.c_str()), 0) << line;
    ++count;
  }
  EXPECT_EQ(count, 5);
}

TEST(Completions, NameEveryOption) {
  for (const std::string shell : {"bash", "zsh", "fish"}) {
    const Outcome outcome = command::xquery({"--completions", shell});
    EXPECT_EQ(outcome.status, 0);
    for (const cli::OptionRow& row : cli::optionRows()) {
      const std::string name = row.name;
      const std::string inFish = (name[1] == '-' ? "-l " + name.substr(2) : "-s " + name.substr(1));
      EXPECT_THAT(outcome.out, HasSubstr(shell == "fish" ? inFish + " " : name)) << shell;
    }
  }
  EXPECT_EQ(command::xquery({"--completions", "csh"}).status, 2);
}

TEST(Completions, OfferWhatFitsInBash) {
  const TemporaryDirectory directory;
  const std::string file = directory.write("c", command::xquery({"--completions", "bash"}).out);
  const std::string script =
      ". \"$0\"; COMP_WORDS=(xquery --as j); COMP_CWORD=2; _xquery; echo ${COMPREPLY[*]}; "
      "COMP_WORDS=(xquery --files); COMP_CWORD=1; _xquery; echo ${COMPREPLY[*]}";
  EXPECT_EQ(command::start("/bin/bash", {"-c", script, file}).out, "json\n--files-from\n");
  // Bash breaks words at "=", unless it was told not to.
  const std::pair<const char*, const char*> words[] = {
      {"xquery --as = h", "html"},       {"xquery --as =", "lines xml html json text"},
      {"xquery --plan = j", "json"},     {"xquery --color = al", "always"},
      {"xquery --as=js", "--as=json"},   {"xquery --plan=d", "--plan=dot"},
      {"xquery --plan --pla", "--plan"}, {"xquery --files-from = /etc/host", "/etc/hostname"},
      {"xquery --allow = /et", "/etc"}};
  for (const auto& [typed, offered] : words) {
    const std::string one = ". \"$0\"; COMP_WORDS=(" + std::string(typed) +
                            "); COMP_CWORD=$((${#COMP_WORDS[@]} - 1)); _xquery; "
                            "echo ${COMPREPLY[*]}";
    EXPECT_THAT(command::start("/bin/bash", {"-c", one, file}).out, HasSubstr(offered)) << typed;
  }
}

}  // namespace
