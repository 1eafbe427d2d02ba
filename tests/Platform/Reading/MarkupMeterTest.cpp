#include "Platform/Reading/MarkupMeter.h"

#include <gtest/gtest.h>

#include <string>

namespace xquery {
namespace {

using Place = MarkupMeter::Place;

struct Measure {
  size_t attributes;
  size_t listed;
};

Measure measured(std::string_view text, Place place, size_t pieceSize) {
  MarkupMeter meter(place);
  for (size_t at = 0; at < text.size(); at += pieceSize) meter.read(text.substr(at, pieceSize));
  return {meter.mostAttributes(), meter.mostListed()};
}

// The same however the text is cut into pieces.
void expectMeasure(std::string_view text, Place place, size_t attributes, size_t listed) {
  for (size_t pieceSize = 1; pieceSize <= text.size(); ++pieceSize) {
    const Measure measure = measured(text, place, pieceSize);
    EXPECT_EQ(measure.attributes, attributes) << text << " in pieces of " << pieceSize;
    EXPECT_EQ(measure.listed, listed) << text << " in pieces of " << pieceSize;
  }
}

TEST(MarkupMeter, CountsTheAttributesOfTheLargestTag) {
  expectMeasure("<a x='1'/><b x='1' y=\"2\" z = '3'>=,=</b><c x=''/>", Place::Content, 3, 0);
  expectMeasure("<a x='<>=\"=\"' y=\"'='>='\">", Place::Content, 2, 0);
  expectMeasure("text = = '= <a x='1' y='", Place::Content, 2, 0);
}

TEST(MarkupMeter, TellsDeclarationsOfNamespacesFromOtherAttributes) {
  const auto named = [](std::string_view text) {
    MarkupMeter meter;
    meter.read(text);
    return meter.mostNamed();
  };
  EXPECT_EQ(named("<a xmlns='u' xmlns:p='v' p:b='w'\n\txmlns:q \n= 'x' c = 'y'/>"), 2u);
  EXPECT_EQ(named("<a xmlnsb='1' xmlns.='2' p:xmlns='3' b='xmlns:c='/>"), 4u);
  EXPECT_EQ(named("<a b='1' c='2'/><a xmlns:b='1' xmlns:c='2' d='3'/>"), 2u);
  MarkupMeter meter;
  for (const char* piece : {"<a xml", "ns:p='u' xmlns:q", "='v' xmlns:r", " = 'w'/>"}) {
    meter.read(piece);
  }
  EXPECT_EQ(meter.mostAttributes(), 3u);
  EXPECT_LE(meter.mostNamed(), 3u);
}

TEST(MarkupMeter, CountsTheNamesOfTheLargestList) {
  expectMeasure("<!ATTLIST a x (b|c|d) 'b' y (b|c) \"(|||||)\">", Place::Content, 0, 2);
  expectMeasure("<!ELEMENT a (b,(c|d)?,(e,f)*)><!ELEMENT b (c)>", Place::Content, 0, 4);
  expectMeasure("one|two|three", Place::Declaration, 0, 2);
  expectMeasure("| one) #IMPLIED y (a|b|c) 'a'><!ELEMENT a (b,c)>", Place::Declaration, 0, 2);
  expectMeasure("<a> (b|c|d) </a>", Place::Content, 0, 0);
}

TEST(MarkupMeter, PassesOverWhatIsNoMarkup) {
  for (const char* text : {"<!-- <a x='1' - -> <!ELEMENT a (b,c)> --->", "<!---->",
                           "<?a <b x='1' ? > ?"
                           "?>",
                           "<![CDATA[<a x='1']] >]]]>"}) {
    expectMeasure(text, Place::Content, 0, 0);
    expectMeasure(std::string(text) + "<a x='1'/>", Place::Content, 1, 0);
    expectMeasure(std::string(text) + "<!ATTLIST a x (b|c) 'b'>", Place::Declaration, 0, 1);
  }
}

TEST(MarkupMeter, MayBeginAnywhere) {
  expectMeasure("<a x='1' --><b x='' y=''>", Place::Comment, 2, 0);
  expectMeasure("<a x='1' ?><b x='' y=''>", Place::Instruction, 2, 0);
  expectMeasure("<a x='1' ]]><b x='' y=''>", Place::Section, 2, 0);
  expectMeasure("' --> ?> ]]> <b x=''><!ELEMENT a (b,c)>", Place::Beyond, 0, 0);
}

TEST(MarkupMeter, BeginsAnew) {
  MarkupMeter meter;
  meter.read("<a x='1' y='2' z='");
  meter.restart(Place::Content);
  EXPECT_EQ(meter.mostAttributes(), 0u);
  meter.read("<a x='1'/>");
  EXPECT_EQ(meter.mostAttributes(), 1u);
}

}  // namespace
}  // namespace xquery
