// The tables of interned names: URIs, expanded names (URI, local name), qualified names as written.
//
// Each table is split into shards, each with a lock of its own, and a shard is looked up by text. A
// name holds its expanded name, which holds its URI. The last count is given up under the lock of
// the shard, so that a name found there under the lock is alive; counts above one change without
// it. Hashes are keyed: whoever writes a document cannot choose names that collide.
#include "Platform/Tree/Names.h"

#include "Platform/Base/KeyedHash.h"
#include "Platform/Base/RangeMemory.h"
#include "Platform/Tree/Credit.h"

#include <algorithm>
#include <array>
#include <cstdlib>
#include <mutex>
#include <new>
#include <unordered_set>

namespace xquery {

struct NSXMLNamespaceURI {
  uint32_t references;
  NSStringView text;
  uint64_t hash;
};

namespace {

// --- hashing ---------------------------------------------------------------------------------

uint64_t hashText(NSStringView text, uint64_t start) {
  const HashSecrets& secrets = hashSecrets();
  const size_t size = size_t{text.length()} * (text.isWide() ? sizeof(char16_t) : 1);
  const char* bytes =
      text.isWide() ? reinterpret_cast<const char*>(text.wideUnits()) : text.asciiUnits();
  uint64_t hash = mixedHash(secrets, secrets.start, start, size);
  for (size_t at = 0; at < size; at += sizeof(uint64_t)) {
    uint64_t word = 0;
    std::memcpy(&word, bytes + at, size - at < sizeof word ? size - at : sizeof word);
    hash = mixedHash(secrets, hash, word, 0);
  }
  return hash;
}

// Names are kept in 8-bit form whenever they fit it, so equal names have equal bytes.
class NarrowText {
 public:
  explicit NarrowText(NSStringView text) : _view(text) {
    if (!text.isWide()) return;
    for (uint32_t index = 0; index < text.length(); ++index) {
      if (text.wideUnits()[index] >= 0x80) return;
    }
    _bytes.assign(text.wideUnits(), text.wideUnits() + text.length());
    _view = NSStringView::ascii(_bytes);
  }
  NSStringView view() const { return _view; }

 private:
  std::string _bytes;
  NSStringView _view;
};

// --- keys ------------------------------------------------------------------------------------

struct URIKey {
  explicit URIKey(NSStringView URI) : text(URI), hash(hashText(URI, 0)) {}
  bool matches(const NSXMLNamespaceURI& entry) const { return text.equals(entry.text); }
  NSStringView text;
  uint64_t hash;
};

struct ExpandedKey {
  ExpandedKey(NSStringView localName, NSStringView namespaceURI)
      : text(localName), URI(namespaceURI), hash(hashText(localName, hashText(namespaceURI, 1))) {}
  bool matches(const NSXMLExpandedName& entry) const {
    return text.equals(entry.localName) && URI.equals(NSXMLURIOf(entry));
  }
  NSStringView text;
  NSStringView URI;
  uint64_t hash;
};

struct NameKey {
  NameKey(NSStringView qualifiedName, NSStringView namespaceURI)
      : text(qualifiedName),
        URI(namespaceURI),
        hash(hashText(qualifiedName, hashText(namespaceURI, 2))) {}
  bool matches(const NSXMLName& entry) const {
    return text.equals(entry.text) && URI.equals(NSXMLURIOf(*entry.expanded));
  }
  NSStringView text;
  NSStringView URI;
  uint64_t hash;
};

// --- tables ----------------------------------------------------------------------------------

// Nodes refer to qualified names by their places in the range.
template <class Entry>
constexpr bool isInRange = std::is_same_v<Entry, NSXMLName>;

// An entry and its text are one block.
template <class Entry>
Entry* allocateEntry(NSStringView text, NSStringView Entry::*textField) {
  const size_t bytes = size_t{text.length()} * (text.isWide() ? sizeof(char16_t) : 1);
  void* memory = isInRange<Entry> ? takeRangeBlock(sizeof(Entry) + bytes).address
                                  : std::malloc(sizeof(Entry) + bytes);
  if (!memory) throw std::bad_alloc();
  auto* entry = ::new (memory) Entry();
  void* copy = entry + 1;
  if (text.isWide()) {
    std::memcpy(copy, text.wideUnits(), bytes);
    entry->*textField = NSStringView(static_cast<const char16_t*>(copy), text.length());
  } else {
    if (bytes) std::memcpy(copy, text.asciiUnits(), bytes);
    entry->*textField = NSStringView(static_cast<const char*>(copy), text.length());
  }
  return entry;
}

// With the counts it holds on its parts, as far as it has any.
void freeEntry(NSXMLNamespaceURI* entry);
void freeEntry(NSXMLExpandedName* entry);
void freeEntry(NSXMLName* entry);

template <class Entry, class Key>
class InternTable {
 public:
  // `allocate` makes an entry from the key, `fill` interns its own parts. Where there is no memory
  // nothing is left of it.
  template <class Allocate, class Fill>
  Entry* intern(const Key& key, Allocate allocate, Fill fill) {
    Shard& shard = shardOf(key.hash);
    const std::lock_guard<std::mutex> guard(shard.mutex);
    if (const auto found = shard.entries.find(key); found != shard.entries.end()) {
      retain(*found);
      return *found;
    }
    Entry* entry = allocate(key);
    entry->references = 1;
    entry->hash = key.hash;
    try {
      fill(*entry, key);
      shard.entries.insert(entry);
    } catch (...) {
      freeEntry(entry);
      throw;
    }
    return entry;
  }

