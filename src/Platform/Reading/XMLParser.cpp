// The doors through which documents come in.
#include "Platform/Base/CountedBytes.h"
#include "Platform/Reading/InputFile.h"
#include "Platform/Reading/Tidy.h"
#include "Platform/Reading/UnpackedInput.h"
#include "Platform/Reading/XMLDocuments.h"
#include "Platform/Reading/XMLReader.h"

#include <cstring>
#include <limits>
#include <optional>
#include <vector>

namespace xquery {

namespace {

Ref<NSXMLDocument> parseHTML(std::string_view bytes, uint32_t options, NSXMLParseError& error) {
  std::string failure;
  const auto XHTML = XHTMLFromHTML(bytes, failure);
  if (!XHTML) {
    error = {failure, 0, 0};
    return nullptr;
  }
  const CountedBytes counted(XHTML->capacity());
  TextSource source(*XHTML);
  return readDocument(source, options, error);
}

// Nothing where the input fails.
std::optional<ValueText<char>> readAll(const TextInput& read) {
  ValueText<char> bytes;
  std::vector<char> piece(size_t{64} * 1024);
  ptrdiff_t count = 0;
  while ((count = read(piece.data(), piece.size())) > 0) {
    appendInBlocks(bytes, std::string_view(piece.data(), static_cast<size_t>(count)));
  }
  if (count < 0) return std::nullopt;
  return bytes;
}

// Null as well where the packed bytes turn out to be bad, whatever has been read of them.
Ref<NSXMLDocument> readUnpacked(UnpackedInput& input, uint32_t options,
                                const XMLProjection* projection, NSXMLParseError& error) {
  Ref<NSXMLDocument> document;
  if (options & NSXMLDocumentTidyHTML) {
    if (const auto bytes = readAll(input.input())) document = parseHTML(*bytes, options, error);
  } else {
    TextSource source(input.input(), input.rewinding());
    document = readDocument(source, options, error, XMLWay::Either, projection);
  }
  if (input.failure().empty()) return document;
  error = {input.failure(), 0, 0};
  return nullptr;
}

Ref<NSXMLDocument> unreadable(const std::string& path, const std::string& failure,
                              NSXMLParseError& error) {
  error = {path + ": " + failure, 0, 0};
  return nullptr;
}

Ref<NSXMLDocument> documentWithBytes(std::string_view bytes, uint32_t options, uint64_t mostBytes,
                                     const XMLProjection* projection, NSXMLParseError& error) {
  if (packingOf(bytes)) {
    TextSource packed(bytes);
    TextInput input = packed.fromTheBeginning();
    const auto rewind = [&] {
      input = packed.fromTheBeginning();
      return true;
    };
    UnpackedInput unpacked([&](char* buffer, size_t size) { return input(buffer, size); }, rewind,
                           mostBytes);
    return readUnpacked(unpacked, options, projection, error);
  }
  if (options & NSXMLDocumentTidyHTML) return parseHTML(bytes, options, error);
  TextSource source(bytes);
  return readDocument(source, options, error, XMLWay::Either, projection);
}

}  // namespace

Ref<NSXMLDocument> readDocument(TextSource& source, uint32_t options, NSXMLParseError& error,
                                XMLWay way, const XMLProjection* projection) {
  if (way != XMLWay::LibXML) {
    Ref<NSXMLDocument> document = readXML(source, options, projection);
    if (document || way == XMLWay::Own) return document;
  }
  return readWithLibXML(source.fromTheBeginning(), options, source.expectedBytes(), error,
                        projection);
}

Ref<NSXMLDocument> documentWithBoundedData(std::string_view bytes, uint32_t options,
                                           uint64_t mostBytes, NSXMLParseError& error) {
  return documentWithBytes(bytes, options, mostBytes, nullptr, error);
}

Ref<NSXMLDocument> projectedDocumentWithData(std::string_view bytes, uint32_t options,
                                             const XMLProjection* projection,
                                             NSXMLParseError& error) {
  return documentWithBytes(bytes, options, std::numeric_limits<uint64_t>::max(), projection, error);
}

Ref<NSXMLDocument> NSXMLDocument::documentWithData(std::string_view bytes, uint32_t options,
                                                   NSXMLParseError* error) {
  NSXMLParseError ignored;
  return documentWithBoundedData(bytes, options, std::numeric_limits<uint64_t>::max(),
                                 error ? *error : ignored);
}

Ref<NSXMLDocument> documentWithInput(const TextInput& input, uint32_t options,
                                     NSXMLParseError& error) {
  UnpackedInput unpacked(input);
  return readUnpacked(unpacked, options, nullptr, error);
}

Ref<NSXMLDocument> NSXMLDocument::documentWithFile(const std::string& path, uint32_t options,
                                                   NSXMLParseError* error,
                                                   const NSXMLReadingProgress& progress) {
  NSXMLParseError ignored;
  return projectedDocumentWithFile(path, options, nullptr, error ? *error : ignored, progress);
}

Ref<NSXMLDocument> projectedDocumentWithFile(const std::string& path, uint32_t options,
                                             const XMLProjection* projection,
                                             NSXMLParseError& error,
                                             const NSXMLReadingProgress& progress) {
  InputFile file(path);
  if (!file.isOpen()) return unreadable(path, std::strerror(file.failure()), error);
  UnpackedInput input([&](char* buffer, size_t size) { return file.read(buffer, size, progress); },
                      file.isSeekable() ? [&] { return file.rewind(); } : TextRewinding());
  Ref<NSXMLDocument> document = readUnpacked(input, options, projection, error);
  if (file.failure()) {
    return unreadable(path, std::strerror(file.failure()), error);
  }
  if (!input.failure().empty()) return unreadable(path, input.failure(), error);
  return document;
}

}  // namespace xquery
