#include "Documents.h"

#include "Inputs.h"
#include "Messages.h"
#include "Progress.h"

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <functional>
#include <memory>
#include <optional>

namespace cli {
namespace {

using namespace xquery;

struct CloseFile {
  void operator()(std::FILE* file) const { std::fclose(file); }
};

// Of a query. What has no end is not read until memory has.
constexpr size_t mostQueryBytes = size_t{64} << 20;

// A directory opens but cannot be read.
std::string readAll(std::FILE* file, const std::string& name, size_t mostBytes) {
  std::string text;
  char piece[65536];
  while (const size_t count = file ? std::fread(piece, 1, sizeof piece, file) : 0) {
    text.append(piece, count);
    if (text.size() <= mostBytes) continue;
    const std::string most = std::to_string(mostBytes >> 20) + " MiB";
    throw Failure{StatusInput, "xquery: " + name + ": longer than " + most, {}};
  }
  if (file && !std::ferror(file)) return text;
  throw Failure{StatusInput, "xquery: " + name + ": " + std::strerror(errno), {}};
}

// Several inputs at a time would write over each other's line.
bool showsProgress(const Options& options) {
  return !options.quiet && (options.progress || options.inputs.size() + !!options.filesFrom < 2);
}

}  // namespace

std::string readFile(const std::string& path, size_t mostBytes) {
  if (path == "-") return readAll(stdin, shownName(path), mostBytes);
  const std::unique_ptr<std::FILE, CloseFile> file(std::fopen(path.c_str(), "rb"));
  return readAll(file.get(), shownName(path), mostBytes);
}

namespace {

// A script's first line, which names the command to the system, is for the query a blank one. An
// editor may have put a byte order mark before it.
std::string withoutInterpreter(std::string text) {
  const size_t start = text.starts_with(byteOrderMark) ? byteOrderMark.size() : 0;
  if (std::string_view(text).substr(start).starts_with("#!")) {
    text.erase(start, std::min(text.find_first_of("\r\n"), text.size()) - start);
  }
  return text;
}

std::string queryBytes(const Options& options) {
  if (options.queryText) return *options.queryText;
  return withoutInterpreter(readFile(options.queryFile, mostQueryBytes));
}

}  // namespace

Ref<NSString> queryText(const Options& options) {
  const std::string bytes = queryBytes(options);
  const Ref<NSString> text = NSString::stringWithUTF8(bytes);
  if (!text) {
    const std::string name =
        options.queryText ? "the query given with -e" : shownName(options.queryFile);
    throw Failure{StatusInput, "xquery: " + name + ": not UTF-8 text", {}};
  }
  return text;
}

std::string inputName(const std::string& path) {
  return path == "-" ? "standard input" : path;
}

std::string shownName(const std::string& path) {
  return visibleName(inputName(path));
}

uint32_t readingMode(const Options& options) {
  return options.stripSpace ? NSXMLNodeOptionsNone : NSXMLNodePreserveWhitespace;
}

Failure readingFailure(const std::string& path, const NSXMLParseError& error) {
  const std::string name = shownName(path);
  if (error.line == 0) {
    // The reason why a file cannot be read begins with its path.
    const size_t named = error.message.starts_with(path + ": ") ? path.size() + 2 : 0;
    return {StatusInput, "xquery: " + name + ": " + error.message.substr(named), {}};
  }
  return {StatusInput,
          name + ":" + std::to_string(error.line) + ":" + std::to_string(error.column) + ": " +
              error.message,
          {}};
}

Failure writingFailure(const std::optional<std::string>& path, const std::string& reason) {
  const std::string name = visibleName(path.value_or("standard output"));
  return {StatusInput, "xquery: cannot write " + name + ": " + reason, {}};
}

DocumentProgress::DocumentProgress(const Options& options, const std::string& path) {
  if (showsProgress(options)) _line.emplace(shownName(path));
}

NSXMLReadingProgress DocumentProgress::callback() {
  if (!_line) return {};
  return [this](uint64_t bytes, uint64_t whole) { _line->show(bytes, whole); };
}

namespace {

using Reader = std::function<Ref<NSXMLDocument>(uint32_t mode, NSXMLParseError* error,
                                                const NSXMLReadingProgress& progress)>;

Ref<NSXMLDocument> readWith(const Reader& reader, const Options& options, const std::string& path,
                            Markup markup) {
  NSXMLParseError error;
  uint32_t mode = readingMode(options);
  if (markup == Markup::HTML) mode |= NSXMLDocumentTidyHTML;
  Ref<NSXMLDocument> document;
  {
    DocumentProgress progress(options, path);
    document = reader(mode, &error, progress.callback());
  }
  if (!document) throw readingFailure(path, error);
  return document;
}

// JSON has the places of nodes, which are counted among those beside them.
bool showsSurroundings(const Options& options, const XQuery& query) {
  return options.format == Format::JSON && XQueryProjectionOf(query).answersNodes;
}

}  // namespace

Ref<NSXMLDocument> readDocument(const Options& options, const std::string& path, Markup markup) {
  const auto reader = [&](uint32_t mode, NSXMLParseError* error,
                          const NSXMLReadingProgress& progress) {
    return NSXMLDocument::documentWithFile(path, mode, error, progress);
  };
  return readWith(reader, options, path, markup);
}

Ref<NSXMLDocument> readInput(const Options& options, const std::string& path, const XQuery& query) {
  const Markup markup = options.html ? Markup::HTML : Markup::XML;
  if (showsSurroundings(options, query)) return readDocument(options, path, markup);
  const auto reader = [&](uint32_t mode, NSXMLParseError* error,
                          const NSXMLReadingProgress& progress) {
    return XQueryProjectedDocumentWithFile(query, path, mode, error, progress);
  };
  return readWith(reader, options, path, markup);
}

XQueryVariables bindConstants(const Options& options) {
  XQueryVariables constants;
  for (const Binding& binding : options.variables) {
    constants[binding.name] = NSString::stringWithUTF8(binding.value);
  }
  for (const Binding& binding : options.documents) {
    const bool isHTML = options.html && !isNamedXML(binding.value);
    constants[binding.name] =
        readDocument(options, binding.value, isHTML ? Markup::HTML : Markup::XML);
  }
  return constants;
}

}  // namespace cli
