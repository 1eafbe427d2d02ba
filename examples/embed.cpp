#include <xquery/xquery.h>

#include <iostream>

using namespace xquery;

int main(int argc, char** argv) {
  const char* file = argc > 1 ? argv[1] : "examples/books.xml";
  NSXMLParseError problem;
  auto document = NSXMLDocument::documentWithFile(file, NSXMLNodePreserveWhitespace, &problem);
  if (!document) {
    std::cerr << file << ": " << problem.message << '\n';
    return 3;
  }
  auto query = XQuery::xqueryWithSource("//book[price > 10]/title");
  auto context = XQueryContext::xqueryContext();
  Ref<XQueryError> error;
  auto items = context->evaluateXQuery(*query, {}, document, &error);
  if (!items) {
    std::cerr << error->description()->utf8() << '\n';
    return 1;
  }
  for (const Value& item : items->objects()) std::cout << XQueryItemStringValue(*item) << '\n';
}
