// Shorthands for tests of several threads at once. What the threads find wrong is gathered, since
// assertions belong to the thread of the test; that nothing else goes wrong is for ThreadSanitizer
// to say.
#pragma once

#include "xquery/xquery.h"

#include <barrier>
#include <functional>
#include <mutex>
#include <ostream>
#include <string>
#include <string_view>
#include <thread>
#include <vector>

namespace xquery {

inline constexpr int threadCount = 4;
inline constexpr int evaluations = 4;
inline constexpr int rounds = 30;

// What the threads found wrong.
class Complaints {
 public:
  void add(const std::string& text) {
    const std::lock_guard guard(_mutex);
    _texts.push_back(text);
  }
  const std::vector<std::string>& texts() const { return _texts; }

 private:
  std::mutex _mutex;
  std::vector<std::string> _texts;
};

// Runs the work in all threads, which begin together, and answers when they are done.
inline std::vector<std::string> together(
    const std::function<void(int thread, Complaints& complaints)>& work) {
  Complaints complaints;
  std::barrier start(threadCount);
  std::vector<std::thread> threads;
  for (int t = 0; t < threadCount; ++t) {
    threads.emplace_back([&, t] {
      start.arrive_and_wait();
      work(t, complaints);
    });
  }
  for (auto& thread : threads) thread.join();
  return complaints.texts();
}

inline const std::vector<std::string> none;

inline Ref<NSXMLDocument> parsed(std::string_view xml) {
  return NSXMLDocument::documentWithData(xml, NSXMLNodePreserveWhitespace);
}

inline std::string library(int books) {
  std::string xml = "<library xmlns:m=\"urn:m\"><!-- all --><?style plain?>";
  for (int i = 0; i < books; ++i) {
    const std::string number = std::to_string(i);
    xml += "<book id=\"b" + number + "\" m:kind=\"k" + std::to_string(i % 3) + "\"><title>Title " +
           number + (i % 5 == 0 ? " \xC3\xA9t\xC3\xA9" : "") + "</title><price>" +
           std::to_string((i * 37) % 100) + ".5</price><day>20" + (i % 90 < 10 ? "0" : "") +
           std::to_string(i % 90) + "-02-1" + std::to_string(i % 9) + "</day><m:note>n<b>" +
           number + "</b></m:note></book>";
  }
  return xml + "</library>";
}

inline std::string printed(const Ref<NSArray>& items, const Ref<XQueryError>& error) {
  if (!items) return error ? "error: " + error->description()->utf8() : "nothing";
  std::string text;
  for (const Value& item : items->objects()) {
    text += XQueryItemTypeName(*item) + ' ';
    if (const auto* node = dyn_cast<NSXMLNode>(item)) {
      node->appendXMLTo(text);
    } else {
      text += XQueryItemStringValue(*item);
    }
    text += '\n';
  }
  return text;
}

inline Ref<XQueryContext> newContext() {
  return XQueryContext::xqueryContextWithNamespaces({{"late", "urn:late"}});
}

inline std::string evaluated(XQueryContext& context, const XQuery& query, const Value& item,
                             const XQueryVariables& constants = {}) {
  Ref<XQueryError> error;
  const auto items = context.evaluateXQuery(query, constants, item, &error);
  return printed(items, error);
}
inline std::string evaluated(const XQuery& query, const Value& item,
                             const XQueryVariables& constants = {}) {
  return evaluated(*newContext(), query, item, constants);
}

inline std::string evaluated(std::string_view source, const Value& item = Value()) {
  return evaluated(*XQuery::xqueryWithSource(source), item);
}

struct Work {
  const char* name;
  const char* query;
};
inline void PrintTo(const Work& work, std::ostream* out) {
  *out << work.name;
}

// Evaluates the query in all threads together, again and again, each time over a query and a
// document that nobody has used: whatever they make on first use is made by threads that meet
// there. The results must be those of a thread alone with others of its own; that text is the
// answer.
inline std::string evaluatedTogether(std::string_view source, const std::string& xml,
                                     std::vector<std::string>& complaints) {
  const std::string expected = evaluated(source, parsed(xml));
  std::vector<Ref<XQuery>> queries;
  std::vector<Ref<NSXMLDocument>> documents;
  for (int round = 0; round < rounds; ++round) {
    queries.push_back(XQuery::xqueryWithSource(source));
    documents.push_back(parsed(xml));
    if (queries.back()->parseErrors()) complaints.push_back("the query does not compile");
  }
  std::barrier roundStart(threadCount);
  const auto found = together([&](int, Complaints& wrong) {
    for (size_t round = 0; round < queries.size(); ++round) {
      const auto context = newContext();
      roundStart.arrive_and_wait();
      const std::string text = evaluated(*context, *queries[round], documents[round]);
      if (text != expected) wrong.add(text);
    }
  });
  complaints.insert(complaints.end(), found.begin(), found.end());
  // The document is what it was.
  if (documents[0]->XMLString()->utf8() != parsed(xml)->XMLString()->utf8()) {
    complaints.push_back("the document was changed");
  }
  return expected;
}

}  // namespace xquery
