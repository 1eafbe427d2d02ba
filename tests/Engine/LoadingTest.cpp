// Documents and raw bodies of a context, and what a compilation may load.
#include "Context/XQueryContextInternal.h"
#include "Expr/XQuerySequence.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Loading/HTTPServer.h"
#include "Platform/Loading/LoadingTestSupport.h"
#include "Platform/Reading/PackedText.h"
#include "xquery/xquery.h"

#include <gtest/gtest.h>

#include <future>
#include <map>
#include <memory>
#include <new>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

namespace xquery {
namespace {

using std::chrono::milliseconds;

class Loading : public testing::Test {
 protected:
  XQueryContextInternal& internal() { return _internal(*context); }
  // The document as XML, or "(empty)" when it cannot be had.
  std::string document(const std::string& URL) {
    const Value value = internal().XQueryDocumentForURL(URLOf(URL));
    if (isNull(value)) return "(empty)";
    const auto* parsed = dyn_cast<NSXMLDocument>(value);
    return parsed ? parsed->rootElement()->XMLString()->utf8() : "(no document)";
  }
  std::string body(const std::string& URL) {
    const auto data = internal().URLBody(URLOf(URL));
    return data ? std::string(data->bytes()) : "(none)";
  }
  void setPolicy(XQueryLoadingPolicy policy) {
    XQueryLoading loading;
    loading.policy = std::move(policy);
    context->contextSetLoading(loading);
  }

