#include "Platform/Tree/TreeExtra.h"

#include <algorithm>
#include <memory>
#include <new>

namespace xquery {

// --- lists ---------------------------------------------------------------------------------------

namespace {

size_t bytesOfList(uint32_t capacity) {
  return sizeof(NSXMLNameList) + capacity * sizeof(const NSXMLName*);
}

}  // namespace

NSXMLNameList* NSXMLNameList::create(uint32_t capacity) {
  return ::new (NSCounted::operator new(bytesOfList(capacity))) NSXMLNameList{0, capacity};
}

void NSXMLNameList::destroy(NSXMLNameList* list) {
  NSCounted::operator delete(list, bytesOfList(list->capacity));
}

bool NSXMLNameList::contains(const NSXMLName* name) {
  return std::find(begin(), end(), name) != end();
}

void NSXMLTree::setNameList(NSXMLNameList* list) {
  _extra = reinterpret_cast<uintptr_t>(list) | listTag;
}

// Of the name as written and of its expanded name: the entry, its text, its place in the table.
void NSXMLTreeExtra::insert(const NSXMLName* name) {
  constexpr size_t bytesOfAPlace = 64;
  const size_t bytes = sizeof(NSXMLName) + sizeof(NSXMLExpandedName) + 2 * bytesOfAPlace +
                       name->text.length() + name->expanded->localName.length();
  names.insert(name);
  _nameBytes += bytes;
  countValueBytes(bytes);
}

// --- the names of a tree -------------------------------------------------------------------------

NSXMLTreeExtra& NSXMLTree::makeExtra() {
  if (NSXMLTreeExtra* present = extra()) return *present;
  auto made = std::make_unique<NSXMLTreeExtra>();
  forEachName([&](const NSXMLName* name) { made->insert(name); });
  freeExtra();
  _extra = reinterpret_cast<uintptr_t>(made.get());
  return *made.release();
}

void NSXMLTree::freeExtra() {
  if (NSXMLNameList* list = nameList()) NSXMLNameList::destroy(list);
  const std::unique_ptr<NSXMLTreeExtra> owned(extra());
  _extra = 0;
}

void NSXMLTree::adopt(const NSXMLName* name) {
  if (_extra == 0) {
    _extra = reinterpret_cast<uintptr_t>(name) | nameTag;
    return;
  }
  if (holds(name)) {
    NSXMLReleaseName(name);
    return;
  }
  NSXMLNameList* list = nameList();
  const bool isListFull = list && list->count == list->capacity;
  if (extra() || (isListFull && list->capacity == NSXMLNameList::longest)) {
    makeExtra().insert(name);
    return;
  }
  if (!list || isListFull) {
    NSXMLNameList* longer =
        NSXMLNameList::create(list ? list->capacity * 2 + 1 : NSXMLNameList::shortest);
    forEachName([&](const NSXMLName* each) { longer->begin()[longer->count++] = each; });
    freeExtra();
    setNameList(list = longer);
  }
  list->begin()[list->count++] = name;
}

bool NSXMLTree::holds(const NSXMLName* name) const {
  if (NSXMLNameList* list = nameList()) return list->contains(name);
  if (const NSXMLTreeExtra* present = extra()) return present->names.contains(name);
  return singleName() == name;
}

void NSXMLTree::use(const NSXMLName* name) {
  if (holds(name)) return;
  NSXMLRetainName(name);
  adopt(name);
}

void NSXMLTree::absorbExtra(NSXMLTree* smaller) {
  // The larger set of names takes in the smaller one.
  const NSXMLTreeExtra* theirs = smaller->extra();
  const NSXMLTreeExtra* ours = extra();
  if (theirs && (!ours || theirs->names.count() > ours->names.count())) {
    std::swap(_extra, smaller->_extra);
  }
  smaller->forEachName([this](const NSXMLName* name) { adopt(name); });
  if (const NSXMLTreeExtra* rest = smaller->extra(); rest && !rest->documents.empty()) {
    auto& documents = makeExtra().documents;
    documents.insert(documents.end(), rest->documents.begin(), rest->documents.end());
  }
  smaller->freeExtra();
}

}  // namespace xquery
