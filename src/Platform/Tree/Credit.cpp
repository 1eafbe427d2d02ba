#include "Platform/Tree/Credit.h"

#include "Platform/Tree/Arena.h"
#include "Platform/Tree/Names.h"

#include <utility>

namespace xquery {

constinit thread_local NSXMLCredit::Credits* NSXMLCredit::credits
    __attribute__((tls_model("initial-exec"))) = nullptr;

NSXMLCredit::NSXMLCredit() {
  if (!credits) {
    credits = &_own.emplace();
    return;
  }
  uint16_t bit = 1;
  for (const auto& places : credits->trees) {
    for (const Tree& known : places) {
      if (known.tree) _treesBefore |= bit;
      bit <<= 1;
    }
  }
}

NSXMLCredit::~NSXMLCredit() {
  uint16_t bit = 1;
  for (auto& places : credits->trees) {
    for (Tree& known : places) {
      if (known.tree && !(_treesBefore & bit)) giveBack(known);
      bit <<= 1;
    }
  }
  if (!_own) return;
  credits = nullptr;
  for (auto& places : _own->names) {
    for (Name& known : places) giveBack(known);
  }
}

void NSXMLCredit::take(const NSXMLNode* node) {
  NSXMLTree* tree = NSXMLTree::of(node);
  if (!credits || creditOf(tree)) return;
  std::array<Tree, 2>& places = credits->placesOf(tree);
  Tree& known = places[places[0].tree ? 1 : 0];
  if (!known.tree && tree->addReferences(portion)) known = {tree, portion};
}

void NSXMLCredit::refill(Tree& known) {
  // Without another portion there is one tree that is never freed.
  known.tree->addReferences(portion);
  known.left = portion;
}

void NSXMLCredit::giveBackPortion(Tree& known) {
  known.left -= portion;
  known.tree->removeReferences(portion);
}

// Forgets the tree before it may be freed.
void NSXMLCredit::giveBack(Tree& known) {
  const Tree gone = std::exchange(known, Tree());
  if (gone.left > 0) gone.tree->removeReferences(gone.left);
}

void NSXMLCredit::refill(Name& known) {
  NSXMLAddReferences(known.name, portion);
  known.left = portion;
}

// Without credit yet: the name is held by whoever takes a reference to it or gives one up.
NSXMLCredit::Name& NSXMLCredit::placeFor(const NSXMLName* name) {
  std::array<Name, 2>& places = credits->placesOf(name);
  giveBack(places[1]);
  places[1] = places[0];
  places[0] = {name, 0};
  return places[0];
}

void NSXMLCredit::giveBack(Name& known) {
  const Name gone = std::exchange(known, Name());
  if (gone.left > 0) NSXMLRemoveReferences(gone.name, gone.left);
}

}  // namespace xquery