  HTTPServer server;
  TestFolder folder;
  Ref<XQueryContext> context = XQueryContext::xqueryContext();
};

// --- documents -----------------------------------------------------------------------------------

TEST_F(Loading, DocumentsComeFromFilesAndServers) {
  EXPECT_EQ(document(folder.write("a.xml", "<a/>")), "<a/>");
  server.answer("/b", "application/xml", "<b/>");
  EXPECT_EQ(document(server.URL("/b")), "<b/>");
}

TEST_F(Loading, ADocumentIsFetchedOnceInTheLifeOfAContext) {
  server.answer("/a", "application/xml", "<a/>");
  const auto URL = server.URL("/a");
  const Value first = internal().XQueryDocumentForURL(URLOf(URL));
  const Value second = internal().XQueryDocumentForURL(URLOf(URL));
  EXPECT_EQ(first, second);
  EXPECT_EQ(server.requests("/a"), 1);
  context = XQueryContext::xqueryContext();
  EXPECT_EQ(document(URL), "<a/>");
  EXPECT_EQ(server.requests("/a"), 2);
}

TEST_F(Loading, UrlsAreToldApartByTheirWholeText) {
  server.answer("/a", "application/xml", "<a/>");
  server.answer("/a?x", "application/xml", "<x/>");
  EXPECT_EQ(document(server.URL("/a")), "<a/>");
  EXPECT_EQ(document(server.URL("/a?x")), "<x/>");
  EXPECT_EQ(document(server.URL("/a#part")), "<a/>");
  EXPECT_EQ(server.requests("/a"), 2);
}

TEST_F(Loading, AFailureIsEmptyAndNeverTriedAgain) {
  const auto URL = server.URL("/a");
  EXPECT_EQ(document(URL), "(empty)");
  server.answer("/a", "application/xml", "<a/>");
  EXPECT_EQ(document(URL), "(empty)");
  EXPECT_EQ(server.requests("/a"), 1);
}

struct StatusRow {
  int status;
  bool isUsed;
};

TEST_F(Loading, OnlyStatus200And304AreUsed) {
  constexpr StatusRow rows[] = {{200, true},  {304, true},  {201, false}, {203, false},
                                {206, false}, {300, false}, {302, false}, {400, false},
                                {401, false}, {403, false}, {404, false}, {410, false},
                                {500, false}, {503, false}};
  // 304 never has a body on the wire.
  class Answers : public XQueryLoader {
   public:
    std::optional<XQueryResource> load(const NSURL& URL, XQueryLoadPurpose) override {
      return XQueryResource{"<a/>", std::stoi(URL.path().substr(1)), "application/xml", {}};
    }
  };
  XQueryLoading loading;
  loading.loader = std::make_shared<Answers>();
  context->contextSetLoading(loading);
  for (const StatusRow& row : rows) {
    EXPECT_EQ(document("http://h/" + std::to_string(row.status)), row.isUsed ? "<a/>" : "(empty)")
        << row.status;
  }
  EXPECT_EQ(document("http://h/0"), "<a/>");
}

TEST_F(Loading, StatusesOfAServerAreFilteredAlike) {
  for (const int status : {201, 404, 500}) {
    const std::string path = "/" + std::to_string(status);
    server.answer(path, status, "Content-Type: application/xml\r\n", "<a/>");
    EXPECT_EQ(document(server.URL(path)), "(empty)") << status;
    EXPECT_EQ(body(server.URL(path + "?body")), "(none)") << status;
  }
}

TEST_F(Loading, WhatIsRememberedCounts) {
  setPolicy(XQueryLoadingPolicy::denyAll());
  constexpr int count = 2000;
  // A text, a URL, and its place in a table.
  constexpr int64_t leastBytes = 100;
  const int64_t before = workMeter.valueBytes;
  for (int index = 0; index < count; ++index) {
    EXPECT_EQ(document("http://h/" + std::to_string(index)), "(empty)");
  }
  EXPECT_GE(workMeter.valueBytes - before, count * leastBytes);
  context = nullptr;
  EXPECT_LT(workMeter.valueBytes - before, count);
}

TEST_F(Loading, TextThatIsNotWellFormedIsEmpty) {
  EXPECT_EQ(document(folder.write("bad.xml", "<a><b></a>")), "(empty)");
  EXPECT_EQ(document(folder.write("empty.xml", "")), "(empty)");
}

struct ModeRow {
  const char* path;
  const char* type;  // null for none
  bool isHTML;
};

TEST_F(Loading, TypeAndPathDecideBetweenXmlAndHtml) {
  constexpr ModeRow rows[] = {
      {"/type/1", "text/html", true},   {"/type/2", "TEXT/Html; charset=utf-8", true},
      {"/type/3", "text/htm", false},   {"/type/4", "application/xhtml+xml", false},
      {"/type/5", nullptr, false},      {"/name.html", nullptr, true},
      {"/name.htm", nullptr, true},     {"/NAME.HTM", nullptr, true},
      {"/Name.Html", nullptr, true},    {"/name.html", "application/xml", true},
      {"/name.xhtml", nullptr, false},  {"/html", nullptr, false},
      {"/name.html/", nullptr, false},  {"/name?x.html", nullptr, false},
      {"/name.html?x", nullptr, true},  {"/name.%68tml", nullptr, true},
      {"/name.html.gz", nullptr, true}, {"/name.HTM.Bz2", nullptr, true},
      {"/name.gz", nullptr, false},     {"/name.xml.xz", nullptr, false},
  };
  for (const ModeRow& row : rows) {
    const std::string header =
        row.type ? std::string("Content-Type: ") + row.type + "\r\n" : std::string();
    server.answer(row.path, 200, header, "<P>x</P>");
    context = XQueryContext::xqueryContext();
    const std::string expected =
        row.isHTML ? "<html xmlns=\"http://www.w3.org/1999/xhtml\"><head><title/></head>"
                     "<body><p>x</p></body></html>"
                   : "<P>x</P>";
    EXPECT_EQ(document(server.URL(row.path)), expected) << row.path;
  }
}

TEST_F(Loading, AFileIsHtmlByItsName) {
  EXPECT_NE(document(folder.write("a.HTM", "<p>x")), "(empty)");
  EXPECT_EQ(document(folder.write("a.xml", "<p>x")), "(empty)");
}

// A relative reference without a path has no path to judge by.
TEST_F(Loading, TheRelativePathIsWhatIsJudged) {
  server.answer("/a.html?x", "application/xml", "<P/>");
  const auto base = URLOf(server.URL("/a.html"));
  const auto URL = NSURL::URLWithString(NSString::stringWithASCII("?x"), *base);
  const Value value = internal().XQueryDocumentForURL(URL);
  ASSERT_TRUE(isa<NSXMLDocument>(value));
  EXPECT_EQ(cast<NSXMLDocument>(value)->rootElement()->XMLString()->utf8(), "<P/>");
}

TEST_F(Loading, WhiteSpaceOnlyTextIsDroppedAndCDATAKept) {
  EXPECT_EQ(document(folder.write("a.xml",
                                  "<a> <b/>\n<c xml:space='preserve'> </c>"
                                  "<d><![CDATA[<x>]]></d> y </a>")),
            "<a><b/><c xml:space=\"preserve\"> </c><d><![CDATA[<x>]]></d> y </a>");
}

TEST_F(Loading, PackedDocumentsAreUnpackedAndBodiesAreNot) {
  for (const packing::Format& format : packing::formats) {
    const std::string packed = format.pack("<a>x</a>");
    const std::string name = std::string("/") + format.name;
    server.answer(name, "application/octet-stream", packed);
    EXPECT_EQ(document(server.URL(name)), "<a>x</a>");
    EXPECT_EQ(document(folder.write(format.name, packed)), "<a>x</a>");
    context = XQueryContext::xqueryContext();
    EXPECT_EQ(body(server.URL(name)), packed);
    EXPECT_EQ(document(folder.write("cut", packed.substr(0, packed.size() - 1))), "(empty)");
  }
}

TEST_F(Loading, WhatMayBeFetchedIsUnpackedToNoMoreBytesThanThat) {
  const std::string text = "<a>" + std::string(100000, ' ') + "x</a>";
  XQueryLoading loading;
  for (const packing::Format& format : packing::formats) {
    for (const size_t most : {text.size(), text.size() - 1}) {
      loading.limits.mostBytes = most;
      context = XQueryContext::xqueryContext();
      context->contextSetLoading(loading);
      const std::string found = document(folder.write("packed", format.pack(text)));
      EXPECT_EQ(found == text, most == text.size()) << format.name;
    }
  }
}

TEST_F(Loading, ADocumentReportsTheUrlItWasAskedForBy) {
  server.redirect("/a", "/b");
  server.answer("/b", "application/xml", "<b/>");
  const Value value = internal().XQueryDocumentForURL(URLOf(server.URL("/a")));
  ASSERT_TRUE(isa<NSXMLDocument>(value));
  EXPECT_EQ(cast<NSXMLDocument>(value)->documentURI()->utf8(), server.URL("/a"));
}

TEST_F(Loading, WhatNoLoaderCanReachIsEmpty) {
  for (const auto* URL : {"", "a.xml", "ftp://127.0.0.1/a", "urn:a", "data:text/xml,<a/>"}) {
    if (const auto parsed = URLOf(URL)) {
      EXPECT_EQ(internal().XQueryDocumentForURL(parsed), NSNull::null()) << URL;
    }
  }
}

TEST_F(Loading, EndlessAndSlowDocumentsAreEmptyInTheEnd) {
  XQueryLoading loading;
  loading.limits.mostBytes = 1 << 20;
  loading.limits.totalTimeout = milliseconds(300);
  context->contextSetLoading(loading);
  server.handle("/endless", [](HTTPServer::Connection& connection) {
    connection.send("HTTP/1.1 200 Fine\r\n\r\n");
    connection.pour();
  });
  server.handle("/slow", [](HTTPServer::Connection& connection) {
    connection.send("HTTP/1.1 200 Fine\r\n\r\n");
    connection.trickle();
  });
  EXPECT_EQ(document(server.URL("/endless")), "(empty)");
  EXPECT_EQ(document(server.URL("/slow")), "(empty)");
}

TEST_F(Loading, ADocumentOutlivesItsContext) {
  const Value value = internal().XQueryDocumentForURL(URLOf(folder.write("a.xml", "<a>x</a>")));
  context = nullptr;
  EXPECT_EQ(cast<NSXMLDocument>(value)->stringValue()->utf8(), "x");
}

// --- raw bodies ----------------------------------------------------------------------------------

TEST_F(Loading, BodiesAreRawBytes) {
  const std::string bytes("\xFF\0<a>", 5);
  EXPECT_EQ(body(folder.write("a.xml", bytes)), bytes);
  EXPECT_EQ(body(folder.write("empty", "")), "");
  EXPECT_EQ(body(folder.URL("missing")), "(none)");
}

TEST_F(Loading, ABodyIsKeptByItsHandle) {
  server.answer("/a", "text/plain", "x");
  EXPECT_EQ(body(server.URL("/a")), "x");
  EXPECT_EQ(body(server.URL("/a")), "x");
  EXPECT_EQ(server.requests("/a"), 1);
}

TEST_F(Loading, ABodyThatFailedIsTriedAgain) {
  EXPECT_EQ(body(server.URL("/a")), "(none)");
  server.answer("/a", "text/plain", "x");
  EXPECT_EQ(body(server.URL("/a")), "x");
}

TEST_F(Loading, WhatTheDocumentsHoldHasNoBody) {
  server.answer("/a", "application/xml", "<a/>");
  EXPECT_EQ(document(server.URL("/a")), "<a/>");
  EXPECT_EQ(body(server.URL("/a")), "(none)");
  EXPECT_EQ(document(server.URL("/missing")), "(empty)");
  EXPECT_EQ(body(server.URL("/missing")), "(none)");
  EXPECT_EQ(server.requests(), 2);
}

TEST_F(Loading, ABodyDoesNotSpareADocumentItsRequest) {
  server.answer("/a", "application/xml", "<a/>");
  EXPECT_EQ(body(server.URL("/a")), "<a/>");
  EXPECT_EQ(document(server.URL("/a")), "<a/>");
  EXPECT_EQ(server.requests("/a"), 2);
}

// --- policies ------------------------------------------------------------------------------------

TEST_F(Loading, ThePolicyCoversDocumentsAndBodies) {
  const auto file = folder.write("a.xml", "<a/>"), other = folder.write("b.xml", "<b/>");
  server.answer("/a", "application/xml", "<a/>");
  setPolicy(XQueryLoadingPolicy::denyAll());
  EXPECT_EQ(document(file), "(empty)");
  EXPECT_EQ(body(other), "(none)");
  EXPECT_EQ(document(server.URL("/a")), "(empty)");
  EXPECT_EQ(body(server.URL("/a?b")), "(none)");
  EXPECT_EQ(server.requests(), 0);
}

TEST_F(Loading, AFailureUnderOnePolicyStaysUnderTheNext) {
  const auto file = folder.write("a.xml", "<a/>"), other = folder.write("b.xml", "<b/>");
  setPolicy(XQueryLoadingPolicy::denyAll());
  EXPECT_EQ(document(file), "(empty)");
  setPolicy(XQueryLoadingPolicy::allowAll());
  EXPECT_EQ(document(file), "(empty)");
  EXPECT_EQ(document(other), "<b/>");
  setPolicy(XQueryLoadingPolicy::denyAll());
  EXPECT_EQ(document(other), "<b/>");
}

TEST_F(Loading, ABodyIsSubjectToThePolicyOfTheDay) {
  const auto file = folder.write("a.txt", "x");
  EXPECT_EQ(body(file), "x");
  setPolicy(XQueryLoadingPolicy::denyAll());
  EXPECT_EQ(body(file), "(none)");
}

TEST_F(Loading, ADocumentMayNotReadBesideItself) {
  folder.write("secret.txt", "secret");
  EXPECT_EQ(document(folder.write("a.xml",
                                  "<!DOCTYPE a [<!ENTITY s SYSTEM 'secret.txt'>]>"
                                  "<a>&s;</a>")),
            "(empty)");
}

// --- what the client hears -----------------------------------------------------------------------

class Hearer : public XQueryClient {
 public:
  void XQueryClientMissesDocument(const XQueryMissingDocument& document,
                                  XQueryContext& context) override {
    heard.push_back(document.URL + " - " + document.reason);
    lastContext = &context;
    lastThread = std::this_thread::get_id();
    if (throws) throw std::length_error("mine");
  }
  std::vector<std::string> heard;
  XQueryContext* lastContext = nullptr;
  std::thread::id lastThread;
  bool throws = false;
};

class MissingDocuments : public Loading {
 protected:
  void SetUp() override { context->contextSetClient(client); }
  // How many items a query has.
  size_t count(const std::string& text) {
    const auto items = context->evaluateXQuery(*XQuery::xqueryWithSource(text), {}, {});
    return items ? items->count() : 9999;
  }
  std::shared_ptr<Hearer> client = std::make_shared<Hearer>();
};

TEST_F(MissingDocuments, AreToldToTheClientWithUrlAndReason) {
  server.redirect("/away", "ftp://example.org/x");
  const std::string none = fileURL(folder.path("none.xml")),
                    broken = folder.write("broken.xml", "<a>\n <b></a>");
  EXPECT_EQ(count("(doc('" + none + "'), doc('" + broken + "'), doc('" + server.URL("/404") +
                  "'), doc('" + server.URL("/away") + "'), doc('ftp://user:secret@h/x'))"),
            0u);
  ASSERT_EQ(client->heard.size(), 5u);
  EXPECT_EQ(client->heard[0], none + " - No such file or directory");
  EXPECT_EQ(client->heard[1].find(broken + " - line 2, column "), 0u) << client->heard[1];
  EXPECT_EQ(client->heard[2], server.URL("/404") + " - status 404");
  EXPECT_EQ(client->heard[3],
            server.URL("/away") + " - redirected to ftp://example.org/x, which is not allowed");
  EXPECT_EQ(client->heard[4], "ftp://h/x - not allowed");
  EXPECT_EQ(client->lastContext, context.get());
  EXPECT_EQ(client->lastThread, std::this_thread::get_id());
}

TEST_F(MissingDocuments, AreToldOnceForEachUrlAndContext) {
  EXPECT_EQ(count("for $i in 1 to 3 return (doc('gone:a'), doc('gone:b'))"), 0u);
  EXPECT_EQ(count("doc('gone:a')"), 0u);
  EXPECT_EQ(client->heard,
            (std::vector<std::string>{"gone:a - not allowed", "gone:b - not allowed"}));
  context = XQueryContext::xqueryContext();
  context->contextSetClient(client);
  EXPECT_EQ(count("doc('gone:a')"), 0u);
  EXPECT_EQ(client->heard.size(), 3u);
}

TEST_F(MissingDocuments, AreNotThoseThatAreThereOrGiveAnError) {
  EXPECT_EQ(count("doc('" + folder.write("a.xml", "<a/>") + "')"), 1u);
  EXPECT_EQ(count("doc('a b')"), 9999u);
  EXPECT_EQ(count("doc('')"), 0u);
  EXPECT_EQ(client->heard, std::vector<std::string>());
  EXPECT_EQ(count("doc('a.xml')"), 0u);
  EXPECT_EQ(client->heard[0], "a.xml - a relative URL, and nothing to resolve it against");
}

TEST_F(MissingDocuments, PassOnWhatTheClientThrows) {
  client->throws = true;
  EXPECT_THROW(count("doc('gone:a')"), std::length_error);
  EXPECT_EQ(count("doc('gone:a')"), 0u);
}

TEST_F(MissingDocuments, AreEmptyToAClientThatDoesNotAsk) {
  context->contextSetClient(std::make_shared<XQueryClient>());
  EXPECT_EQ(count("doc('gone:a')"), 0u);
}

// --- a policy of URLs ----------------------------------------------------------------------------

TEST_F(Loading, RedirectsOutOfAnAllowedUrlAreRefused) {
  server.answer("/in/a", "application/xml", "<a/>");
  server.answer("/out", "application/xml", "<b/>");
  server.redirect("/in/there", "/in/x/../a");
  server.redirect("/in/out", "/out");
  server.redirect("/in/dots", "/in/%2e%2e/out");
  setPolicy(XQueryLoadingPolicy::denyAll().allowURLsBelow(server.URL("/in/")));
  EXPECT_EQ(document(server.URL("/in/a")), "<a/>");
  EXPECT_EQ(document(server.URL("/in/there")), "<a/>");
  EXPECT_EQ(document(server.URL("/in/out")), "(empty)");
  EXPECT_EQ(document(server.URL("/in/dots")), "(empty)");
  EXPECT_EQ(document(server.URL("/out")), "(empty)");
  EXPECT_EQ(document(server.URL("/in/../out")), "(empty)");
  EXPECT_EQ(server.requests("/out"), 0);
}

// --- the host's loader ---------------------------------------------------------------------------

class Archive : public XQueryLoader {
 public:
  std::optional<XQueryResource> load(const NSURL& URL, XQueryLoadPurpose purpose) override {
    const std::string text = URL.absoluteString()->utf8();
    asked.push_back({text, purpose});
    if (onLoad) onLoad();
    const auto found = entries.find(text);
    if (found == entries.end()) return std::nullopt;
    return found->second;
  }
  std::map<std::string, XQueryResource> entries;
  std::vector<std::pair<std::string, XQueryLoadPurpose>> asked;
  std::function<void()> onLoad;
};

class HostLoading : public Loading {
 protected:
  static Ref<XQueryContext> XQueryContextWith(const XQueryLoading& loading) {
    auto made = XQueryContext::xqueryContext();
    made->contextSetLoading(loading);
    return made;
  }
  void SetUp() override {
    settings.loader = archive;
    settings.policy = XQueryLoadingPolicy::denyAll().allowScheme("app");
    context->contextSetLoading(settings);
  }
  bool isEvaluated(const XQuery& query) {
    return bool(context->evaluateXQuery(query, {}, nullptr, nullptr));
  }
  std::shared_ptr<Archive> archive = std::make_shared<Archive>();
  XQueryLoading settings;
};

TEST_F(HostLoading, GivesDocumentsModulesAndBodies) {
  archive->entries["app:d"] = {"<p>x", {}, "text/html", {}};
  archive->entries["app:b"] = {"bytes", {}, {}, {}};
  archive->entries["app:m"] = {
      "module namespace m = 'urn:m'; declare variable $m:a := 1;", {}, {}, {}};
  EXPECT_NE(document("app:d"), "(empty)");
  EXPECT_EQ(body("app:b"), "bytes");
  const auto query = XQuery::xqueryWithSource(
      std::string_view("import module namespace m = 'urn:m' at 'app:m'; $m:a"), settings);
  const auto items = context->evaluateXQuery(*query, {}, {});
  ASSERT_TRUE(items);
  EXPECT_EQ(XQueryItemStringValue(*items->objectAtIndex(0)), "1");
  const std::vector<std::pair<std::string, XQueryLoadPurpose>> expected = {
      {"app:d", XQueryLoadPurpose::Document},
      {"app:b", XQueryLoadPurpose::Body},
      {"app:m", XQueryLoadPurpose::Module}};
  EXPECT_EQ(archive->asked, expected);
}

// 200 documents that nobody has, asked for twice each; the whole of their URLs is 10 MiB.
constexpr const char* manyMissing =
    "let $long := string-join(for $i in 1 to 50000 return 'a', '')"
    " return count(for $turn in 1 to 2, $i in 1 to 200 return doc(concat('app:', $i, $long)))";

TEST_F(HostLoading, ManyFailuresAreForgottenAfterAnEvaluation) {
  const auto missing = XQuery::xqueryWithSource(manyMissing);
  const int64_t before = workMeter.valueBytes;
  for (size_t turn = 1; turn <= 3; ++turn) {
    archive->asked.clear();
    EXPECT_TRUE(isEvaluated(*missing));
    EXPECT_EQ(archive->asked.size(), 200u) << turn;
    EXPECT_LT(workMeter.valueBytes - before, 1 << 20) << turn;
  }
}

TEST_F(HostLoading, SomeFailuresAndEveryDocumentAreKept) {
  archive->entries["app:d"] = {"<a/>", {}, {}, {}};
  const auto few =
      XQuery::xqueryWithSource("count(for $i in 1 to 200 return doc(concat('app:', $i)))");
  const auto document = XQuery::xqueryWithSource("exists(doc('app:d'))");
  for (int turn = 0; turn < 2; ++turn) {
    EXPECT_TRUE(isEvaluated(*few));
    EXPECT_TRUE(isEvaluated(*document));
  }
  EXPECT_EQ(archive->asked.size(), 201u);
  EXPECT_TRUE(isEvaluated(*XQuery::xqueryWithSource(manyMissing)));
  archive->asked.clear();
  EXPECT_TRUE(isEvaluated(*document));
  EXPECT_TRUE(archive->asked.empty());
  EXPECT_TRUE(isEvaluated(*few));
  EXPECT_EQ(archive->asked.size(), 200u);
}

TEST_F(HostLoading, BodiesThatAreMissingAreNotKept) {
  const int64_t before = workMeter.valueBytes;
  const std::string text(50000, 'a');
  for (int index = 0; index < 100; ++index) {
    EXPECT_EQ(body("app:" + std::to_string(index) + text), "(none)");
  }
  EXPECT_LT(workMeter.valueBytes - before, 1 << 20);
}

TEST_F(HostLoading, MayChangeTheSettingsWhileItIsCalled) {
  archive->entries["app:d"] = {"<d/>", {}, {}, {}};
  archive->entries["app:b"] = {"b", {}, {}, {}};
  archive->onLoad = [&] {
    settings.loader = nullptr;
    context->contextSetLoading(settings);
  };
  EXPECT_EQ(document("app:d"), "<d/>");
  settings.loader = archive;
  context->contextSetLoading(settings);
  EXPECT_EQ(body("app:b"), "b");
  EXPECT_FALSE(context->contextLoading().loader);
}

TEST_F(HostLoading, WhatItThrowsPassesThrough) {
  struct Failure {};
  archive->onLoad = [] { throw Failure(); };
  EXPECT_THROW(document("app:d"), Failure);
  EXPECT_THROW((void)XQuery::xqueryWithSource(
                   std::string_view("import module 'urn:m' at 'app:m'; 1"), settings),
               Failure);
  archive->onLoad = nullptr;
  archive->entries["app:d"] = {"<d/>", {}, {}, {}};
  EXPECT_EQ(document("app:d"), "<d/>") << "a load that was broken off is no failure to remember";
}

// Inside the engine these mean that it has no memory, or a decimal too many digits.
TEST_F(HostLoading, ItsFailuresAreNotTakenForTheEnginesOwn) {
  const std::string inner =
      "declare namespace x = "
      "'http://libxquery.example/xquery/2004/10/functions'; ";
  const std::string queries[] = {"doc('app:d')", "some $d in doc('app:d') satisfies number($d) = 1",
                                 inner + "x:eval(\"doc('app:d')\")", inner + "x:uri-body('app:d')",
                                 inner + "x:xslt-uri(document { <a/> }, 'app:d')"};
  const auto throwing = [&](auto failure, const std::string& query) {
    archive->onLoad = [failure] { throw failure; };
    const auto compiled = XQuery::xqueryWithSource(std::string_view(query), settings);
    EXPECT_THROW((void)XQueryContextWith(settings)->evaluateXQuery(*compiled, {}, {}),
                 decltype(failure))
        << query;
    EXPECT_THROW((void)XQuery::xqueryWithSource(
                     std::string_view("import module 'urn:m' at 'app:m'; 1"), settings),
                 decltype(failure));
  };
  for (const std::string& query : queries) {
    throwing(std::bad_alloc(), query);
    throwing(std::length_error("mine"), query);
  }
}

TEST_F(HostLoading, IsNotWaitedForBeyondADeadline) {
  // Answers when the test is over.
  struct Silent : XQueryLoader {
    std::shared_future<void> end;
    std::optional<XQueryResource> load(const NSURL&, XQueryLoadPurpose) override {
      end.wait();
      return std::nullopt;
    }
  };
  std::promise<void> end;
  const auto silent = std::make_shared<Silent>();
  silent->end = end.get_future().share();
  settings.loader = silent;
  XQueryLimits limits;
  limits.duration = milliseconds(50);
  const auto waiting = XQueryContextWith(settings);
  waiting->contextSetLimits(limits);
  const auto query = XQuery::xqueryWithSource(std::string_view("doc('app:d')"));
  Ref<XQueryError> error;
  EXPECT_FALSE(waiting->evaluateXQuery(*query, {}, {}, &error));
  EXPECT_EQ(error->msg()->utf8(), "limit: deadline passed");
  end.set_value();
}

// --- what a compilation may load -----------------------------------------------------------------

class CompileLoading : public Loading {
 protected:
  static std::vector<int64_t> errors(const std::string& source, const XQueryLoading& loading) {
    std::vector<int64_t> numbers;
    const auto query = XQuery::xqueryWithSource(std::string_view(source), loading);
    if (const auto found = query->parseErrors()) {
      for (const Value& each : found->objects()) numbers.push_back(cast<XQueryError>(each)->err());
    }
    return numbers;
  }
  static std::string importOf(const std::string& URL) {
    return "import module namespace m = 'urn:m' at '" + URL + "'; $m:a";
  }
  const std::string text = "module namespace m = 'urn:m'; declare variable $m:a := 1;";
  const std::vector<int64_t> none, missing = {47, 8};
  XQueryLoading loading;
};

TEST_F(CompileLoading, ModulesComeFromFilesAndServers) {
  EXPECT_EQ(errors(importOf(folder.write("m.xq", text)), loading), none);
  server.answer("/m", "text/html", text);
  EXPECT_EQ(errors(importOf(server.URL("/m")), loading), none);
  EXPECT_EQ(server.requests("/m"), 1);
}

TEST_F(CompileLoading, ThePolicyCoversModules) {
  const auto file = folder.write("m.xq", text);
  server.answer("/m", "text/plain", text);
  loading.policy = XQueryLoadingPolicy::denyAll();
  EXPECT_EQ(errors(importOf(file), loading).front(), 47);
  EXPECT_EQ(errors(importOf(server.URL("/m")), loading).front(), 47);
  EXPECT_EQ(server.requests(), 0);
  loading.policy.allowFilesBelow(folder.path());
  EXPECT_EQ(errors(importOf(file), loading), none);
}

TEST_F(CompileLoading, ThePolicyCoversTheModulesOfModules) {
  const auto inner = folder.write("outside/i.xq", "module namespace i = 'urn:i';");
  const auto outer =
      folder.write("inside/m.xq", "module namespace m = 'urn:m'; import module 'urn:i' at '" +
                                      inner + "'; declare variable $m:a := 1;");
  EXPECT_EQ(errors(importOf(outer), loading), none);
  loading.policy = XQueryLoadingPolicy::denyAll().allowFilesBelow(folder.path("inside"));
  EXPECT_EQ(errors(importOf(outer), loading).front(), 47);
}

TEST_F(CompileLoading, AnAnswerOfAnotherStatusIsNoModule) {
  server.answer("/m", 404, "", text);
  EXPECT_EQ(errors(importOf(server.URL("/m")), loading).front(), 47);
}

TEST_F(CompileLoading, SettingsOfTheContextDoNotReachCompilation) {
  setPolicy(XQueryLoadingPolicy::denyAll());
  const auto query =
      XQuery::xqueryWithSource(std::string_view(importOf(folder.write("m.xq", text))));
  const auto items = context->evaluateXQuery(*query, {}, {});
  ASSERT_TRUE(items);
  EXPECT_EQ(XQueryItemStringValue(*items->objectAtIndex(0)), "1");
}

TEST_F(CompileLoading, OnlySoManyModulesAreFetched) {
  const std::string source = "import module 'urn:a' at '" +
                             folder.write("a.xq", "module namespace a = 'urn:a';") +
                             "'; import module 'urn:b' at '" +
                             folder.write("b.xq", "module namespace b = 'urn:b';") + "'; 1";
  loading.limits.mostModules = 2;
  EXPECT_EQ(errors(source, loading), none);
  loading.limits.mostModules = 1;
  EXPECT_EQ(errors(source, loading), std::vector<int64_t>{47});
}

TEST_F(CompileLoading, OtherThreadsCompileWhileAModuleIsFetched) {
  std::atomic<bool> isCompiled = false;
  server.handle("/m", [&](HTTPServer::Connection& connection) {
    // The answer waits for the other compilation, which would wait for the lock if it were held.
    for (int n = 0; n < 1000 && !isCompiled; ++n) std::this_thread::sleep_for(milliseconds(10));
    connection.send("HTTP/1.1 200 Fine\r\nConnection: close\r\n\r\n" +
                    std::string(isCompiled ? text : "late"));
  });
  std::thread other([&] {
    while (server.requests("/m") == 0) std::this_thread::sleep_for(milliseconds(1));
    EXPECT_FALSE(XQuery::xqueryWithSource("1 + 1")->parseErrors());
    isCompiled = true;
  });
  EXPECT_EQ(errors(importOf(server.URL("/m")), loading), none);
  other.join();
}

}  // namespace
}  // namespace xquery
