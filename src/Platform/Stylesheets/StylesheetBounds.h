// How much libxslt is given to compile.
//
// Nothing in there can be told to stop, and much of it takes time that grows with the square of
// what it works on: each top-level variable, key and decimal format is compared with all others of
// its kind, each template is put into the list of those that match the like, each namespace in
// scope is compared with the others, each name in a list with the namespaces or with the names
// before it, text by text. What is quadratic is bounded by the product of how many and how long
// they are, the rest by its size. Within these bounds the worst kinds take some tenths of a second,
// and a stylesheet of several thousand templates and parameters is far inside.
#pragma once

#include "xquery/XMLNode.h"

#include <cstddef>
#include <cstdint>

namespace xquery {

class StylesheetBounds {
 public:
  // Of the comparisons of libxslt's, in bytes.
  static constexpr uint64_t mostComparisons = 1'000'000'000;
  // Attributes included.
  static constexpr size_t mostNodes = 500'000;
  static constexpr size_t mostBytes = size_t{8} << 20;
  static constexpr size_t mostBytesOfAttribute = size_t{64} << 10;

  // Adds a stylesheet, or a part that it includes or imports; whether all so far may be compiled.
  bool admit(const NSXMLDocument& stylesheet);

 private:
  struct Names {
    uint64_t count = 0;
    uint64_t bytes = 0;

    void add(size_t length);
    void remove(size_t length);
  };

  void open(const NSXMLElement& element);
  void close(const NSXMLElement& element);
  void addAttribute(const NSXMLElement& element, const NSXMLNode& attribute);
  bool isExceeded() const;

  Names _declarations;  // on the top level and in attribute sets
  Names _scope;         // namespace declarations of the elements that are open
  Names _widestScope;
  Names _listed;  // in lists of names
  size_t _nodes = 0;
  size_t _bytes = 0;
  size_t _longestAttribute = 0;
};

}  // namespace xquery
