// Stylesheets that would take libxslt minutes to compile.
#include "Platform/Stylesheets/StylesheetBounds.h"
#include "Platform/Stylesheets/StylesheetTestSupport.h"

#include <string>
#include <string_view>

namespace xquery {
namespace {

using namespace stylesheettest;

// Each "#" is the number of the repetition.
std::string repeated(std::string_view text, int count) {
  std::string all;
  for (int index = 0; index < count; ++index) {
    for (const char unit : text) {
      if (unit == '#') {
        all += std::to_string(index);
      } else {
        all += unit;
      }
    }
  }
  return all;
}

struct Row {
  const char* name;
  std::string (*make)(int count);
  int inside;
  int outside;
};

const Row rows[] = {
    {"Variables",
     [](int n) { return stylesheet(repeated("<xsl:variable name='v#' select='1'/>", n)); }, 6000,
     8000},
    {"Parameters", [](int n) { return stylesheet(repeated("<xsl:param name='v#'/>", n)); }, 6000,
     8000},
    {"Templates",
     [](int n) { return stylesheet(repeated("<xsl:template match='a' priority='#'/>", n)); }, 7000,
     9000},
    {"Modes", [](int n) { return stylesheet(repeated("<xsl:template match='a' mode='m#'/>", n)); },
     6000, 8000},
    {"Keys", [](int n) { return stylesheet(repeated("<xsl:key name='k' match='a' use='b'/>", n)); },
     6000, 8000},
    {"DecimalFormats",
     [](int n) { return stylesheet(repeated("<xsl:decimal-format name='d#'/>", n)); }, 6000, 8000},
    {"AttributesOfSets",
     [](int n) {
       return stylesheet("<xsl:attribute-set name='s'>" +
                         repeated("<xsl:attribute name='a#'/>", n) + "</xsl:attribute-set>");
     },
     6000, 8000},
    {"LongNames",
     [](int n) {
       return stylesheet(repeated("<xsl:param name='" + std::string(1000, 'v') + "#'/>", n));
     },
     900, 1100},
    {"Namespaces",
     [](int n) {
       return root("<a " + repeated("xmlns:q#='v#' ", n - n / 2) + "/>",
                   repeated("xmlns:p#='u#' ", n / 2));
     },
     5000, 7000},
    {"NestedNamespaces",
     [](int n) {
       return root(repeated("<a xmlns:p#='" + std::string(1000, 'u') + "'>", n) +
                   repeated("</a>", n));
     },
     900, 1100},
    {"ExcludedPrefixes",
     [](int n) {
       return root("<a/>", repeated("xmlns:p#='u#' ", n) + "exclude-result-prefixes='" +
                               repeated("p# ", n) + "'");
     },
     3000, 5000},
    {"UsedAttributeSets",
     [](int n) {
       return stylesheet("<xsl:attribute-set name='s' use-attribute-sets='" + repeated("t ", n) +
                         "'/>");
     },
     20000, 25000},
    {"AlternativesOfKeys",
     [](int n) {
       return stylesheet("<xsl:key name='k' use='b' match='a" + repeated("|a", n) + "'/>");
     },
     20000, 25000},
    {"Nodes", [](int n) { return root(repeated("<a b=''/>", n)); }, 249000, 251000},
    {"Texts", [](int n) { return root(repeated("<a>" + std::string(1000, 'x') + "</a>", n)); },
     8300, 8400},
    {"LengthOfAnAttribute",
     [](int n) { return root("<a b='" + std::string(static_cast<size_t>(n), '{') + "'/>"); }, 65536,
     65537},
};

class StylesheetBoundsOf : public testing::TestWithParam<Row> {};

INSTANTIATE_TEST_SUITE_P(Kinds, StylesheetBoundsOf, testing::ValuesIn(rows),
                         [](const auto& row) { return row.param.name; });

TEST_P(StylesheetBoundsOf, AdmitWhatIsInside) {
  EXPECT_TRUE(StylesheetBounds().admit(*document(GetParam().make(GetParam().inside))));
}

TEST_P(StylesheetBoundsOf, RefuseWhatIsOutside) {
  EXPECT_FALSE(StylesheetBounds().admit(*document(GetParam().make(GetParam().outside))));
}

TEST(StylesheetBoundsOfAll, CountPartsTogether) {
  const auto part = document(stylesheet(repeated("<xsl:variable name='v#'/>", 2500)));
  StylesheetBounds bounds;
  EXPECT_TRUE(bounds.admit(*part));
  EXPECT_TRUE(bounds.admit(*part));
  EXPECT_FALSE(bounds.admit(*part));
}

TEST(StylesheetBoundsOfAll, DeclarationsOfSiblingsAreNotInScopeTogether) {
  const std::string many = root(repeated("<a xmlns:p#='" + std::string(1000, 'u') + "'/>", 4000));
  EXPECT_TRUE(StylesheetBounds().admit(*document(many)));
}

TEST(LibXSLT, DoesNotBeginToCompileWhatTakesMinutes) {
  const std::string variables = repeated("<xsl:variable name='v#' select='1'/>", 100'000);
  EXPECT_EQ(applied("<a/>", stylesheet(variables)), "(none: the stylesheet is too large)");
}

}  // namespace
}  // namespace xquery
