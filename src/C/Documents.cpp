// Documents from files, memory and the host's callbacks.
#include "C/Documents.h"

#include "C/Errors.h"
#include "C/Nodes.h"
#include "C/Texts.h"
#include "Platform/Reading/XMLDocuments.h"

using namespace xquery;
using namespace xquery::capi;

namespace xquery::capi {

bool areReadingFlags(xq_reading flags) {
  return (flags & ~(XQ_READ_STRIP_SPACE | XQ_READ_CDATA | XQ_READ_HTML)) == 0;
}

uint32_t readingOptions(xq_reading flags) {
  uint32_t options = NSXMLNodeOptionsNone;
  if (!(flags & XQ_READ_STRIP_SPACE)) options |= NSXMLNodePreserveWhitespace;
  if (flags & XQ_READ_CDATA) options |= NSXMLNodePreserveCDATA;
  if (flags & XQ_READ_HTML) options |= NSXMLDocumentTidyHTML;
  return options;
}

ptrdiff_t HostInput::operator()(char* buffer, size_t size) {
  if (_isOver) return _hasFailed ? -1 : 0;
  const ptrdiff_t count = _read(_data, buffer, size);
  _hasFailed = count < 0 || static_cast<size_t>(count) > size;
  _isOver = _hasFailed || count == 0;
  return _hasFailed ? -1 : count;
}

}  // namespace xquery::capi

namespace {

// Gives the document that `read` answers, or the error that it fills in.
template <class Read>
xq_status readDocumentBy(xq_reading flags, xq_node** document, xq_error** error, bool isUsable,
                         Read read) {
  if (error) *error = nullptr;
  if (!document) return XQ_USAGE;
  *document = nullptr;
  if (!isUsable || !areReadingFlags(flags)) return XQ_USAGE;
  return guardedWithin(error, [&] {
    NSXMLParseError failure;
    const Ref<NSXMLDocument> found = read(readingOptions(flags), failure);
    return found ? giveNew(document, found) : giveError(error, failure);
  });
}

}  // namespace

xq_status xq_read_file(const char* path, size_t length, xq_reading flags, xq_node** document,
                       xq_error** error) {
  const GivenText text(path, length);
  const bool isUsable = path && text.isPath();
  return readDocumentBy(flags, document, error, isUsable, [&](uint32_t options, auto& failure) {
    return NSXMLDocument::documentWithFile(std::string(text.view()), options, &failure);
  });
}

xq_status xq_read_memory(const char* bytes, size_t length, xq_reading flags, xq_node** document,
                         xq_error** error) {
  const bool isUsable = length != XQ_NUL && (bytes || length == 0);
  return readDocumentBy(flags, document, error, isUsable, [&](uint32_t options, auto& failure) {
    const std::string_view text = bytes ? std::string_view(bytes, length) : std::string_view("");
    return NSXMLDocument::documentWithData(text, options, &failure);
  });
}

xq_status xq_read_input(xq_read read, void* data, xq_reading flags, xq_node** document,
                        xq_error** error) {
  return readDocumentBy(flags, document, error, read != nullptr,
                        [&](uint32_t options, auto& failure) {
                          HostInput input(read, data);
                          const auto found = documentWithInput(std::ref(input), options, failure);
                          if (input.hasFailed()) throw HostFailed();
                          return found;
                        });
}

xq_status xq_node_document_uri(const xq_node* node, xq_text* uri) {
  if (!emptied(uri) || !areGood(node)) return XQ_USAGE;
  return guarded([&]() -> xq_status {
    const NSXMLDocument* document = node->node->rootDocument();
    return document ? fill(*uri, document->documentURI()) : XQ_END;
  });
}
