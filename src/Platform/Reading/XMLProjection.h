// Which parts of a document its tree needs, for a reader that makes no others.
//
// A projection is a tree of places. A place stands for all the elements that a path of names finds
// from the document on; place 0 is the document. It says what is needed of these elements, and its
// steps lead to further places, of children or of elements anywhere below.
//
//   count(//person[@id]) + sum(/site/sale/price)
//
//   0 --//person--> 1  itself, @id
//   0 --/site-----> 2 --/sale--> 3 --/price--> 4  itself, string value
//
// Names are local names: what a step finds in any namespace is made. More than a projection asks
// for never does harm, less does; so an element that is needed has everything above it, with the
// namespaces and the attributes of the prefix "xml" that are there.
#pragma once

#include <cstddef>
#include <cstdint>
#include <deque>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

namespace xquery {

class XMLProjection {
 public:
  // What is needed of the elements of a place, as bits. What is below an element includes its
  // attributes. An element that is not needed itself is not there without what is needed of it.
  enum Need : uint8_t {
    Itself = 1 << 0,
    Texts = 1 << 1,         // that are its children
    Value = 1 << 2,         // the texts below
    Below = 1 << 3,         // everything
    Attributes = 1 << 4,    // all of them
    Instructions = 1 << 5,  // that are its children
    StringValue = Itself | Value,
    AllBelow = Itself | Below,
  };
  using PlaceID = uint32_t;
  static constexpr PlaceID document = 0;

  struct Step {
    bool isAnywhere;   // below, not a child
    std::string name;  // local, UTF-8; empty for any
    PlaceID to;
  };
  struct Place {
    uint8_t needs = 0;
    std::vector<std::string> attributes;  // local names
    std::vector<Step> steps;
  };

  // The place to which the step leads; made where there is none.
  PlaceID step(PlaceID from, bool isAnywhere, std::string_view name);
  void need(PlaceID place, unsigned needs) { _places[place].needs |= static_cast<uint8_t>(needs); }
  void needAttribute(PlaceID place, std::string_view name);

  const std::vector<Place>& places() const { return _places; }
  bool needsAll() const { return (_places[document].needs & Below) != 0; }
  // For people: what is kept, with commas between; empty for nothing.
  std::string description() const;

 private:
  std::vector<Place> _places = std::vector<Place>(1);
};

// The projection while one document is read: a machine whose states are the sets of places that an
// element belongs to, made as they are met. What nothing below is needed of has the state `dead`,
// and what all is needed of the state `all`, for itself and for everything below.
class XMLProjectionStates {
 public:
  explicit XMLProjectionStates(const XMLProjection& projection);
  XMLProjectionStates(const XMLProjectionStates&) = delete;
  XMLProjectionStates& operator=(const XMLProjectionStates&) = delete;

  using NameID = uint32_t;
  static constexpr NameID otherName = 0;
  // Of a local name; the same for all names that no step asks for.
  NameID nameOf(std::string_view localName) const;

  struct State {
    bool needsItself = false;
    bool needsTexts = false;
    bool needsAttributes = false;    // all of them
    bool needsInstructions = false;  // that are children
    std::vector<NameID> attributes;
    // Whether an element is put into the tree for nothing but what is below it.
    bool mayWait() const { return !needsItself && !needsAnyAttribute(); }
    // An element that has one of them is in the tree.
    bool needsAnyAttribute() const { return needsAttributes || !attributes.empty(); }
    bool needsAttribute(NameID name) const {
      if (needsAttributes) return true;
      for (const NameID each : attributes) {
        if (each == name) return true;
      }
      return false;
    }

    std::vector<XMLProjection::PlaceID> places;  // of which such an element is
    std::vector<XMLProjection::PlaceID> above;   // whose steps to anywhere below lead in here
    bool isInValue = false;                      // the string value of something above is needed
    std::vector<State*> next;                    // by name; null until it is asked for
  };
  State* dead() { return &_dead; }
  State* all() { return &_all; }
  State* document() { return &_states.front(); }
  // Of an element of that name whose parent has the state.
  State* below(State* parent, NameID name) {
    State* const known = parent->next[name];
    return known ? known : makeBelow(parent, name);
  }

 private:
  // A projection may have more states than it is worth to tell apart: all is made of the rest.
  static constexpr size_t mostStates = 250;

  NameID addName(const std::string& name);
  State* makeBelow(State* parent, NameID name);
  State* stateOf(State state);
  void concludeFrom(State& state) const;

  const XMLProjection& _projection;
  std::unordered_map<std::string_view, NameID> _names;  // texts of the projection
  // Of the places: the names of their steps and of their attributes.
  std::vector<std::vector<NameID>> _stepNames;
  std::vector<std::vector<NameID>> _attributeNames;
  State _dead;
  State _all;
  std::deque<State> _states;  // the document first
};

}  // namespace xquery
