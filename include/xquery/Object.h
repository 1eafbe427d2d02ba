// The base of every object a query can see or a host can hold.
//
//   NSObject          8 bytes: a word, a kind byte, a flag byte and 16 spare bits; no virtual table
//    |- NSXMLNode     lives in the arena of its tree; the word is its document-order number
//    `- NSCounted     on the heap, reference counted (the word is the count), virtual destructor
//
// A reference to a node keeps the node's whole tree alive by one counter on the tree, so holding a
// node never writes to it. Counted objects carry their own count, a plain increment while the
// process has one thread and an atomic one afterwards. Shared singletons are immortal: the top bit
// of their count is set and the count is never touched.
//
// A query value (`Value`) has one of four shapes:
//   null reference   only after an error has been recorded
//   the NSNull       the empty sequence
//   one item         a node or an atomic value
//   an NSArray       a sequence of its elements
#pragma once

#include "xquery/Export.h"

#include <cstddef>
#include <cstdint>
#include <memory>
#include <new>
#include <sys/single_threaded.h>
#include <type_traits>
#include <utility>

namespace xquery {

// The closed set of classes. Node kinds have the numbers of the tree's node kinds. A class whose
// instances may also be of a subclass tests a range or list of kinds in its `classof`.
enum class Kind : uint8_t {
  None = 0,
  Document = 1,
  Element = 2,
  Attribute = 3,
  Namespace = 4,
  ProcessingInstruction = 5,
  Comment = 6,
  Text = 7,  // last node kind

  Null = 16,
  Array,
  Sequence,  // XQuerySequence
  String,
  TypedString,  // XQueryString
  Number,
  DecimalNumber,
  TypedNumber,  // XQueryNumber
  URL,
  Data,
  Date,
  TypedDate,  // XQueryDate
  Duration,
  QName,
  Notation,
  HexBinary,
  Base64Binary,
  Error,
  QueryError,  // XQueryError
  ElementContentString,
  Query,
  Context,

  // Objects that never are items: the library's own, which a host does not meet. They stand here
  // since there is one set of numbers, so that a class is told by comparing one byte, and since the
  // compiler sees that a switch over them is complete.
  Internal = 64,
  Prolog,
  Modules,
  PrologItem,
  FunctionDecl,
  VarDecl,
  ParsedModule,
  ParserText,
  URLHandle,
  TimeZone,
  PathResults,
  Frame,  // XQueryFrame
  BuiltInFunction,
  PathStepFirst,
  AxisStep = PathStepFirst,
  FilterStep,
  RootStep,
  PathStepLast = RootStep,
  ExprFirst = 128,
  ExprList = ExprFirst,
  Args,
  Literal,
  Variable,
  ContextItemExpr,
  QNameReference,
  PathExpr,
  RootStepExpr,
  NameTest,
  WildCardNameTest,
  OperatorExpr,
  TypeDeclaration,
  ForExpr,
  Param,
  ElementExpr,
  AttributeExpr,
  NamespaceExpr,
  FunctionCall,
  ConditionalExpr,
  FLWORExpr,
  LetExpr,
  OrderSpec,
  OrderExpr,
  QuantifiedExpr,
  QuantifiedItem,
  TypeswitchExpr,
  CaseClause,
  InstanceOfExpr,
  TreatExpr,
  CastExpr,
  CastableExpr,
  ComputedAttributeExpr,
  TextExpr,
  CommentExpr,
  ProcessingInstructionExpr,
  DocumentExpr,
  PlannedExpr,  // an operator of the plan
  OtherExpr,
  ExprLast = 255,
};

constexpr bool isNodeKind(Kind kind) {
  return kind >= Kind::Document && kind <= Kind::Text;
}

class NSObject {
 public:
  NSObject(const NSObject&) = delete;
  NSObject& operator=(const NSObject&) = delete;

  Kind kind() const { return _kind; }
  bool isNode() const { return isNodeKind(_kind); }

 protected:
  explicit NSObject(Kind kind) : _kind(kind) {}
  ~NSObject() = default;