  static void retain(Entry* entry, uint32_t times = 1) {
    __atomic_fetch_add(&entry->references, times, __ATOMIC_RELAXED);
  }

  // Whether the last count was given up; the entry has then left the table and the caller frees it.
  bool release(Entry* entry, uint32_t times = 1) {
    uint32_t count = __atomic_load_n(&entry->references, __ATOMIC_RELAXED);
    while (count > times) {
      if (__atomic_compare_exchange_n(&entry->references, &count, count - times, true,
                                      __ATOMIC_RELEASE, __ATOMIC_RELAXED)) {
        return false;
      }
    }
    Shard& shard = shardOf(entry->hash);
    const std::lock_guard<std::mutex> guard(shard.mutex);
    if (__atomic_sub_fetch(&entry->references, times, __ATOMIC_ACQ_REL) != 0) return false;
    shard.entries.erase(shard.entries.find(entry));
    return true;
  }

  size_t count() {
    size_t sum = 0;
    for (Shard& shard : _shards) {
      const std::lock_guard<std::mutex> guard(shard.mutex);
      sum += shard.entries.size();
    }
    return sum;
  }

 private:
  struct Hash {
    using is_transparent = void;
    size_t operator()(const Entry* entry) const { return entry->hash; }
    size_t operator()(const Key& key) const { return key.hash; }
  };
  struct Equal {
    using is_transparent = void;
    bool operator()(const Entry* a, const Entry* b) const { return a == b; }
    bool operator()(const Key& key, const Entry* entry) const {
      return key.hash == entry->hash && key.matches(*entry);
    }
    bool operator()(const Entry* entry, const Key& key) const { return (*this)(key, entry); }
  };
  struct Shard {
    std::mutex mutex;
    std::unordered_set<Entry*, Hash, Equal> entries;
  };
  static constexpr size_t shardCount = 16;
  Shard& shardOf(uint64_t hash) { return _shards[(hash >> 56) % shardCount]; }

