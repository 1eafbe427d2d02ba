// The doors through which documents come in.
#include "Platform/Base/CountedBytes.h"
#include "Platform/Reading/Tidy.h"
#include "Platform/Reading/UnpackedInput.h"
#include "Platform/Reading/XMLDocuments.h"
#include "Platform/Reading/XMLReader.h"

#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <limits>
#include <optional>
#include <sys/stat.h>
#include <unistd.h>
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
Ref<NSXMLDocument> readUnpacked(UnpackedInput& input, uint32_t options, NSXMLParseError& error) {
  Ref<NSXMLDocument> document;
  if (options & NSXMLDocumentTidyHTML) {
    if (const auto bytes = readAll(input.input())) document = parseHTML(*bytes, options, error);
  } else {
    TextSource source(input.input(), input.rewinding());
    document = readDocument(source, options, error);
  }
  if (input.failure().empty()) return document;
  error = {input.failure(), 0, 0};
  return nullptr;
}

// An open file, closed at the end unless it is standard input.
class InputFile {
 public:
  explicit InputFile(const std::string& path)
      : _descriptor(path == "-" ? STDIN_FILENO : ::open(path.c_str(), O_RDONLY | O_CLOEXEC)) {}
  ~InputFile() {
    if (_descriptor > STDIN_FILENO) ::close(_descriptor);
  }
  InputFile(const InputFile&) = delete;
  InputFile& operator=(const InputFile&) = delete;

  bool isOpen() const { return _descriptor >= 0; }
  ptrdiff_t read(char* buffer, size_t size, const NSXMLReadingProgress& progress) {
    ptrdiff_t count = 0;
    do {
      count = ::read(_descriptor, buffer, size);
    } while (count < 0 && errno == EINTR);
    if (count < 0) _failure = errno;
    if (count > 0) _bytesRead += static_cast<uint64_t>(count);
    if (count > 0 && progress) progress(_bytesRead, bytesInFile());
    return count;
  }
  // 0 for what has none.
  uint64_t bytesInFile() const {
    struct stat about;
    const bool isFile = ::fstat(_descriptor, &about) == 0 && S_ISREG(about.st_mode);
    return isFile ? static_cast<uint64_t>(about.st_size) : 0;
  }
  int failure() const { return _failure; }
  // Whether it has a beginning to go back to, as files have and pipes have not.
  bool isSeekable() const { return ::lseek(_descriptor, 0, SEEK_CUR) == 0; }
  bool rewind() {
    const bool isThere = ::lseek(_descriptor, 0, SEEK_SET) == 0;
    if (!isThere) _failure = errno;
    _bytesRead = 0;
    return isThere;
  }

 private:
  int _descriptor;
  int _failure = 0;
  uint64_t _bytesRead = 0;
};

Ref<NSXMLDocument> unreadable(const std::string& path, const std::string& failure,
                              NSXMLParseError& error) {
  error = {path + ": " + failure, 0, 0};
  return nullptr;
}

}  // namespace

Ref<NSXMLDocument> readDocument(TextSource& source, uint32_t options, NSXMLParseError& error,
                                XMLWay way) {
  if (way != XMLWay::LibXML) {
    Ref<NSXMLDocument> document = readXML(source, options);
    if (document || way == XMLWay::Own) return document;
  }
  return readWithLibXML(source.fromTheBeginning(), options, source.expectedBytes(), error);
}

Ref<NSXMLDocument> documentWithBoundedData(std::string_view bytes, uint32_t options,
                                           uint64_t mostBytes, NSXMLParseError& error) {
  if (packingOf(bytes)) {
    TextSource packed(bytes);
    TextInput input = packed.fromTheBeginning();
    const auto rewind = [&] {
      input = packed.fromTheBeginning();
      return true;
    };
    UnpackedInput unpacked([&](char* buffer, size_t size) { return input(buffer, size); }, rewind,
                           mostBytes);
    return readUnpacked(unpacked, options, error);
  }
  if (options & NSXMLDocumentTidyHTML) return parseHTML(bytes, options, error);
  TextSource source(bytes);
  return readDocument(source, options, error);
}

Ref<NSXMLDocument> NSXMLDocument::documentWithData(std::string_view bytes, uint32_t options,
                                                   NSXMLParseError* error) {
  NSXMLParseError ignored;
  return documentWithBoundedData(bytes, options, std::numeric_limits<uint64_t>::max(),
                                 error ? *error : ignored);
}

Ref<NSXMLDocument> NSXMLDocument::documentWithFile(const std::string& path, uint32_t options,
                                                   NSXMLParseError* error,
                                                   const NSXMLReadingProgress& progress) {
  NSXMLParseError ignored;
  NSXMLParseError& reported = error ? *error : ignored;
  InputFile file(path);
  if (!file.isOpen()) return unreadable(path, std::strerror(errno), reported);
  UnpackedInput input([&](char* buffer, size_t size) { return file.read(buffer, size, progress); },
                      file.isSeekable() ? [&] { return file.rewind(); } : TextRewinding());
  Ref<NSXMLDocument> document = readUnpacked(input, options, reported);
  if (file.failure()) {
    return unreadable(path, std::strerror(file.failure()), reported);
  }
  if (!input.failure().empty()) return unreadable(path, input.failure(), reported);
  return document;
}

}  // namespace xquery
