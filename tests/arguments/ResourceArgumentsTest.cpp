// URIs and what is fetched by them. The contexts of these tests load nothing.
#include "arguments/Driver.h"

#include <gtest/gtest.h>

namespace xquery::arguments {
namespace {

bool hasScheme(const std::string& URI) {
  const size_t end = URI.find_first_of(":/?#");
  return end != URI.npos && end > 0 && URI[end] == ':';
}

// A text that is no URI gives no document and no value.
Sequence doc(const Call& call) {
  const std::string URI = stringOf(call[0]);
  if (!isURI(URI)) throw Refused();
  return {};
}

Sequence resolved(const Call& call, const std::string& URI, const std::string& base) {
  if (!isURI(URI)) {
    // Which error that is, is open.
    call.orElse("error 6 *");
    throw Refused();
  }
  if (base.empty() || !isURI(base) || hasScheme(URI)) return one({14, URI});
  const std::string root = "http://a/";
  if (!base.starts_with(root)) return one(anyOf(14));
  return one({14, URI.empty() ? base.substr(0, base.find('#')) : root + URI});
}

Sequence resolveURI(const Call& call) {
  if (call[0].empty()) {
    // Whether the base is looked at then is open.
    if (call.count() > 1) call.orElse("error 6 *");
    return {};
  }
  Attempts attempt;
  const std::string URI = attempt([&] { return stringOf(call[0]); });
  const std::string base = call.count() > 1 ? attempt([&] { return stringOf(call[1]); }) : "";
  if (attempt.haveFailed() && !isURI(URI)) call.orRefused();
  attempt.finish();
  return resolved(call, URI, base);
}

Sequence nothing(const Call&) {
  throw Refused();
}

Sequence body(const Call& call) {
  stringOf(call[0]);
  throw Refused();
}

// No text of the samples is a stylesheet, and no stylesheet can be loaded.
Sequence transformed(const Call& call) {
  Attempts attempt;
  attempt([]() -> Sequence { throw Refused(); });
  const bool isDocument =
      call[0].size() == 1 && call[0][0].isNode() && call[0][0].node->kind == NodeKind::Document;
  if (isDocument) stringOf(call[1]);
  attempt([&] { return stringOf(call[1]); });
  attempt.finish();
  return {};
}

}  // namespace

const std::vector<Function>& resourceFunctions() {
  static const std::vector<Function> functions = {
      {"fn:doc", 1, 1, doc},
      {"fn:resolve-uri", 1, 2, resolveURI},
      {"fn:collection", 0, 5, nothing},
      {"ext:uri-body", 1, 1, body},
      {"ext:xslt", 2, 2, transformed},
      {"ext:xslt-uri", 2, 2, transformed},
  };
  return functions;
}

TEST(ResourceArguments, EndAsTheRulesSay) {
  expectRules(resourceFunctions());
}

}  // namespace xquery::arguments
