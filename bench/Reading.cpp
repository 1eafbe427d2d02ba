#include "Reading.h"

#include "DataSets.h"
#include "Engine.h"
#include "Median.h"
#include "OtherReaders.h"
#include "PeakMemory.h"
#include "PlainNodes.h"
#include "ReadingTexts.h"

#include <chrono>
#include <cstdio>
#include <stdexcept>
#include <string>
#include <vector>

namespace bench {
namespace {

using namespace xquery;

struct Text {
  const char* kind;
  std::string (*generate)(double factor);
};

constexpr Text texts[] = {
    {"auction data", auctionData},      {"bibliographic records", bibliographyData},
    {"attributes", attributeRecords},   {"prose", proseText},
    {"several scripts", textInScripts}, {"nested elements", nestedElements},
};

constexpr int rounds = 7;

struct Reader {
  const char* name;
  bool (*read)(const std::string& xml);
};

bool readWithEngine(const std::string& xml) {
  return static_cast<bool>(parse(xml));
}

constexpr Reader readers[] = {
    {"SAX", readWithSAX},
    {"engine", readWithEngine},
    {"libxml2", readWithLibXMLTree},
    {"pugixml", readWithPugixml},
};

template <class Work>
double milliseconds(Work work) {
  const auto start = std::chrono::steady_clock::now();
  work();
  const std::chrono::duration<double, std::milli> taken = std::chrono::steady_clock::now() - start;
  return taken.count();
}

// Each reader in turn, so that what the machine does besides is everybody's.
std::vector<double> timesOf(const std::string& xml) {
  std::vector<double> all[std::size(readers)];
  for (int round = 0; round < rounds; round++) {
    for (size_t i = 0; i < std::size(readers); i++) {
      all[i].push_back(milliseconds([&] {
        if (!readers[i].read(xml)) throw std::runtime_error(readers[i].name);
      }));
    }
  }
  std::vector<double> medians;
  for (const auto& each : all) medians.push_back(median(each));
  return medians;
}

// Of `count(//node())`, which the tree has counted, beside a walk through as many nodes of 56
// bytes, round by round.
double countOverPlainCount(NSXMLDocument& document, size_t nodes) {
  const auto query = compile("count(//node())");
  const auto context = XQueryContext::xqueryContext();
  const PlainNodes plain(&document);
  std::vector<double> ours;
  std::vector<double> plains;
  size_t found = plain.count();
  if (found + 1 != nodes) throw std::runtime_error("a document of another shape");
  for (int round = 0; round < rounds; round++) {
    ours.push_back(milliseconds([&] { evaluate(*context, *query, Value(&document)); }));
    plains.push_back(milliseconds([&] { found += plain.count(); }));
  }
  if (found != (rounds + 1) * (nodes - 1)) throw std::runtime_error("a walk that changed");
  return median(ours) / median(plains);
}

void report(const Text& text, double factor) {
  const std::string xml = text.generate(factor);
  XQueryReleaseIdleMemory();
  const double before = residentBytes();
  auto document = parse(xml);
  const double bytes = residentBytes() - before;
  size_t nodes = 0;
  std::vector<double> walks;
  for (int round = 0; round < rounds; round++) {
    nodes = 0;
    walks.push_back(milliseconds([&] {
      for (const NSXMLNode* node = document.get(); node; node = node->nextNode()) nodes++;
    }));
  }
  const double counting = countOverPlainCount(*document, nodes);
  document = nullptr;
  const std::vector<double> times = timesOf(xml);
  std::printf("%-22s %7.1f %9.1f %9.2f %9.2f %9.2f %9.2f %9.2f %9.1f %9.2f\n", text.kind,
              static_cast<double>(xml.size()) / 1e6, times[0], times[1] / times[0],
              times[1] / times[3], times[2] / times[0], times[3] / times[0],
              bytes / static_cast<double>(xml.size()),
              1e6 * median(walks) / static_cast<double>(nodes), counting);
  std::fflush(stdout);
}

}  // namespace

int reportReading(double factor) {
  std::printf("%-22s %7s %9s %9s %9s %9s %9s %9s %9s %9s\n", "", "", "SAX", "engine", "engine",
              "libxml2", "pugixml", "engine", "engine", "count");
  std::printf("%-22s %7s %9s %9s %9s %9s %9s %9s %9s %9s\n", "text", "MB", "ms", "/ SAX",
              "/ pugixml", "/ SAX", "/ SAX", "byte/byte", "ns/node", "/ 56 B");
  for (const Text& text : texts) report(text, factor);
  return 0;
}

}  // namespace bench
