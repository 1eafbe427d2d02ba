#include <xquery/xquery.h>

#include <future>
#include <iostream>
#include <thread>

using namespace xquery;
using namespace std::chrono_literals;

void print(const XQueryResult<XQueryItemRange>& items) {
  if (!items) std::cout << items.error()->description()->utf8() << '\n';
  for (const Value& item : items.valueOr({})) {
    std::cout << XQueryItemTypeName(*item) << ' ' << XQueryItemStringValue(*item) << '\n';
  }
}

void printTitles(const Ref<NSXMLDocument>& books) {
  const auto query =
      XQueryCompile("declare variable $limit external; //book[price > $limit]/title");
  print(XQueryEvaluate(query, books, {{"limit", XQueryMakeInteger(20)}}));
  print(XQueryEvaluate("1 +\n1 idiv 0"));
}

void printWeekLater(std::chrono::year_month_day day) {
  const auto query =
      XQueryCompile("declare variable $day external; $day + xdt:dayTimeDuration('P7D')");
  print(XQueryEvaluate(query, {}, {{"day", XQueryMakeDate(day).valueOr(nullptr)}}));
}

void printFrozen() {
  const auto document = NSXMLDocument::document();
  const auto order = XQueryMakeElement("order");
  if (!order || !XQuerySetAttribute(**order, "n", "7") || !XQueryAddChild(*document, *order))
    return;
  const auto frozen = XQueryFreeze(document);
  const auto refused = XQuerySetText(*frozen->rootElement(), "late");
  std::cout << frozen->XMLString()->utf8() << ' ' << refused.error()->msg()->utf8() << '\n';
}

void cancelFromAnotherThread() {
  const auto context = XQueryContext::xqueryContext();
  XQueryLimits limits;
  limits.duration = 60s;
  limits.memoryCeiling = 512 << 20;
  limits.cancelled = std::make_shared<std::atomic<bool>>(false);
  context->contextSetLimits(limits);
  const std::jthread other([flag = limits.cancelled] {
    std::this_thread::sleep_for(50ms);
    flag->store(true);
  });
  const auto query = XQueryCompile("count(for $i in 1 to 1000000, $j in 1 to 1000000 return $i)");
  print(XQueryEvaluate(query, {}, {}, context));
}

struct Archive : XQueryLoader {
  std::optional<XQueryResource> load(const NSURL& URL, XQueryLoadPurpose) override {
    if (URL.absoluteString()->utf8() != "archive://host/greeting.xml") return std::nullopt;
    return XQueryResource{"<greeting>hello</greeting>", {}, "application/xml", {}};
  }
};

struct Listener : XQueryClient {
  void XQueryClientMissesDocument(const XQueryMissingDocument& document, XQueryContext&) override {
    std::cout << document.URL << " is missing: " << document.reason << '\n';
  }
};

void loadFromAnArchive() {
  const auto context = XQueryContext::xqueryContext();
  XQueryLoading loading;
  loading.policy = XQueryLoadingPolicy::denyAll().allowURLsBelow("archive://host/");
  loading.loader = std::make_shared<Archive>();
  context->contextSetLoading(loading);
  context->contextSetClient(std::make_shared<Listener>());
  print(XQueryEvaluate("doc('archive://host/greeting.xml'), doc('file:///etc/passwd')", {}, {},
                       context));
}

void printPrices(const std::string& path) {
  const auto query = XQueryCompile("/catalogue/book/price/text()", {}, {}, XQueryWay::Streamed);
  XQueryStreamInput input;
  input.path = path;
  const auto done = XQueryEvaluateStream(query, input, [](const Value& item) {
    std::cout << XQueryItemStringValue(*item) << ' ';
    return true;  // go on
  });
  std::cout << (done ? "all\n" : "failed\n");
}

void askFromTwoThreads(const Ref<NSXMLDocument>& books) {
  const auto query = XQueryCompile("count(//book)");
  auto other = std::async(std::launch::async, [&] { return XQueryEvaluate(query, books); });
  print(XQueryEvaluate(query, books));
  print(other.get());
}

int main(int argc, char** argv) {
  const char* file = argc > 1 ? argv[1] : "examples/books.xml";
  const auto books = XQueryReadFile(file);
  if (!books) return 3;
  printTitles(*books);
  printWeekLater(2026y / 11 / 23);
  printFrozen();
  cancelFromAnotherThread();
  loadFromAnArchive();
  printPrices(file);
  askFromTwoThreads(*books);
}
