#include <xquery/xquery.h>

#include <iostream>

using namespace xquery;

int main(int argc, char** argv) {
  const auto document = XQueryReadFile(argc > 1 ? argv[1] : "examples/books.xml");
  const auto items = XQueryEvaluate(argc > 2 ? argv[2] : "//book[price > 10]/title", document);
  for (const Value& item : items.valueOr({})) std::cout << XQueryItemStringValue(*item) << '\n';
  if (items) return 0;
  std::cerr << items.error()->description()->utf8() << '\n';
  return document ? 1 : 3;
}
