#include "Completions.h"

#include "OptionsTable.h"

#include <cstring>

namespace cli {
namespace {

// Within single quotes of a shell.
std::string quoted(const std::string& text) {
  std::string result = "'";
  for (const char byte : text) result += byte == '\'' ? std::string("'\\''") : std::string(1, byte);
  return result + "'";
}

std::string joined(const std::vector<std::string>& words) {
  std::string text;
  for (const std::string& word : words) text += (text.empty() ? "" : " ") + word;
  return text;
}

bool isLong(const OptionRow& row) {
  return std::strncmp(row.name, "--", 2) == 0;
}

std::string forBash() {
  std::string names = "--help --version", cases;
  for (const OptionRow& row : optionRows()) {
    names += std::string(" ") + row.name;
    if (row.takes == Takes::Nothing) continue;
    std::string action = "return";
    if (row.offers == Offers::Words) {
      action = "COMPREPLY=($(compgen -P \"$lead\" -W '" + joined(words(row)) +
               "' -- \"$word\")); return";
    } else if (row.offers == Offers::Files) {
      action = "mapfile -t COMPREPLY < <(compgen -P \"$lead\" -f -- \"${word#*=}\"); return";
    } else if (row.offers == Offers::Folders) {
      action = "mapfile -t COMPREPLY < <(compgen -P \"$lead\" -d -- \"$word\"); return";
    }
    // What may be left out stands behind "=" alone.
    const std::string name = row.name, apart = row.takes == Takes::MaybeValue ? "" : name + "|";
    cases += "    " + apart + name + "=) " + action + " ;;\n";
  }
  // Bash takes "=" for a word of its own, where it is one of those that break words.
  return "_xquery() {\n"
         "  local word=${COMP_WORDS[COMP_CWORD]} before=${COMP_WORDS[COMP_CWORD-1]} lead=\n"
         "  COMPREPLY=()\n"
         "  if [[ $word == = ]]; then\n"
         "    word= before=$before=\n"
         "  elif [[ $before == = ]]; then\n"
         "    before=${COMP_WORDS[COMP_CWORD-2]}=\n"
         "  elif [[ $word == --*=* ]]; then\n"
         "    before=${word%%=*}= lead=${word%%=*}= word=${word#*=}\n"
         "  fi\n"
         "  case $before in\n" +
         cases +
         "  esac\n"
         "  if [[ $word == -* ]]; then\n"
         "    COMPREPLY=($(compgen -W '" +
         names +
         "' -- \"$word\"))\n"
         "  else\n"
         "    mapfile -t COMPREPLY < <(compgen -f -- \"$word\")\n"
         "  fi\n"
         "}\n"
         "complete -o filenames -F _xquery xquery\n";
}

// "--as[help]:value:(lines xml)"
std::string zshSpecification(const OptionRow& row) {
  std::string help;
  for (const char byte : std::string(row.help)) {
    if (byte == '[' || byte == ']' || byte == '\\') help += '\\';
    help += byte;
  }
  std::string text = row.takes == Takes::Values ? "*" : "";
  text += std::string(row.name) + (row.takes == Takes::MaybeValue ? "=-" : "") + "[" + help + "]";
  if (row.takes == Takes::Nothing) return text;
  text += row.takes == Takes::MaybeValue ? "::value:" : ":value:";
  if (row.offers == Offers::Words) return text + "(" + joined(words(row)) + ")";
  if (row.offers == Offers::Files) return text + "_files";
  return text + (row.offers == Offers::Folders ? "_files -/" : " ");
}

std::string forZsh() {
  std::string text = "#compdef xquery\n_arguments \\\n";
  for (const OptionRow& row : optionRows()) {
    text += "  " + quoted(zshSpecification(row)) + " \\\n";
  }
  return text + "  '--help[Print the help]' '--version[Print the version]' '*:file:_files'\n";
}

std::string forFish() {
  std::string text =
      "complete -c xquery -l help -d 'Print the help'\n"
      "complete -c xquery -l version -d 'Print the version'\n";
  for (const OptionRow& row : optionRows()) {
    text += "complete -c xquery ";
    text += isLong(row) ? std::string("-l ") + (row.name + 2) : std::string("-s ") + (row.name + 1);
    if (row.takes == Takes::Value || row.takes == Takes::Values) text += " -r";
    if (row.offers == Offers::Words) text += " -f -a " + quoted(joined(words(row)));
    if (row.offers == Offers::Folders) text += " -f -a '(__fish_complete_directories)'";
    text += " -d " + quoted(row.help) + "\n";
  }
  return text;
}

}  // namespace

std::optional<std::string> completions(const std::string& shell) {
  if (shell == "bash") return forBash();
  if (shell == "zsh") return forZsh();
  if (shell == "fish") return forFish();
  return std::nullopt;
}

}  // namespace cli
