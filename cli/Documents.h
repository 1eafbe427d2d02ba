// What the command reads: the text of the query, the documents.
#pragma once

#include "Options.h"
#include "Progress.h"
#include "xquery/xquery.h"

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace cli {

// Ends what is under way with a status; the message is for standard error.
struct Failure {
  Status status = StatusInput;
  std::string message;
  std::vector<xquery::Ref<xquery::NSError>> errors;  // that it describes, of the query
};

// The bytes of a file, or of standard input for "-"; throws Failure, also where there are more than
// so many.
std::string readFile(const std::string& path, size_t mostBytes);

// What may stand before all of a text.
constexpr std::string_view byteOrderMark = "\xEF\xBB\xBF";

// The query, as -e or its file gives it; throws Failure.
xquery::Ref<xquery::NSString> queryText(const Options& options);

enum class Markup { XML, HTML };

// "-" is standard input. Throws Failure.
xquery::Ref<xquery::NSXMLDocument> readDocument(const Options& options, const std::string& path,
                                                Markup markup);
// The same, of what the query needs of an input for results as the options write them.
xquery::Ref<xquery::NSXMLDocument> readInput(const Options& options, const std::string& path,
                                             const xquery::XQuery& query);

// How a document is to be read, and what there is to say of one that could not be.
uint32_t readingMode(const Options& options);
Failure readingFailure(const std::string& path, const xquery::NSXMLParseError& error);
// What there is to say where a file, or without a path standard output, could not be written.
Failure writingFailure(const std::optional<std::string>& path, const std::string& reason);

// The line that shows how far the reading of an input is, while it exists and where one is shown.
class DocumentProgress {
 public:
  DocumentProgress(const Options& options, const std::string& path);
  // Empty where none is shown.
  xquery::NSXMLReadingProgress callback();

 private:
  std::optional<ProgressLine> _line;
};

// How results name an input, and how messages do, where it must not look like a message of its own.
std::string inputName(const std::string& path);
std::string shownName(const std::string& path);

// The variables and documents that the options bind; throws Failure.
xquery::XQueryVariables bindConstants(const Options& options);

}  // namespace cli
