// Characters on their way out as XML: gathered as UTF-8, and escaped where XML cannot hold them.
#pragma once

#include "Platform/Text/Blocks.h"
#include "xquery/String.h"

#include <array>
#include <cstdint>
#include <functional>
#include <string>
#include <string_view>

namespace xquery {

// Collects UTF-8. With a sink, pieces of at most `pieceSize` bytes are handed to it.
class XMLOutput {
 public:
  using Sink = std::function<bool(std::string_view)>;
  XMLOutput(std::string& buffer, const Sink* sink) : _buffer(buffer), _sink(sink) {}

  bool isStopped() const { return _isStopped; }

  void write(std::string_view bytes) {
    if (!_sink) {
      appendInBlocks(_buffer, bytes);
      return;
    }
    while (!bytes.empty() && !_isStopped) {
      const std::string_view part = bytes.substr(0, pieceSize - _buffer.size());
      _buffer.append(part);
      bytes.remove_prefix(part.size());
      if (_buffer.size() == pieceSize) flush();
    }
  }
  void write(char byte) { write(std::string_view(&byte, 1)); }
  void write(NSStringView text) {
    if (text.isWide()) {
      write(std::string_view(text.utf8()));
    } else {
      write(std::string_view(text.asciiUnits(), text.length()));
    }
  }
  void flush() {
    if (!_sink || _buffer.empty()) return;
    if (!_isStopped) _isStopped = !(*_sink)(_buffer);
    _buffer.clear();
  }

 private:
  static constexpr size_t pieceSize = size_t{64} * 1024;
  std::string& _buffer;
  const Sink* _sink;
  bool _isStopped = false;
};

// What is written in place of each of the first 128 characters; null for itself.
using XMLEscapes = std::array<const char*, 128>;

extern const XMLEscapes XMLPlainEscapes;  // of comments and processing instructions
extern const XMLEscapes XMLTextEscapes;
extern const XMLEscapes XMLAttributeEscapes;
extern const XMLEscapes XMLCDATAEscapes;

void XMLWriteEscaped(XMLOutput& out, NSStringView text, const XMLEscapes& escapes);
// Writes `between` in the middle of every occurrence of `separated`, after its first `keep` units.
void XMLWriteSeparated(XMLOutput& out, NSStringView text, std::string_view separated, uint32_t keep,
                       std::string_view between, const XMLEscapes& escapes);

}  // namespace xquery