  mutable uint32_t _word = 0;
  Kind _kind;
  uint8_t _flags = 0;
  uint16_t _aux = 0;
};

template <class T>
class Ref;

// A heap object with a reference count, which `Ref` keeps: created with a count of 0, which the
// first `Ref` makes 1.
class XQUERY_EXPORT NSCounted : public NSObject {
 public:
  static bool classof(const NSObject& object) { return !object.isNode(); }

  // Blocks up to 128 bytes come from per-thread free lists.
  static void* operator new(size_t size);
  static void operator delete(void* block, size_t size) noexcept;

 protected:
  explicit NSCounted(Kind kind) : NSObject(kind) {}
  virtual ~NSCounted() = default;

 private:
  static constexpr uint32_t immortalBit = 0x80000000U;

  // In place here, since by calls copying a reference takes more than four times as long.
  void retain() const {
    const uint32_t count = __atomic_load_n(&_word, __ATOMIC_RELAXED);
    if (count & immortalBit) return;
    if (__libc_single_threaded) {
      _word = count + 1;
    } else {
      __atomic_fetch_add(&_word, 1U, __ATOMIC_RELAXED);
    }
  }

  void release() const {
    const uint32_t count = __atomic_load_n(&_word, __ATOMIC_ACQUIRE);
    if (count & immortalBit) return;
    // Who holds the only reference needs no atomic step: nobody else can count at the same time.
    if (count == 1) {
      destroy(this);
    } else if (__libc_single_threaded) {
      _word = count - 1;
    } else if (__atomic_fetch_sub(&_word, 1U, __ATOMIC_ACQ_REL) == 1) {
      destroy(this);
    }
  }

  // The retain of a reference to an object that no other thread can know yet.
  void retainNew() const { ++_word; }

  // Destruction never recurses deeply: past a fixed depth objects queue up and are destroyed in
  // turn, so that a chain of a million objects costs no stack.
  static void destroy(const NSCounted* object);

  template <class T>
  friend class Ref;
  friend struct NSCounting;
};

class NSXMLNode;
XQUERY_EXPORT void retainTreeOf(const NSXMLNode* node);
XQUERY_EXPORT void releaseTreeOf(const NSXMLNode* node);
// For each of the nodes; those of one tree in a row are counted together.
XQUERY_EXPORT void releaseTreesOf(const NSXMLNode* const* nodes, size_t count);

// Kind tests: isa<T>(object), cast<T>(object) (the caller knows), dyn_cast<T>(object) (null when it
// is another class). All accept null; isa answers false for it.
template <class T>
bool isa(const NSObject* object) {
  return object && T::classof(*object);
}
template <class T>
T* cast(NSObject* object) {
  return static_cast<T*>(object);
}
template <class T>
const T* cast(const NSObject* object) {
  return static_cast<const T*>(object);
}
template <class T>
T* dyn_cast(NSObject* object) {
  return isa<T>(object) ? static_cast<T*>(object) : nullptr;
}
template <class T>
const T* dyn_cast(const NSObject* object) {
  return isa<T>(object) ? static_cast<const T*>(object) : nullptr;
}

// A counted reference to an object of class T; may be null. Whoever holds a Ref owns a share of the
// object; a plain pointer is borrowed from whoever does.
//
//   Value item = items->objects().front();
//   if (auto* element = dyn_cast<NSXMLElement>(item)) use(*element);
template <class T>
class Ref {
 public:
  Ref() = default;
  Ref(std::nullptr_t) {}
  Ref(T* object) : _object(object) { retain(); }
  Ref(const Ref& other) : _object(other._object) { retain(); }
  Ref(Ref&& other) noexcept : _object(std::exchange(other._object, nullptr)) {}
  template <class U, class = std::enable_if_t<std::is_convertible_v<U*, T*>>>
  Ref(const Ref<U>& other) : _object(other.get()) {
    retain();
  }
  template <class U, class = std::enable_if_t<std::is_convertible_v<U*, T*>>>
  Ref(Ref<U>&& other) noexcept : _object(other.detach()) {}
  ~Ref() { release(); }

