// The doors through which documents come in.
#include "Platform/Base/CountedBytes.h"
#include "Platform/Reading/Tidy.h"
#include "Platform/Reading/XMLDocuments.h"
#include "Platform/Reading/XMLReader.h"

#include <cerrno>
#include <cstring>
#include <fcntl.h>
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
  return NSXMLDocument::documentWithData(*XHTML, options & ~uint32_t{NSXMLDocumentTidyHTML},
                                         &error);
}

std::string readAll(const TextInput& read) {
  std::string bytes;
  std::vector<char> piece(size_t{64} * 1024);
  for (ptrdiff_t count = 0; (count = read(piece.data(), piece.size())) > 0;) {
    bytes.append(piece.data(), static_cast<size_t>(count));
  }
  return bytes;
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

Ref<NSXMLDocument> unreadable(const std::string& path, int failure, NSXMLParseError& error) {
  error = {path + ": " + std::strerror(failure), 0, 0};
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

Ref<NSXMLDocument> NSXMLDocument::documentWithData(std::string_view bytes, uint32_t options,
                                                   NSXMLParseError* error) {
  NSXMLParseError ignored;
  if (options & NSXMLDocumentTidyHTML) return parseHTML(bytes, options, error ? *error : ignored);
  TextSource source(bytes);
  return readDocument(source, options, error ? *error : ignored);
}

Ref<NSXMLDocument> NSXMLDocument::documentWithFile(const std::string& path, uint32_t options,
                                                   NSXMLParseError* error,
                                                   const NSXMLReadingProgress& progress) {
  NSXMLParseError ignored;
  NSXMLParseError& reported = error ? *error : ignored;
  InputFile file(path);
  if (!file.isOpen()) return unreadable(path, errno, reported);
  const TextInput read = [&](char* buffer, size_t size) {
    return file.read(buffer, size, progress);
  };
  if (options & NSXMLDocumentTidyHTML) {
    const std::string bytes = readAll(read);
    if (file.failure()) return unreadable(path, file.failure(), reported);
    return parseHTML(bytes, options, reported);
  }
  TextSource source(read, file.isSeekable() ? [&] { return file.rewind(); } : TextRewinding());
  Ref<NSXMLDocument> document = readDocument(source, options, reported);
  if (!document && file.failure()) return unreadable(path, file.failure(), reported);
  return document;
}

}  // namespace xquery
