#include "Pieces.h"

#include "Documents.h"
#include "Messages.h"

#include <algorithm>
#include <filesystem>
#include <utility>

namespace cli {
namespace {

using namespace xquery;

constexpr uint64_t mostPieces = 99'999'999;  // whose names sort

std::string pieceName(uint64_t number) {
  const std::string digits = std::to_string(number);
  constexpr size_t width = 8;
  return "part-" + std::string(width - digits.size(), '0') + digits + ".xml";
}

Failure wrongPath(const std::string& what) {
  return {StatusQueryError, "xquery: --split: the path gives " + what, {}};
}

// The elements that the node is in, from the document element on.
std::vector<const NSXMLElement*> elementsAround(const NSXMLNode& node) {
  std::vector<const NSXMLElement*> found;
  for (const NSXMLNode* each = node.parent(); each; each = each->parent()) {
    if (const auto* element = dyn_cast<NSXMLElement>(each)) found.push_back(element);
  }
  std::reverse(found.begin(), found.end());
  return found;
}

}  // namespace

Pieces::Pieces(std::string folder, uint64_t records, Receiver receive)
    : _folder(std::move(folder)), _records(records), _receive(std::move(receive)) {}

void Pieces::beginRecord(const NSXMLElement& record, size_t elementsKept) {
  _document = record.rootDocument();
  for (size_t depth = elementsKept; depth < _open.size(); ++depth) _open[depth].element = nullptr;
  _last = nullptr;
}

bool Pieces::isInLast(const NSXMLElement& element) const {
  const NSXMLNode* node = _last ? &element : nullptr;
  while (node && node != _last) node = node->parent();
  return node != nullptr;
}

void Pieces::add(const NSObject& item) {
  const auto* element = dyn_cast<NSXMLElement>(&item);
  if (!element) {
    throw wrongPath("an item of type " + XQueryItemTypeName(item) + ", which is no element");
  }
  const NSXMLDocument* document = element->rootDocument();
  if (!document || document != _document) {
    throw wrongPath("an element that is not the document's");
  }
  if (isInLast(*element)) return;
  if (_last && NSXMLNode::compareOrder(_last, element) >= 0) {
    throw wrongPath("elements in another order than the document's");
  }
  _last = element;
  if (!_output) open();
  enter(elementsAround(*element));
  XQueryWriteXMLInPlace(*element, [this](std::string_view text) { return write(text); });
  write("\n");
  if (!_output->error().empty()) throw writingFailure(_path, _output->error());
  if (++_count == _records) close();
}

// Ends the elements that the record is not in, and begins those that it is in.
void Pieces::enter(const std::vector<const NSXMLElement*>& above) {
  size_t common = 0;
  while (common < std::min(_open.size(), above.size()) && _open[common].element == above[common]) {
    ++common;
  }
  leaveTo(common);
  for (; common < above.size(); ++common) {
    XQueryWriteStartTag(*above[common], [this](std::string_view text) { return write(text); });
    write("\n");
    _open.push_back({above[common], above[common]->nameView().utf8()});
  }
}

void Pieces::leaveTo(size_t depth) {
  for (; _open.size() > depth; _open.pop_back()) write("</" + _open.back().name + ">\n");
}

void Pieces::open() {
  if (_number == mostPieces) {
    throw writingFailure(_folder,
                         "there would be more than " + std::to_string(mostPieces) + " pieces");
  }
  _path = (std::filesystem::path(_folder) / pieceName(++_number)).string();
  _count = 0;
  _output.emplace();
  if (!_output->open(_path)) throw writingFailure(_path, _output->error());
  write("<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n");
}

void Pieces::close() {
  leaveTo(0);
  if (!_output->finish()) throw writingFailure(_path, _output->error());
  _output.reset();
  _receive(_path);
}

void Pieces::finish() {
  if (_output) close();
}

}  // namespace cli
