// Interned names of the XML tree, one table for the process.
//
// A name is created on first use and freed when its last holder lets go of it; the holders are the
// trees that use it, at one count each, and the handles of compiled queries. So a comparison of
// names is a comparison of pointers, and documents full of unusual names leave nothing behind.
#pragma once

#include "xquery/XMLNode.h"

#include <utility>
#include <vector>

namespace xquery {

// A namespace URI is shared by the expanded names in it, since a document may put very many names
// into one namespace with a very long URI.
struct NSXMLNamespaceURI;

struct NSXMLExpandedName {
  const NSXMLNamespaceURI* URI;  // null for no namespace
  uint32_t references;
  NSStringView localName;
  uint64_t hash;
};

NSStringView NSXMLURIOf(const NSXMLExpandedName& name);

inline NSStringView NSXMLPrefixOf(const NSXMLName& name) {
  return name.text.substring(0, name.prefixLength);
}

// Each answers a name with one count more, which the caller owns. The first colon of a qualified
// name separates its prefix; one at either end is part of the local name.
const NSXMLName* NSXMLInternName(NSStringView qualifiedName, NSStringView URI);
const NSXMLExpandedName* NSXMLInternExpandedName(NSStringView localName, NSStringView URI);

void NSXMLRetainName(const NSXMLName* name);
void NSXMLRetainName(const NSXMLExpandedName* name);
void NSXMLReleaseName(const NSXMLName* name);
void NSXMLReleaseName(const NSXMLExpandedName* name);

// Many at once, for who takes them in advance.
void NSXMLAddReferences(const NSXMLName* name, uint32_t count);
void NSXMLRemoveReferences(const NSXMLName* name, uint32_t count);

// An interned expanded name. The returned pointer stays valid while a handle to it lives.
class NSXMLExpandedNameRef {
 public:
  NSXMLExpandedNameRef() = default;
  // An empty URI is no namespace.
  NSXMLExpandedNameRef(NSStringView URI, NSStringView localName);
  // Another handle to a name that somebody has one to, or a node carries.
  explicit NSXMLExpandedNameRef(const NSXMLExpandedName* name);
  NSXMLExpandedNameRef(const NSXMLExpandedNameRef& other);
  NSXMLExpandedNameRef(NSXMLExpandedNameRef&& other) noexcept;
  NSXMLExpandedNameRef& operator=(NSXMLExpandedNameRef other) noexcept;
  ~NSXMLExpandedNameRef();
  const NSXMLExpandedName* get() const { return _name; }
  explicit operator bool() const { return _name != nullptr; }

 private:
  const NSXMLExpandedName* _name = nullptr;
};

// A count of a qualified name, or null.
class NSXMLNameRef {
 public:
  NSXMLNameRef() = default;
  NSXMLNameRef(NSStringView qualifiedName, NSStringView URI)
      : _name(NSXMLInternName(qualifiedName, URI)) {}
  NSXMLNameRef(const NSXMLNameRef& other) : _name(other._name) {
    if (_name) NSXMLRetainName(_name);
  }
  NSXMLNameRef(NSXMLNameRef&& other) noexcept : _name(std::exchange(other._name, nullptr)) {}
  NSXMLNameRef& operator=(NSXMLNameRef other) noexcept {
    std::swap(_name, other._name);
    return *this;
  }
  ~NSXMLNameRef() {
    if (_name) NSXMLReleaseName(_name);
  }
  const NSXMLName* get() const { return _name; }
  const NSXMLName* operator->() const { return _name; }
  explicit operator bool() const { return _name != nullptr; }
  // Gives up the count without releasing it.
  const NSXMLName* detach() { return std::exchange(_name, nullptr); }

 private:
  const NSXMLName* _name = nullptr;
};

// A set of names, as a tree keeps it; the counts are the user's affair. Few names are a list that
// is searched, more are a table of 2^n places at most half full.
class NSXMLNameSet {
 public:
  size_t count() const { return _count; }
  bool contains(const NSXMLName* name) const;
  // Whether it was not there yet.
  bool insert(const NSXMLName* name);
  template <class Function>
  void forEach(Function function) const {
    for (const NSXMLName* name : _places) {
      if (name) function(name);
    }
  }
  // Up to so many, which leave the set; after that it is good for nothing but going over the
  // others.
  template <class Function>
  void takeOut(size_t most, Function function) {
    for (; most && !_places.empty(); _places.pop_back()) {
      if (!_places.back()) continue;
      function(_places.back());
      --_count;
      --most;
    }
  }

 private:
  static constexpr size_t longestList = 8;
  bool isList() const { return _count <= longestList; }
  size_t placeOf(const NSXMLName* name) const;
  void grow();

  std::vector<const NSXMLName*> _places;
  size_t _count = 0;
};

// How many names and URIs are alive in the process.
size_t NSXMLInternedNameCount();

}  // namespace xquery
