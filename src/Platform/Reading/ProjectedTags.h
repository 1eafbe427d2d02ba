// The tags of a document of which only a projection is made, as our reader meets them: what is
// needed goes into the tree, and the rest is checked as if it did.
#pragma once

#include "Platform/Reading/AttributeSet.h"
#include "Platform/Reading/ProjectedElements.h"
#include "Platform/Reading/ReadTag.h"

namespace xquery {

class ProjectedTags {
 public:
  ProjectedTags(ReadTree& tree, ReadNames& names, RawTexts& texts, const XMLProjection& projection);
  ProjectedTags(const ProjectedTags&) = delete;
  ProjectedTags& operator=(const ProjectedTags&) = delete;

  // Of what stands here.
  bool needsTexts() const { return _elements.needsTexts(); }
  bool needsComments() { return _elements.needsComments(); }
  bool needsInstructions() const { return _elements.needsInstructions(); }

  // An element opens, whose namespaces are in scope.
  void open(ReadName& name, const ReadTag& tag);
  // Whether the element that closes is in the tree.
  bool close() { return _elements.close(); }

  // Of elements that are not put into the tree at once, as ProjectedElements has them.
  using State = XMLProjectionStates::State;
  State* stateIfWaiting(const ReadName& name) { return _elements.stateIfWaiting(name.selected); }
  void openWaiting(State* state, ReadName& name) {
    _elements.openWaiting(state, {&name, name.prefix->bound});
  }
  bool closeIfWaiting() { return _elements.closeIfWaiting(); }

  // Before something below the open elements goes into the tree.
  void buildAbove();

 private:
  // What an element is known by that waits for something below it to be put into the tree.
  struct Waiting {
    ReadName* name;
    const ReadNamespace* URI;
  };
  using Elements = ProjectedElements<Waiting>;

  void build(const Waiting& element);
  static bool hasNeededAttribute(const ReadTag& tag, const State& state);
  void addNeededAttributes(const ReadTag& tag, const State& state);
  void check(const ReadTag& tag);
  void checkDistinct(const ReadTag& tag);

  ReadTree& _tree;
  ReadNames& _names;
  RawTexts& _texts;
  Elements _elements;
  AttributeSet _distinct;
};

}  // namespace xquery