  Ref& operator=(const Ref& other) {
    Ref(other).swap(*this);
    return *this;
  }
  Ref& operator=(Ref&& other) noexcept {
    Ref(std::move(other)).swap(*this);
    return *this;
  }
  void swap(Ref& other) noexcept { std::swap(_object, other._object); }

  T* get() const { return _object; }
  T* operator->() const { return _object; }
  T& operator*() const { return *_object; }
  explicit operator bool() const { return _object != nullptr; }

  // The first reference to an object just made.
  static Ref toNewObject(T* object) {
    Ref reference;
    reference._object = object;
    object->retainNew();
    return reference;
  }

  // Gives up the reference without releasing it.
  T* detach() noexcept { return std::exchange(_object, nullptr); }

  friend bool operator==(const Ref& a, const Ref& b) { return a._object == b._object; }
  friend bool operator==(const Ref& a, const T* b) { return a._object == b; }

 private:
  void retain() const {
    if (_object) retainObject(_object);
  }
  void release() const {
    if (_object) releaseObject(_object);
  }
  static void retainObject(const T* object) {
    if constexpr (std::is_base_of_v<NSCounted, T>) {
      object->retain();
    } else if constexpr (std::is_same_v<NSObject, std::remove_const_t<T>>) {
      if (object->isNode()) {
        retainTreeOf(reinterpret_cast<const NSXMLNode*>(object));
      } else {
        static_cast<const NSCounted*>(object)->retain();
      }
    } else {
      retainTreeOf(object);
    }
  }
  static void releaseObject(const T* object) {
    if constexpr (std::is_base_of_v<NSCounted, T>) {
      object->release();
    } else if constexpr (std::is_same_v<NSObject, std::remove_const_t<T>>) {
      if (object->isNode()) {
        releaseTreeOf(reinterpret_cast<const NSXMLNode*>(object));
      } else {
        static_cast<const NSCounted*>(object)->release();
      }
    } else {
      releaseTreeOf(object);
    }
  }

  T* _object = nullptr;
};

// Makes a counted object: make<NSArray>(...).
template <class T, class... Arguments>
[[nodiscard]] Ref<T> make(Arguments&&... arguments) {
  return Ref<T>::toNewObject(new T(std::forward<Arguments>(arguments)...));
}

template <class T>
bool isa(const Ref<NSObject>& value) {
  return isa<T>(static_cast<const NSObject*>(value.get()));
}
template <class T>
T* cast(const Ref<NSObject>& value) {
  return static_cast<T*>(value.get());
}
template <class T>
T* dyn_cast(const Ref<NSObject>& value) {
  return dyn_cast<T>(value.get());
}

using Value = Ref<NSObject>;

// Memory that counts toward the memory ceiling of the evaluation on this thread. `bytes` is the
// same for both; throws std::bad_alloc.
[[nodiscard]] XQUERY_EXPORT void* allocateValueMemory(size_t bytes);
XQUERY_EXPORT void freeValueMemory(void* block, size_t bytes) noexcept;

template <class T>
struct ValueAllocator {
  using value_type = T;

  ValueAllocator() = default;
  template <class U>
  ValueAllocator(const ValueAllocator<U>&) noexcept {}

  [[nodiscard]] T* allocate(size_t count) {
    if (count > SIZE_MAX / 2 / sizeof(T)) throw std::bad_array_new_length();
    return static_cast<T*>(allocateValueMemory(count * sizeof(T)));
  }
  void deallocate(T* block, size_t count) noexcept { freeValueMemory(block, count * sizeof(T)); }

  friend bool operator==(const ValueAllocator&, const ValueAllocator&) { return true; }
};

}  // namespace xquery

// A sequence is a std::vector of values: its growth counts as well, wherever it is held.
template <>
class std::allocator<xquery::Value> : public xquery::ValueAllocator<xquery::Value> {
 public:
  using size_type = size_t;
  using difference_type = ptrdiff_t;
  using propagate_on_container_move_assignment = std::true_type;

  allocator() = default;
  template <class U>
  allocator(const allocator<U>&) noexcept {}
};