  std::array<Shard, shardCount> _shards;
};

struct Tables {
  InternTable<NSXMLNamespaceURI, URIKey> URIs;
  InternTable<NSXMLExpandedName, ExpandedKey> expandedNames;
  InternTable<NSXMLName, NameKey> names;
};

Tables& tables() {
  // Never destroyed: trees may be freed by destructors that run at exit.
  alignas(Tables) static unsigned char storage[sizeof(Tables)];
  static Tables* const shared = ::new (storage) Tables;
  return *shared;
}

const NSXMLNamespaceURI* internURI(NSStringView URI) {
  if (URI.isEmpty()) return nullptr;
  return tables().URIs.intern(
      URIKey(URI),
      [](const URIKey& key) {
        return allocateEntry<NSXMLNamespaceURI>(key.text, &NSXMLNamespaceURI::text);
      },
      [](NSXMLNamespaceURI&, const URIKey&) {});
}

// The tables hand out constant names; only the counts in them change.
template <class Entry>
Entry* counted(const Entry* entry) {
  return const_cast<Entry*>(entry);
}

void freeEntry(NSXMLNamespaceURI* entry) {
  std::free(entry);
}

void freeEntry(NSXMLExpandedName* entry) {
  if (entry->URI && tables().URIs.release(counted(entry->URI))) freeEntry(counted(entry->URI));
  std::free(entry);
}

void freeEntry(NSXMLName* entry) {
  if (entry->expanded) NSXMLReleaseName(entry->expanded);
  giveRangeBlock(entry);
}

const NSXMLExpandedName* internNarrowExpandedName(NSStringView localName, NSStringView URI) {
  return tables().expandedNames.intern(
      ExpandedKey(localName, URI),
      [](const ExpandedKey& key) {
        return allocateEntry<NSXMLExpandedName>(key.text, &NSXMLExpandedName::localName);
      },
      [](NSXMLExpandedName& entry, const ExpandedKey& key) { entry.URI = internURI(key.URI); });
}

uint32_t prefixLengthOf(NSStringView qualifiedName) {
  const uint32_t colon = qualifiedName.find(u':');
  return colon == NSStringView::notFound || colon + 1 == qualifiedName.length() ? 0 : colon;
}

}  // namespace

NSStringView NSXMLURIOf(const NSXMLExpandedName& name) {
  return name.URI ? name.URI->text : NSStringView();
}

const NSXMLExpandedName* NSXMLInternExpandedName(NSStringView localName, NSStringView URI) {
  return internNarrowExpandedName(NarrowText(localName).view(), NarrowText(URI).view());
}

const NSXMLName* NSXMLInternName(NSStringView qualifiedName, NSStringView URI) {
  const NarrowText narrowName(qualifiedName);
  const NarrowText narrowURI(URI);
  return tables().names.intern(
      NameKey(narrowName.view(), narrowURI.view()),
      [](const NameKey& key) { return allocateEntry<NSXMLName>(key.text, &NSXMLName::text); },
      [](NSXMLName& entry, const NameKey& key) {
        entry.prefixLength = prefixLengthOf(key.text);
        // A local name may fit the 8-bit form where its prefix does not.
        const NSStringView localName =
            entry.prefixLength ? key.text.substring(entry.prefixLength + 1) : key.text;
        entry.expanded = internNarrowExpandedName(NarrowText(localName).view(), key.URI);
      });
}

void NSXMLAddReferences(const NSXMLName* name, uint32_t count) {
  InternTable<NSXMLName, NameKey>::retain(counted(name), count);
}

void NSXMLRetainName(const NSXMLName* name) {
  if (!NSXMLCredit::retain(name)) NSXMLAddReferences(name, 1);
}

void NSXMLRetainName(const NSXMLExpandedName* name) {
  InternTable<NSXMLExpandedName, ExpandedKey>::retain(counted(name));
}

void NSXMLReleaseName(const NSXMLExpandedName* name) {
  if (tables().expandedNames.release(counted(name))) freeEntry(counted(name));
}

void NSXMLReleaseName(const NSXMLName* name) {
  if (!NSXMLCredit::release(name)) NSXMLRemoveReferences(name, 1);
}

void NSXMLRemoveReferences(const NSXMLName* name, uint32_t count) {
  if (tables().names.release(counted(name), count)) freeEntry(counted(name));
}

size_t NSXMLInternedNameCount() {
  return tables().URIs.count() + tables().expandedNames.count() + tables().names.count();
}

// --- sets of names ---------------------------------------------------------------------------

// The name's own place, or the empty one where it belongs.
size_t NSXMLNameSet::placeOf(const NSXMLName* name) const {
  const size_t mask = _places.size() - 1;
  size_t place = name->hash & mask;
  while (_places[place] && _places[place] != name) place = (place + 1) & mask;
  return place;
}

bool NSXMLNameSet::contains(const NSXMLName* name) const {
  if (!isList()) return _places[placeOf(name)] != nullptr;
  return std::find(_places.begin(), _places.end(), name) != _places.end();
}

bool NSXMLNameSet::insert(const NSXMLName* name) {
  if (contains(name)) return false;
  if (_count < longestList) {
    _places.push_back(name);
    ++_count;
    return true;
  }
  if (_count == longestList || (_count + 1) * 2 > _places.size()) grow();
  _places[placeOf(name)] = name;
  ++_count;
  return true;
}

void NSXMLNameSet::grow() {
  std::vector<const NSXMLName*> old(isList() ? longestList * 4 : _places.size() * 2);
  old.swap(_places);
  for (const NSXMLName* name : old) {
    if (name) _places[placeOf(name)] = name;
  }
}

// --- handles ---------------------------------------------------------------------------------

NSXMLExpandedNameRef::NSXMLExpandedNameRef(NSStringView URI, NSStringView localName)
    : _name(NSXMLInternExpandedName(localName, URI)) {}

NSXMLExpandedNameRef::NSXMLExpandedNameRef(const NSXMLExpandedName* name) : _name(name) {
  if (_name) NSXMLRetainName(_name);
}

NSXMLExpandedNameRef::NSXMLExpandedNameRef(const NSXMLExpandedNameRef& other)
    : NSXMLExpandedNameRef(other._name) {}

NSXMLExpandedNameRef::NSXMLExpandedNameRef(NSXMLExpandedNameRef&& other) noexcept
    : _name(std::exchange(other._name, nullptr)) {}

NSXMLExpandedNameRef& NSXMLExpandedNameRef::operator=(NSXMLExpandedNameRef other) noexcept {
  std::swap(_name, other._name);
  return *this;
}

NSXMLExpandedNameRef::~NSXMLExpandedNameRef() {
  if (_name) NSXMLReleaseName(_name);
}

}  // namespace xquery
