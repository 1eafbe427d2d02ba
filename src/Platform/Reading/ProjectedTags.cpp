#include "Platform/Reading/ProjectedTags.h"

#include <algorithm>

namespace xquery {

ProjectedTags::ProjectedTags(ReadTree& tree, ReadNames& names, RawTexts& texts,
                             const XMLProjection& projection)
    : _tree(tree), _names(names), _texts(texts), _elements(tree, projection) {
  _names.select([this](std::string_view name) { return _elements.nameOf(name); });
}

void ProjectedTags::build(const Waiting& element) {
  _tree.openElement(_names.elementName(*element.name, element.URI));
}

void ProjectedTags::buildAbove() {
  _elements.buildAbove([this](const Waiting& each) { build(each); });
}

void ProjectedTags::open(ReadName& name, const ReadTag& tag) {
  ReadNames::checkElementName(name);
  const auto isNeeded = [&tag](const State& state) {
    return tag.hasScope || (state.needsAnyAttribute() && hasNeededAttribute(tag, state));
  };
  const auto buildOne = [this](const Waiting& each) { build(each); };
  if (!_elements.open(name.selected, {&name, name.prefix->bound}, isNeeded, buildOne)) {
    return check(tag);
  }
  _tree.openElement(_names.elementName(name));
  if (tag.declares) tag.addNamespaces(_tree, _names);
  if (!tag.attributes.empty()) addNeededAttributes(tag, _elements.state());
}

// --- attributes ------------------------------------------------------------------------------

bool ProjectedTags::hasNeededAttribute(const ReadTag& tag, const State& state) {
  return std::any_of(tag.attributes.begin(), tag.attributes.end(), [&](const ReadAttribute& each) {
    return !each.name->declares && state.needsAttribute(each.name->selected);
  });
}

void ProjectedTags::addNeededAttributes(const ReadTag& tag, const State& state) {
  checkDistinct(tag);
  for (const ReadAttribute& attribute : tag.attributes) {
    if (attribute.name->declares) continue;
    const ReadText value = _texts.value(attribute.value);
    if (attribute.name->isOfXML || state.needsAttribute(attribute.name->selected)) {
      _tree.addAttribute(_names.attributeName(*attribute.name), value);
    } else {
      _tree.check(value);
    }
  }
}

void ProjectedTags::check(const ReadTag& tag) {
  if (tag.attributes.empty()) return;
  checkDistinct(tag);
  for (const ReadAttribute& attribute : tag.attributes) {
    if (!attribute.name->declares && !attribute.value.isSurelyRight()) {
      _tree.check(_texts.value(attribute.value));
    }
  }
}

// Names without a prefix are distinct as they are written.
void ProjectedTags::checkDistinct(const ReadTag& tag) {
  bool hasPrefixes = false;
  for (const ReadAttribute& attribute : tag.attributes) {
    if (attribute.name->declares || !attribute.name->hasPrefix) continue;
    hasPrefixes = true;
    take(attribute.name->prefix->bound != nullptr);
  }
  if (tag.attributes.size() < 2) return;
  _distinct.start(tag.attributes.size());
  for (const ReadAttribute& attribute : tag.attributes) {
    if (attribute.name->declares) continue;
    const void* const key =
        hasPrefixes ? static_cast<const void*>(_names.attributeName(*attribute.name)->expanded)
                    : attribute.name;
    take(_distinct.insert(key));
  }
}

}  // namespace xquery
