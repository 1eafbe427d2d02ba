// Objects that live long and that several threads look at: those of a compiled query, the ones that
// are never freed, and the heads of the trees that were read.
//
// A line of memory holds two or more small objects. What is made and freed at every step is written
// at every step, and an object beside it would go from processor to processor with it, though
// nobody writes to that one. So long-lived objects come from blocks of their own.
#pragma once

namespace xquery {

// The time in which what the calling thread makes is expected to live long, and what it frees to
// have lived long. Times may nest. Being wrong costs no more than time: blocks of one kind serve
// for the other when there are no others.
class LastingObjects {
 public:
  LastingObjects();
  ~LastingObjects();
  LastingObjects(const LastingObjects&) = delete;
  LastingObjects& operator=(const LastingObjects&) = delete;

 private:
  const bool _isOutermost;
};

}  // namespace xquery
