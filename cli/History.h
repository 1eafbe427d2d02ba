// What was entered in former sessions, in a file of the user's own.
#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace cli {

// The file is $XDG_STATE_HOME/xquery/history, or ~/.local/state/xquery/history. Each entry is a
// line of it, with "\n" for a line feed and "\\" for the mark itself. Entries are added to its end
// as they are made, so that none is lost however a session ends, and several sessions can share it.
// It is nobody else's to read. Where it cannot be read or written there is no history.
class History {
 public:
  static constexpr size_t mostEntries = 1000;
  static constexpr size_t longestEntry = size_t{64} << 10;  // bytes; longer ones are not kept
  static constexpr size_t mostBytes = size_t{8} << 20;      // of a file that is read

  History();
  // The oldest first.
  const std::vector<std::string>& entries() const { return _entries; }
  // What is entered twice in a row is kept once.
  void add(const std::string& entry);

 private:
  void read();
  // The file with the entries that are kept and no others.
  void rewrite() const;

  std::string _path;  // empty where there is no place for it
  std::vector<std::string> _entries;
};

}  // namespace cli
