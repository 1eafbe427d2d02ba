// Elements of a document of which only a projection is made, as long as they are not put into the
// tree and nothing about them is out of the ordinary: most of what is read of most documents.
//
// It is the work of XMLReader in one loop, which makes nothing. Whatever needs more than a look,
// and whatever may be wrong, is left to the reader, which finds it as if nothing had been looked
// at: declarations of namespaces, references, wide values, comments, white space where it is rare,
// what the text in hand does not hold as a whole.
#pragma once

#include "Platform/Reading/MarkedText.h"
#include "Platform/Reading/ProjectedTags.h"

#include <vector>

namespace xquery {

class SkippedElements {
 public:
  using OpenNames = std::vector<ReadName*, ValueAllocator<ReadName*>>;

  SkippedElements(MarkedText& text, ReadNames& names, RawTexts& texts, ReadTree& tree,
                  ProjectedTags& tags)
      : _text(text), _names(names), _texts(texts), _tree(tree), _tags(tags) {}

  // Reads from a place where markup begins, below the elements that are open, and answers the place
  // of the first piece that is left to the reader.
  const char* skip(const char* at, OpenNames& open);

 private:
  const char* behindEndTag(const char* at, OpenNames& open);
  const char* behindStartTag(const char* at, OpenNames& open);
  const char* behindAttributes(const char* at);
  const char* behindValue(const char* at);
  const char* behindText(const char* at);
  ReadName* nameAt(const char*& at);

  MarkedText& _text;
  ReadNames& _names;
  RawTexts& _texts;
  ReadTree& _tree;
  ProjectedTags& _tags;
};

}  // namespace xquery
