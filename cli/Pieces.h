// The documents that a large one is cut into, "part-00000001.xml" and so on in one folder.
//
// A piece holds its records and, around them, the elements that they are in, with attributes and
// namespaces, and nothing else. The elements around a record that are those around the record
// before as well are the same element in the piece; others that look like them are not.
#pragma once

#include "Output.h"
#include "xquery/xquery.h"

#include <cstddef>
#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <string_view>
#include <unordered_set>
#include <vector>

namespace cli {

class Pieces {
 public:
  // Told the path of each piece once it is whole.
  using Receiver = std::function<void(const std::string& path)>;

  // In a folder that is there and empty. So many records in each, but for the last.
  Pieces(std::string folder, uint64_t records, Receiver receive);

  // From here on, only so many of the elements that records are in are those from before.
  void beginRecord(const xquery::NSXMLElement& record, size_t elementsKept);
  // An element within the record; nothing happens where it lies in one that was added before, which
  // holds it already. All of these throw Failure, where the item is no element of the document,
  // does not come in the order of the document, or cannot be written.
  void add(const xquery::NSObject& item);
  // Ends the last piece. Without this it is gone.
  void finish();

 private:
  bool goTo(const xquery::NSXMLElement& element);
  void enterRecord();
  void open();
  void close();
  void leaveTo(size_t depth);
  bool write(std::string_view text) { return _output->append(text); }

  // An element whose start tag has been written; one that is gone by now has no address.
  struct Open {
    const xquery::NSXMLElement* element;
    std::string name;
  };

  const std::string _folder;
  const uint64_t _records;
  const Receiver _receive;
  uint64_t _number = 0;  // of the piece
  uint64_t _count = 0;   // of the records in it
  std::string _path;
  std::optional<Output> _output;  // where there is a piece that is not whole
  std::vector<Open> _open;
  const xquery::NSXMLDocument* _document = nullptr;  // that is cut
  const xquery::NSXMLElement* _last = nullptr;       // that was added within the record
  // Within the record, from the document down to the last item, each in the next. The next item is
  // looked for from itself upward, to the first one that it has in common with this one: so items
  // that lie in each other cost nothing for their depth.
  std::vector<const xquery::NSXMLNode*> _line;
  std::unordered_set<const xquery::NSXMLNode*> _onLine;
};

}  // namespace cli
