// What the command reads: the text of the query, the documents.
#pragma once

#include "Options.h"
#include "xquery/xquery.h"

#include <string>
#include <vector>

namespace cli {

// Ends what is under way with a status; the message is for standard error.
struct Failure {
  Status status = StatusInput;
  std::string message;
  std::vector<xquery::Ref<xquery::NSError>> errors;  // that it describes, of the query
};

// The bytes of a file; throws Failure.
std::string readFile(const std::string& path);
std::string readStandardInput();

// The query, as -e or its file gives it; throws Failure.
xquery::Ref<xquery::NSString> queryText(const Options& options);

enum class Markup { XML, HTML };

// "-" is standard input. Throws Failure.
xquery::Ref<xquery::NSXMLDocument> readDocument(const Options& options, const std::string& path,
                                                Markup markup);

// How messages and results name an input.
std::string inputName(const std::string& path);

// The variables and documents that the options bind; throws Failure.
xquery::XQueryConstants bindConstants(const Options& options);

}  // namespace cli
