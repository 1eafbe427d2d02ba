// The open elements of a document of which only a projection is made.
//
// An element that is needed for itself is put into the tree when it opens. One that only something
// below it may need waits: `buildAbove` puts those that wait into the tree, the outermost first,
// when something below them goes there. So what is in the tree has all its ancestors, in the order
// of the document, and what turns out not to be needed has never been there.
//
// Below what nothing is needed of, elements are but counted.
#pragma once

#include "Platform/Reading/ReadTree.h"
#include "Platform/Reading/XMLProjection.h"

#include <cstddef>
#include <vector>

namespace xquery {

// `Name`: what the reader knows an element by until it is put into the tree.
template <class Name>
class ProjectedElements {
 public:
  using States = XMLProjectionStates;

  ProjectedElements(ReadTree& tree, const XMLProjection& projection)
      : _tree(tree), _states(projection) {}

  States::NameID nameOf(std::string_view localName) const { return _states.nameOf(localName); }
  // Whether nothing is needed here but that the text is well formed.
  bool isDead() const { return _dead > 0; }
  const States::State& state() const { return *_state; }
  bool needsTexts() const { return !isDead() && state().needsTexts; }
  bool needsComments() { return !isDead() && _state == _states.all(); }
  bool needsInstructions() const { return !isDead() && state().needsInstructions; }

  // An element opens. `isNeeded(state)` tells whether its tag is: for attributes, and for what it
  // says of what is below it, as namespaces do. Answers whether the element is to be put into the
  // tree at once; the ones above it are there then. The document element always is.
  template <class IsNeeded, class Build>
  bool open(States::NameID nameID, const Name& name, const IsNeeded& isNeeded, const Build& build) {
    _tree.endText();
    if (isDead()) {
      ++_dead;
      return false;
    }
    States::State* const state = _states.below(_state, nameID);
    const bool isRoot = _open.empty();
    if (state == _states.dead() && !isRoot) {
      _dead = 1;
      return false;
    }
    const bool isBuilt = isRoot || state->needsItself || isNeeded(*state);
    if (isBuilt) buildAbove(build);
    _open.push_back({_state, isBuilt, name});
    if (isBuilt) _built = _open.size();
    _state = state;
    return isBuilt;
  }
  // Whether the element that closes is in the tree.
  bool close() {
    if (isDead()) {
      --_dead;
      return false;
    }
    const Level& level = _open.back();
    const bool isBuilt = level.isBuilt;
    _state = level.outside;
    _open.pop_back();
    if (isBuilt) _built = _open.size();
    return isBuilt;
  }

  // --- elements that are not put into the tree at once ------------------------------------------

  // Where an element of that name opens that is not, whatever its attributes are, but for those of
  // its scope: the state of what is below it. Null where it may be.
  States::State* stateIfWaiting(States::NameID nameID) {
    if (isDead()) return _states.dead();
    if (_open.empty()) return nullptr;
    States::State* const state = _states.below(_state, nameID);
    return state->mayWait() ? state : nullptr;
  }
  // It opens.
  void openWaiting(States::State* state, const Name& name) {
    _tree.endText();
    if (isDead() || state == _states.dead()) {
      ++_dead;
      return;
    }
    _open.push_back({_state, false, name});
    _state = state;
  }
  // An element closes, unless it is in the tree.
  bool closeIfWaiting() {
    if (isDead()) {
      --_dead;
      return true;
    }
    if (_open.back().isBuilt) return false;
    _state = _open.back().outside;
    _open.pop_back();
    return true;
  }

  // Puts the elements that wait into the tree, with `build(name)` for each.
  template <class Build>
  void buildAbove(const Build& build) {
    for (; _built < _open.size(); ++_built) {
      _open[_built].isBuilt = true;
      build(_open[_built].name);
    }
  }

 private:
  struct Level {
    States::State* outside;
    bool isBuilt;
    Name name;
  };

  ReadTree& _tree;
  States _states;
  States::State* _state = _states.document();
  std::vector<Level, ValueAllocator<Level>> _open;  // but for those that are only counted
  size_t _built = 0;                                // so many of them are in the tree
  size_t _dead = 0;
};

}  // namespace xquery
