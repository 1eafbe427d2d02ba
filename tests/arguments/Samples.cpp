#include "arguments/Samples.h"

#include "Context/XQueryContextInternal.h"
#include "Types/XQueryCasting.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryQName.h"
#include "Types/XQueryString.h"
#include "Types/XQueryTypeTable.h"
#include "Types/XQueryValues.h"
#include "xquery/xquery.h"

#include <cstdlib>
#include <map>
#include <utility>

namespace xquery::arguments {
namespace {

using castingtable::Row;

// A zone that was always at nine hours: what depends on the zone of the process must not pass by
// chance. Set before anything asks for it.
const bool zoneIsSet = ::setenv("TZ", "Etc/GMT-9", 1) == 0;

const std::vector<Row>& rows() {
  static const std::vector<Row> table = castingtable::table();
  return table;
}

Value read(const Row& row) {
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  if (row.type == 8) return NSString::stringWithUTF8(row.from);
  const Value text = XQueryString::stringWithString(*NSString::stringWithUTF8(row.from));
  return XQueryCastAs(text, row.type, *context);
}

// How the row's own value prints.
std::string canonicalText(const Row& row) {
  for (const castingtable::Outcome& outcome : row.outcomes) {
    if (outcome.targets & (castingtable::Targets{1} << row.type)) return outcome.text;
  }
  return row.from;
}

Ref<NSXMLDocument> parsed(std::string_view xml) {
  return NSXMLDocument::documentWithData(xml, NSXMLNodePreserveWhitespace);
}

// Two documents and a node of every kind, alone and in a tree. Their texts are rows of the table.
std::vector<Node> makeNodes() {
  const Ref<NSXMLDocument> library = parsed(
      "<r xml:lang='en-US' xml:base='http://b/c'><p:e xmlns:p='urn:p' a='2004' p:b='abcd'>1</p:e>"
      "<!--P1DT2H--><?pi INF?></r>");
  library->setURI(NSString::stringWithUTF8("http://d/e"));
  NSXMLElement* r = library->rootElement();
  NSXMLElement* e = cast<NSXMLElement>(r->firstChild());
  const Ref<NSXMLDocument> plain = parsed("<x><y/></x>");
  NSXMLElement* x = plain->rootElement();
  const auto text = [](std::string_view ascii) { return NSStringView::ascii(ascii); };
  const std::string base = "http://b/c";
  const std::string uri = "http://d/e";
  const std::vector<std::string> none;
  const std::vector<std::string> p = {"p", "xml"};
  const std::string eXML = "<p:e xmlns:p=\"urn:p\" a=\"2004\" p:b=\"abcd\">1</p:e>";
  const std::string rXML =
      "<r xml:lang=\"en-US\" xml:base=\"http://b/c\">" + eXML + "<!--P1DT2H--><?pi INF?></r>";
  const auto attribute = [&](const char* name) { return Value(e->attributeForName(text(name))); };
  const auto made = NSXMLNode::attributeWithName(text("q:made"), text("2004-05"), text("urn:q"));
  using enum NodeKind;
  return {
      {"library", Document, "1", "", "", "", "*" + rXML, base, uri, "", none, 0, library},
      {"r", Element, "1", "r", "r", "", rXML, base, uri, "en-US", none, 0, Value(r)},
      {"p:e", Element, "1", "p:e", "e", "urn:p", eXML, base, uri, "en-US", p, 0, Value(e)},
      {"@a", Attribute, "2004", "a", "a", "", "a=\"2004\"", base, uri, "en-US", p, 0,
       attribute("a")},
      {"@p:b", Attribute, "abcd", "p:b", "b", "urn:p", "p:b=\"abcd\"", base, uri, "en-US", p, 0,
       attribute("p:b")},
      {"namespace p", Namespace, "urn:p", "p", "p", "*", "*", base, uri, "en-US", p, 0,
       Value(e->firstNamespace())},
      {"text 1", Text, "1", "", "", "", "1", base, uri, "en-US", p, 0, Value(e->firstChild())},
      {"comment", Comment, "P1DT2H", "", "", "", "<!--P1DT2H-->", base, uri, "en-US", none, 0,
       Value(e->nextSibling())},
      {"pi", Instruction, "INF", "pi", "pi", "", "<?pi INF?>", base, uri, "en-US", none, 0,
       Value(r->lastChild())},
      {"plain", Document, "", "", "", "", "*<x><y/></x>", "", "", "", none, 9, plain},
      {"y", Element, "", "y", "y", "", "<y/>", "", "", "", none, 9, Value(x->firstChild())},
      {"made attribute", Attribute, "2004-05", "q:made", "made", "urn:q", "*", "", "", "", none, 11,
       made},
      {"made text", Text, "2004-05-06T12:30:45Z", "", "", "", "2004-05-06T12:30:45Z", "", "", "",
       none, 12, NSXMLNode::textWithStringValue(text("2004-05-06T12:30:45Z"))},
  };
}

Item itemOf(const Row& row) {
  return {row.type, canonicalText(row), nullptr, &row};
}

Item itemOf(const Node& node) {
  return {0, node.text, &node, nullptr};
}

// The combinations of three and more are made of these.
bool isUsualRow(const Row& row) {
  static const std::vector<std::pair<int, std::string_view>> usual = {
      {9, "abcd"},    {9, ""},
      {9, "i"},       {8, "1"},
      {42, "12"},     {11, "1.5"},
      {11, "NaN"},    {13, "-128.9"},
      {10, "false"},  {9, "$1"},
      {26, "0f"},     {34, "abcd"},
      {14, "abcd"},   {22, "2004-02-29"},
      {29, "P1DT2H"}, {9, "\u00e9\U0001F600"}};
  for (const auto& [type, from] : usual) {
    if (row.type == type && row.from == from) return true;
  }
  return false;
}

Sample sequenceOf(std::string name, const std::vector<Sample>& from,
                  const std::vector<std::string>& members, bool isTypical, bool isUsual = false) {
  Sample sample = {std::move(name), {}, nullptr, isTypical, isUsual};
  std::vector<Value> values;
  for (const std::string& member : members) {
    for (const Sample& candidate : from) {
      if (candidate.name != member) continue;
      sample.items.push_back(candidate.items.front());
      values.push_back(candidate.value);
    }
  }
  if (values.size() != members.size()) std::abort();
  sample.value = NSArray::arrayWithObjects(std::move(values));
  return sample;
}

std::vector<Sample> makeSamples() {
  std::vector<Sample> all;
  all.push_back({"()", {}, NSNull::null(), true, true});
  std::map<int, int> seen;
  for (const Row& row : rows()) {
    const bool isTypical = seen[row.type]++ == 0 || row.type <= 9 || row.type == 11;
    all.push_back({std::to_string(row.type) + " '" + row.from + "'",
                   {itemOf(row)},
                   read(row),
                   isTypical,
                   isUsualRow(row)});
  }
  for (const Node& node : nodes()) {
    all.push_back({node.label,
                   {itemOf(node)},
                   node.object,
                   true,
                   node.label == "p:e" || node.label == "library"});
  }
  const Ref<NSString> name = NSString::stringWithASCII("p:n");
  all.push_back({"15 p:n",
                 {{15, "p:n"}},
                 XQueryQName::qname(name, NSString::stringWithASCII("u")),
                 true,
                 false});
  all.push_back({"data", {{0, "data 6162"}}, NSData::dataWithBytes("ab"), true, true});
  // Numbers of the platform are doubles.
  const Item double15 = {11, "1.5", nullptr, rowOf(11, "1.5")};
  all.push_back({"platform double", {double15}, NSNumber::numberWithDouble(1.5), true, false});
  all.push_back({"platform decimal",
                 {double15},
                 NSDecimalNumber::decimalNumberWithString(NSStringView::ascii("1.5")),
                 true,
                 false});

  const std::vector<Sample> single = all;
  all.push_back(sequenceOf("two", single, {"42 '12'", "9 'abcd'"}, true, true));
  all.push_back(sequenceOf("numbers", single, {"42 '12'", "11 '1.5'", "13 '-128.9'"}, true));
  all.push_back(sequenceOf("integers", single, {"42 '12'", "50 '12'"}, true));
  all.push_back(sequenceOf("with NaN", single, {"42 '12'", "11 'NaN'", "9 'abcd'"}, true));
  all.push_back(sequenceOf("nodes", single, {"p:e", "@a"}, true));
  all.push_back(sequenceOf("months", single, {"28 'P14M'", "28 '-P1Y'"}, true));
  all.push_back(sequenceOf("strings", single, {"9 'abcd'", "9 ''", "31 'abcd'"}, true));
  all.push_back(sequenceOf("mixed", single, {"8 '1'", "r", "42 '12'", "10 'true'"}, true));
  all.push_back(sequenceOf("with data", single, {"42 '12'", "data"}, true));
  return all;
}

}  // namespace

const std::vector<Node>& nodes() {
  static const std::vector<Node> all = makeNodes();
  return all;
}

const std::vector<Sample>& samples() {
  static const std::vector<Sample> all = makeSamples();
  return all;
}

const Sample& sampleNamed(std::string_view name) {
  for (const Sample& sample : samples()) {
    if (sample.name == name) return sample;
  }
  std::abort();
}

const Row* rowOf(int type, const std::string& text) {
  static const std::map<std::pair<int, std::string>, const Row*> index = [] {
    std::map<std::pair<int, std::string>, const Row*> map;
    for (const Row& row : rows()) map.emplace(std::pair(row.type, canonicalText(row)), &row);
    return map;
  }();
  const auto found = index.find({type, text});
  return found == index.end() ? nullptr : found->second;
}

std::string show(const NSObject& item) {
  if (item.isNode()) {
    for (const Node& node : nodes()) {
      if (node.object.get() == &item) return "node " + node.label;
    }
    return "node " + cast<NSXMLNode>(&item)->XMLString()->utf8();
  }
  if (const auto* error = dyn_cast<XQueryError>(&item)) {
    return "error " + std::to_string(error->err()) + " " + error->msg()->utf8();
  }
  if (const auto* data = dyn_cast<NSData>(&item)) {
    std::string text = "data ";
    for (const unsigned char byte : data->bytes()) {
      text += "0123456789ABCDEF"[byte >> 4];
      text += "0123456789ABCDEF"[byte & 15];
    }
    return text;
  }
  return std::to_string(XQueryObjectTypeID(&item)) + " " + XQueryItemStringValue(item);
}

std::string show(const Value& value) {
  if (!value) return "no value";
  if (isa<NSNull>(value)) return "()";
  const auto* array = dyn_cast<NSArray>(value);
  if (!array) return show(*value);
  std::string text;
  for (const Value& item : array->objects()) text += (text.empty() ? "" : ", ") + show(*item);
  return text.empty() ? "()" : text;
}

}  // namespace xquery::arguments
