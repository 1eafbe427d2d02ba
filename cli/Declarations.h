// The prolog of a session: what was declared stays for the queries that follow.
#pragma once

#include <cstddef>
#include <map>
#include <string>
#include <string_view>
#include <vector>

namespace cli {

class Declarations {
 public:
  // One that is known by the same name is replaced. Declarations of the language's version are not
  // kept: every query of a session is of one version.
  void add(const std::string& declaration);
  // A prolog in the order that the grammar asks for, which ends with a line feed unless it is
  // empty.
  std::string prolog() const;
  // How many lines of it stand before the query.
  size_t lines() const;

  // Names of variables, and of functions without the numbers of their parameters.
  std::vector<std::string> variables() const;
  std::vector<std::string> functions() const;
  // Prefix to URI, as far as it is declared by a plain string.
  std::map<std::string, std::string> namespaces() const;

 private:
  struct Entry {
    std::string name;
    std::string text;
  };
  static void put(std::vector<Entry>& entries, Entry entry);

  // In the order of their declaration.
  std::vector<Entry> _settings;
  std::vector<Entry> _namespaces;
  std::vector<Entry> _definitions;  // variables and functions
};

}  // namespace cli
