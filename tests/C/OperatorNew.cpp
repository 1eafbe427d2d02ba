// The operators of a sanitized build, where malloc is the sanitizer's: they fail when the tests
// say.
#include <cstdlib>
#include <new>

extern "C" int next_allocation_fails(void);

void* operator new(size_t size) {
  void* block = next_allocation_fails() ? nullptr : std::malloc(size ? size : 1);
  if (!block) throw std::bad_alloc();
  return block;
}

void* operator new[](size_t size) {
  return operator new(size);
}

void* operator new(size_t size, const std::nothrow_t&) noexcept {
  return next_allocation_fails() ? nullptr : std::malloc(size ? size : 1);
}

void operator delete(void* block) noexcept {
  std::free(block);
}

void operator delete[](void* block) noexcept {
  std::free(block);
}

void operator delete(void* block, size_t) noexcept {
  std::free(block);
}

void operator delete[](void* block, size_t) noexcept {
  std::free(block);
}
