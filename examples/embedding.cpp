#include <xquery/xquery.h>

#include <iostream>
#include <thread>

using namespace xquery;

// Null, and the errors on standard error, for a text that does not compile.
Ref<XQuery> compiled(std::string_view text) {
  auto query = XQuery::xqueryWithSource(text);
  const auto errors = query->parseErrors();
  if (!errors) return query;
  for (const Value& error : errors->objects()) {
    std::cerr << cast<XQueryError>(error)->description()->utf8() << '\n';
  }
  return nullptr;
}

void printTitles(const Ref<NSXMLDocument>& books) {
  const auto query = compiled("declare variable $limit external; //book[price > $limit]/title");
  const auto context = XQueryContext::xqueryContext();
  Ref<XQueryError> error;
  const auto items =
      context->evaluateXQuery(*query, {{"limit", NSNumber::numberWithLongLong(20)}}, books, &error);
  if (const auto failure = XQueryFirstError(items, error)) {
    std::cerr << failure->description()->utf8() << '\n';
    return;
  }
  if (!items) return;  // such as of an empty query
  for (const Value& item : items->objects()) {
    std::cout << XQueryItemTypeName(*item) << ' ' << XQueryItemStringValue(*item) << '\n';
    if (const auto* node = dyn_cast<NSXMLNode>(item))
      std::cout << node->XMLString()->utf8() << '\n';
  }
}

void printError() {
  const auto query = compiled("1 +\n1 idiv 0");
  Ref<XQueryError> error;
  const auto items = XQueryContext::xqueryContext()->evaluateXQuery(*query, {}, {}, &error);
  if (!items && error) {
    std::cout << error->err() << ' ' << error->msg()->utf8() << ", line " << error->line() << '\n';
  }
}

void cancelFromAnotherThread() {
  const auto query = compiled("count(for $i in 1 to 1000000, $j in 1 to 1000000 return $i)");
  const auto context = XQueryContext::xqueryContext();
  XQueryLimits limits;
  limits.duration = std::chrono::seconds(60);
  limits.memoryCeiling = 512 * 1024 * 1024;
  limits.cancelled = std::make_shared<std::atomic<bool>>(false);
  context->contextSetLimits(limits);
  std::thread other([flag = limits.cancelled] {
    std::this_thread::sleep_for(std::chrono::milliseconds(50));
    flag->store(true);
  });
  Ref<XQueryError> error;
  const auto items = context->evaluateXQuery(*query, {}, {}, &error);
  other.join();
  if (!items && error) std::cout << error->msg()->utf8() << '\n';
}

class Archive : public XQueryLoader {
 public:
  std::optional<XQueryResource> load(const NSURL& URL, XQueryLoadPurpose) override {
    if (URL.absoluteString()->utf8() != "archive://host/greeting.xml") return std::nullopt;
    return XQueryResource{"<greeting>hello</greeting>", {}, "application/xml", {}};
  }
};

class Listener : public XQueryClient {
 public:
  void XQueryClientTraceValue(const Value& value, const Ref<NSString>& label,
                              XQueryContext&) override {
    std::cout << label->utf8() << ": " << XQueryItemStringValue(*value) << '\n';
  }
  void XQueryClientMissesDocument(const XQueryMissingDocument& document, XQueryContext&) override {
    std::cout << document.URL << " is missing: " << document.reason << '\n';
  }
};

void loadFromAnArchive() {
  XQueryLoading loading;
  loading.policy = XQueryLoadingPolicy::denyAll().allowURLsBelow("archive://host/");
  loading.loader = std::make_shared<Archive>();
  const auto context = XQueryContext::xqueryContext();
  context->contextSetLoading(loading);
  context->contextSetClient(std::make_shared<Listener>());
  const auto query = compiled(
      "trace(string(doc('archive://host/greeting.xml')), 'heard'),"
      "doc('archive://host/none.xml'), doc('file:///etc/passwd')");
  const auto items = context->evaluateXQuery(*query, {}, {});
  if (items) std::cout << items->count() << " item\n";
}

void printPrices(const std::string& path) {
  const auto query = XQuery::xqueryWithSource("/catalogue/book/price/text()", XQueryLoading(),
                                              XQueryLimits(), XQueryWay::Streamed);
  if (query->parseErrors()) return;  // such as why it cannot be a stream
  XQueryStreamInput input;
  input.path = path;
  XQueryStreamFailure failure;
  const auto context = XQueryContext::xqueryContext();
  const bool isWhole = context->evaluateStream(
      *query, {}, input,
      [](const Value& item) {
        std::cout << XQueryItemStringValue(*item) << ' ';
        return true;  // go on
      },
      failure);
  std::cout << (isWhole ? "all\n" : "failed\n");
}

void askFromTwoThreads(const Ref<NSXMLDocument>& books) {
  const auto query = compiled("count(//book)");
  std::string answers[2];
  const auto ask = [&](std::string& answer) {
    const auto items = XQueryContext::xqueryContext()->evaluateXQuery(*query, {}, books);
    if (items) answer = XQueryItemStringValue(*items->objectAtIndex(0));
  };
  std::thread other(ask, std::ref(answers[0]));
  ask(answers[1]);
  other.join();
  std::cout << answers[0] << ' ' << answers[1] << '\n';
}

int main(int argc, char** argv) {
  const char* file = argc > 1 ? argv[1] : "examples/books.xml";
  NSXMLParseError problem;
  const auto books = NSXMLDocument::documentWithFile(file, NSXMLNodePreserveWhitespace, &problem);
  if (!books) {
    std::cerr << file << ": " << problem.message << '\n';
    return 3;
  }
  printTitles(books);
  printError();
  cancelFromAnotherThread();
  loadFromAnArchive();
  printPrices(file);
  askFromTwoThreads(books);
}
