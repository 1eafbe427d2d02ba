#include "Platform/Reading/XMLRecordFilter.h"

#include <algorithm>
#include <bit>

namespace xquery {

XMLRecordFilter::XMLRecordFilter(ReadTree& tree, std::span<const XMLRecordPath> paths)
    : _tree(tree) {
  uint64_t begins = 0;
  for (const XMLRecordPath& path : paths) {
    begins |= uint64_t{1} << _steps.size();
    _steps.insert(_steps.end(), path.begin(), path.end());
    _ends |= uint64_t{1} << _steps.size();
    _steps.emplace_back();
  }
  _levels.push_back({_tree.mark(), begins});
}

// The steps that are matched where the element stands; all those of a path for a record.
uint64_t XMLRecordFilter::enter(const NSXMLElement* element) const {
  uint64_t matched = 0;
  for (uint64_t left = _levels.back().matched; left != 0; left &= left - 1) {
    const auto index = static_cast<size_t>(std::countr_zero(left));
    const XMLRecordStep& step = _steps[index];
    if (step.isAnywhere) matched |= uint64_t{1} << index;
    if (!step.name || step.name == element->expandedName()) matched |= uint64_t{2} << index;
  }
  return matched;
}

void XMLRecordFilter::leave() {
  _levels.pop_back();
  _elementsKept = std::min(_elementsKept, elementsAbove());
}

const NSXMLElement* XMLRecordFilter::completeRecord() {
  _recordDepth = 0;
  _tree.endOpenNodes();
  return cast<NSXMLElement>(_tree.current()->firstChild());
}

const NSXMLElement* XMLRecordFilter::lookOutside(size_t depthBefore, size_t depth) {
  if (depth < depthBefore) leave();
  const bool isOpen = depth > depthBefore;
  const NSXMLNode* const added = isOpen ? _tree.current() : _tree.current()->firstChild();
  const auto* element = depth < depthBefore ? nullptr : dyn_cast<NSXMLElement>(added);
  if (element) {
    const uint64_t matched = enter(element);
    const bool isRecord = (matched & _ends) != 0;
    if (isRecord && !isOpen) return completeRecord();
    if (isRecord) {
      _recordDepth = depth;
      return nullptr;
    }
    if (isOpen) _levels.push_back({_tree.mark(), matched});
  }
  _tree.backTo(_levels.back().mark);
  return nullptr;
}

}  // namespace xquery
