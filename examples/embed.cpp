#include <xquery/xquery.h>

#include <iostream>

using namespace xquery;

int main(int argc, char** argv) {
  const char* file = argc > 1 ? argv[1] : "examples/books.xml";
  const char* text = argc > 2 ? argv[2] : "//book[price > 10]/title";
  NSXMLParseError problem;
  auto document = NSXMLDocument::documentWithFile(file, NSXMLNodePreserveWhitespace, &problem);
  if (!document) {
    std::cerr << file << ": " << problem.message << '\n';
    return 3;
  }
  auto query = XQuery::xqueryWithSource(text);
  auto context = XQueryContext::xqueryContext();
  Ref<XQueryError> error;
  auto items = context->evaluateXQuery(*query, {}, document, &error);
  if (auto failure = XQueryFirstError(items, error)) {
    std::cerr << failure->description()->utf8() << '\n';
    return 1;
  }
  if (!items) return 0;  // an empty query has no value
  for (const Value& item : items->objects()) std::cout << XQueryItemStringValue(*item) << '\n';
}
