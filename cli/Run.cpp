#include "Run.h"

#include "Messages.h"
#include "Output.h"
#include "Progress.h"
#include "Streams.h"
#include "Timing.h"
#include "xquery/xquery.h"

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <memory>
#include <string_view>

namespace cli {
namespace {

using namespace xquery;

// Ends the run with a status; what there is to say has been said.
struct Stop {
  Status status;
};

[[noreturn]] void stop(Status status, const std::string& message) {
  writeMessage(visible(message) + "\n");
  throw Stop{status};
}

struct CloseFile {
  void operator()(std::FILE* file) const { std::fclose(file); }
};

std::string readFile(const std::string& path) {
  const std::unique_ptr<std::FILE, CloseFile> file(std::fopen(path.c_str(), "rb"));
  std::string text;
  char piece[65536];
  while (const size_t count = file ? std::fread(piece, 1, sizeof piece, file.get()) : 0) {
    text.append(piece, count);
  }
  // A directory opens but cannot be read.
  if (!file || std::ferror(file.get())) {
    stop(StatusInput, "xquery: " + path + ": " + std::strerror(errno));
  }
  return text;
}

Ref<NSString> queryText(const Options& options) {
  const std::string bytes = options.queryText ? *options.queryText : readFile(options.queryFile);
  const Ref<NSString> text = NSString::stringWithUTF8(bytes);
  if (!text) {
    const std::string name = options.queryText ? "the query given with -e" : options.queryFile;
    stop(StatusInput, "xquery: " + name + ": not UTF-8 text");
  }
  return text;
}

enum class Markup { XML, HTML };

Ref<NSXMLDocument> readDocument(const Options& options, const std::string& path, Markup markup) {
  NSXMLParseError error;
  uint32_t mode = options.stripSpace ? NSXMLNodeOptionsNone : NSXMLNodePreserveWhitespace;
  if (markup == Markup::HTML) mode |= NSXMLDocumentTidyHTML;
  const std::string name = path == "-" ? "standard input" : path;
  Ref<NSXMLDocument> document;
  {
    ProgressLine line(visible(name));
    document = NSXMLDocument::documentWithFile(
        path, mode, &error, [&line](uint64_t bytes, uint64_t whole) { line.show(bytes, whole); });
  }
  if (document) return document;
  if (error.line == 0) {
    // The reason why a file cannot be read begins with its path.
    const size_t named = error.message.starts_with(path + ": ") ? path.size() + 2 : 0;
    stop(StatusInput, "xquery: " + name + ": " + error.message.substr(named));
  }
  stop(StatusInput, name + ":" + std::to_string(error.line) + ":" + std::to_string(error.column) +
                        ": " + error.message);
}

XQueryConstants bindConstants(const Options& options) {
  XQueryConstants constants;
  for (const Binding& binding : options.variables) {
    constants[binding.name] = XQueryUntypedAtomic(binding.value);
  }
  for (const Binding& binding : options.documents) {
    constants[binding.name] = readDocument(options, binding.value, Markup::XML);
  }
  return constants;
}

// What a query names beside it is looked for beside its file, or in the working folder.
Ref<XQuery> compile(const Options& options, const Ref<NSString>& source) {
  XQueryLoading loading;
  const auto URL = NSURL::fileURLWithPath(options.queryText ? "./" : options.queryFile);
  if (URL) loading.moduleURL = URL->absoluteString()->utf8();
  const XQueryWay way = options.plan ? XQueryWay::Explained : XQueryWay::Planned;
  Ref<XQuery> query = XQuery::xqueryWithSource(source, loading, XQueryLimits(), way);
  const Ref<NSArray> errors = query->parseErrors();
  if (!errors || errors->count() == 0) return query;
  stop(StatusQueryError, descriptions(*errors));
}

// Null for a query that has no value and no error, such as a library module. A value that is an
// error counts as one wherever it stands, and then nothing is printed.
Ref<NSArray> evaluate(XQueryContext& context, const XQuery& query, const XQueryConstants& constants,
                      const Value& contextItem) {
  Ref<XQueryError> error;
  Ref<NSArray> items = context.evaluateXQuery(query, constants, contextItem, &error);
  if (const Ref<NSError> failure = XQueryFirstError(items, error)) {
    stop(StatusQueryError, description(*failure));
  }
  return items;
}

void printData(std::string_view bytes, Output& output) {
  static constexpr char digits[] = "0123456789ABCDEF";
  for (const char byte : bytes) {
    const auto value = static_cast<unsigned char>(byte);
    const char pair[] = {digits[value >> 4], digits[value & 15]};
    output.append({pair, 2});
  }
}

void printItem(const NSObject& item, bool types, Output& output) {
  if (types) {
    output.append(XQueryItemTypeName(item));
    output.append("\t");
  }
  if (item.isNode()) {
    cast<NSXMLNode>(&item)->writeXML(
        [&output](std::string_view xml) { return output.append(xml); });
  } else if (isa<NSData>(&item)) {
    printData(cast<NSData>(&item)->bytes(), output);
  } else {
    output.append(XQueryItemStringValue(item));
  }
  output.append("\n");
}

// Opens the output, has it written and closes it.
template <class Write>
bool print(const Options& options, Write write) {
  Output output;
  const std::string name = options.outputFile.value_or("standard output");
  if (output.open(options.outputFile)) {
    write(output);
    if (output.finish()) return true;
  }
  stop(StatusInput, "xquery: cannot write " + name + ": " + output.error());
}

bool printItems(const Options& options, const NSArray* items) {
  return print(options, [&](Output& output) {
    const size_t count = items ? items->count() : 0;
    for (size_t i = 0; i < count && output.error().empty(); i++) {
      printItem(*items->objectAtIndex(i), options.types, output);
    }
  });
}

bool printPlan(const Options& options, const XQuery& query) {
  return print(options, [&](Output& output) {
    output.append(query.planDescription(*options.plan)->utf8());
  });
}

void runPhases(const Options& options) {
  Phases phases;
  const Ref<NSString> source = queryText(options);
  const Ref<XQuery> query = phases.compile.measure([&] { return compile(options, source); });
  if (options.plan) {
    printPlan(options, *query);
    return;
  }
  Value contextItem;
  const XQueryConstants constants = phases.parse.measure([&] {
    if (options.input) {
      contextItem =
          readDocument(options, *options.input, options.html ? Markup::HTML : Markup::XML);
    }
    return bindConstants(options);
  });
  const Ref<XQueryContext> context = XQueryContext::xqueryContextWithNamespaces(options.namespaces);
  Ref<NSArray> items;
  for (unsigned n = 0; n < options.repeat; n++) {
    items = nullptr;
    items =
        phases.evaluate.measure([&] { return evaluate(*context, *query, constants, contextItem); });
  }
  phases.print.measure([&] { return printItems(options, items.get()); });
  if (options.time) phases.report(options.repeat > 1);
}

}  // namespace

Status run(const Options& options) {
  try {
    runPhases(options);
    return StatusResult;
  } catch (const Stop& end) {
    return end.status;
  } catch (const std::exception& error) {
    writeMessage("xquery: " + visible(error.what()) + "\n");
    return StatusInput;
  }
}

}  // namespace cli
