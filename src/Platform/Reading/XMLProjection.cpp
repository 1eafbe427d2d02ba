#include "Platform/Reading/XMLProjection.h"

#include <algorithm>
#include <utility>

namespace xquery {

// --- places ----------------------------------------------------------------------------------

XMLProjection::PlaceID XMLProjection::step(PlaceID from, bool isAnywhere, std::string_view name) {
  for (const Step& each : _places[from].steps) {
    if (each.isAnywhere == isAnywhere && each.name == name) return each.to;
  }
  const auto to = static_cast<PlaceID>(_places.size());
  _places.emplace_back();
  _places[from].steps.push_back({isAnywhere, std::string(name), to});
  return to;
}

void XMLProjection::needAttribute(PlaceID place, std::string_view name) {
  std::vector<std::string>& known = _places[place].attributes;
  if (std::find(known.begin(), known.end(), name) == known.end()) known.emplace_back(name);
}

namespace {

void add(std::string& list, const std::string& item) {
  if (!list.empty()) list += ", ";
  list += item;
}

// What is needed of one place, whose path is "" for the document.
void describe(const XMLProjection::Place& place, const std::string& path, std::string& list) {
  const auto does = [&](unsigned need) { return (place.needs & need) != 0; };
  const std::string own = path.empty() ? "/" : path;
  if (does(XMLProjection::Below)) return add(list, "all of " + own);
  if (does(XMLProjection::Value)) add(list, "the text of " + own);
  if (does(XMLProjection::Texts)) add(list, path + "/text()");
  if (does(XMLProjection::Instructions)) add(list, path + "/processing-instruction()");
  if (does(XMLProjection::Attributes)) {
    add(list, path + "/@*");
  } else {
    for (const std::string& name : place.attributes) add(list, path + "/@" + name);
  }
  if (place.needs == XMLProjection::Itself && place.attributes.empty() && !path.empty()) {
    add(list, path);
  }
}

}  // namespace

std::string XMLProjection::description() const {
  std::string list;
  std::vector<std::pair<PlaceID, std::string>> waiting = {{document, ""}};
  while (!waiting.empty()) {
    const auto [place, path] = std::move(waiting.back());
    waiting.pop_back();
    describe(_places[place], path, list);
    const std::vector<Step>& steps = _places[place].steps;
    for (auto step = steps.rbegin(); step != steps.rend(); ++step) {
      const std::string name = step->name.empty() ? "*" : step->name;
      waiting.emplace_back(step->to, path + (step->isAnywhere ? "//" : "/") + name);
    }
  }
  return list;
}

// --- states ----------------------------------------------------------------------------------

XMLProjectionStates::XMLProjectionStates(const XMLProjection& projection)
    : _projection(projection) {
  for (const XMLProjection::Place& place : projection.places()) {
    std::vector<NameID>& steps = _stepNames.emplace_back();
    for (const XMLProjection::Step& step : place.steps) steps.push_back(addName(step.name));
    std::vector<NameID>& attributes = _attributeNames.emplace_back();
    for (const std::string& name : place.attributes) attributes.push_back(addName(name));
  }
  const size_t names = _names.size() + 1;
  _dead.next.assign(names, &_dead);
  _all.needsItself = _all.needsTexts = _all.needsAttributes = _all.needsInstructions = true;
  _all.next.assign(names, &_all);
  State& root = _states.emplace_back();
  root.places = {XMLProjection::document};
  root.next.assign(names, nullptr);
  concludeFrom(root);
}

// Any name is no name of its own.
XMLProjectionStates::NameID XMLProjectionStates::addName(const std::string& name) {
  if (name.empty()) return otherName;
  const auto next = static_cast<NameID>(_names.size() + 1);
  return _names.try_emplace(name, next).first->second;
}

XMLProjectionStates::NameID XMLProjectionStates::nameOf(std::string_view localName) const {
  const auto found = _names.find(localName);
  return found == _names.end() ? otherName : found->second;
}

XMLProjectionStates::State* XMLProjectionStates::makeBelow(State* parent, NameID name) {
  const State& from = *parent;
  State state;
  state.above = from.above;
  state.isInValue = from.isInValue;
  for (const XMLProjection::PlaceID place : from.places) {
    const auto& steps = _projection.places()[place].steps;
    state.isInValue =
        state.isInValue || (_projection.places()[place].needs & XMLProjection::Value) != 0;
    for (size_t i = 0; i < steps.size(); ++i) {
      if (!steps[i].isAnywhere) {
        const NameID asked = _stepNames[place][i];
        if (asked == otherName || asked == name) state.places.push_back(steps[i].to);
      } else if (std::find(state.above.begin(), state.above.end(), place) == state.above.end()) {
        state.above.push_back(place);
      }
    }
  }
  for (const XMLProjection::PlaceID place : state.above) {
    const auto& steps = _projection.places()[place].steps;
    for (size_t i = 0; i < steps.size(); ++i) {
      const NameID asked = _stepNames[place][i];
      if (!steps[i].isAnywhere || (asked != otherName && asked != name)) continue;
      const XMLProjection::PlaceID to = steps[i].to;
      if (std::find(state.places.begin(), state.places.end(), to) == state.places.end()) {
        state.places.push_back(to);
      }
    }
  }
  return parent->next[name] = stateOf(std::move(state));
}

// What follows from the places.
void XMLProjectionStates::concludeFrom(State& state) const {
  state.needsTexts = state.isInValue;
  for (const XMLProjection::PlaceID place : state.places) {
    const uint8_t needs = _projection.places()[place].needs;
    state.needsItself = state.needsItself || (needs & XMLProjection::Itself) != 0;
    state.needsTexts =
        state.needsTexts || (needs & (XMLProjection::Texts | XMLProjection::Value)) != 0;
    state.needsAttributes = state.needsAttributes || (needs & XMLProjection::Attributes) != 0;
    state.needsInstructions = state.needsInstructions || (needs & XMLProjection::Instructions) != 0;
    for (const NameID name : _attributeNames[place]) state.attributes.push_back(name);
  }
}

XMLProjectionStates::State* XMLProjectionStates::stateOf(State state) {
  std::sort(state.places.begin(), state.places.end());
  std::sort(state.above.begin(), state.above.end());
  if (state.places.empty() && state.above.empty() && !state.isInValue) return &_dead;
  for (const XMLProjection::PlaceID place : state.places) {
    if (_projection.places()[place].needs & XMLProjection::Below) return &_all;
  }
  for (State& known : _states) {
    if (known.places == state.places && known.above == state.above &&
        known.isInValue == state.isInValue) {
      return &known;
    }
  }
  if (_states.size() >= mostStates) return &_all;
  concludeFrom(state);
  state.next.assign(_names.size() + 1, nullptr);
  return &_states.emplace_back(std::move(state));
}

}  // namespace xquery
