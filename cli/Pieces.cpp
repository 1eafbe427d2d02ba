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

}  // namespace

Pieces::Pieces(std::string folder, uint64_t records, Receiver receive)
    : _folder(std::move(folder)), _records(records), _receive(std::move(receive)) {}

void Pieces::beginRecord(const NSXMLElement& record, size_t elementsKept) {
  for (size_t depth = elementsKept; depth < _open.size(); ++depth) _open[depth].element = nullptr;
  _last = nullptr;
  _document = record.rootDocument();
  _line.clear();
  _onLine.clear();
}

// False where the element is in another tree.
bool Pieces::goTo(const NSXMLElement& element) {
  if (_line.empty()) _line.push_back(_document);
  _onLine.insert(_document);
  std::vector<const NSXMLNode*> below;
  const NSXMLNode* node = &element;
  for (; node && !_onLine.contains(node); node = node->parent()) below.push_back(node);
  if (!node) return false;
  for (; _line.back() != node; _line.pop_back()) _onLine.erase(_line.back());
  _onLine.insert(below.begin(), below.end());
  _line.insert(_line.end(), below.rbegin(), below.rend());
  return true;
}

void Pieces::add(const NSObject& item) {
  const auto* element = dyn_cast<NSXMLElement>(&item);
  if (!element) {
    throw wrongPath("an item of type " + XQueryItemTypeName(item) + ", which is no element");
  }
  if (!goTo(*element)) throw wrongPath("an element that is not the document's");
  if (_last && _onLine.contains(_last)) return;
  if (_last && NSXMLNode::compareOrder(_last, element) >= 0) {
    throw wrongPath("elements in another order than the document's");
  }
  _last = element;
  if (!_output) open();
  enterRecord();
  XQueryWriteXMLInPlace(*element, [this](std::string_view text) { return write(text); });
  write("\n");
  if (!_output->error().empty()) throw writingFailure(_path, _output->error());
  if (++_count == _records) close();
}

// Ends the elements that the record is not in, and begins those that it is in.
void Pieces::enterRecord() {
  const auto elementAt = [this](size_t depth) { return cast<NSXMLElement>(_line[1 + depth]); };
  const size_t above = _line.size() - 2;  // neither the document nor the record
  size_t common = 0;
  while (common < std::min(_open.size(), above) && _open[common].element == elementAt(common)) {
    ++common;
  }
  leaveTo(common);
  for (; common < above; ++common) {
    const NSXMLElement* element = elementAt(common);
    XQueryWriteStartTag(*element, [this](std::string_view text) { return write(text); });
    write("\n");
    _open.push_back({element, element->nameView().utf8()});
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
