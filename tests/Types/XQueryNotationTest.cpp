#include "Types/XQueryNotation.h"
#include "TypesTestSupport.h"

namespace xquery {
namespace {

using testing::text;

TEST(Notation, KeepsTheLexicalNameUnchanged) {
  for (const char* name : {"a", "p:a", "ab", ":ab", "not a name"}) {
    const Ref<XQueryNotation> notation = XQueryNotation::notationWithString(text(name));
    ASSERT_TRUE(notation) << name;
    EXPECT_EQ(notation->XQueryStringValue()->utf8(), name);
    EXPECT_EQ(XQueryObjectTypeID(notation.get()), 27);
  }
}

TEST(Notation, ANameWithoutALocalPartIsNone) {
  for (const char* name : {"", "p:", ":a", ":", "pp:"}) {
    EXPECT_FALSE(XQueryNotation::notationWithString(text(name))) << name;
  }
}

TEST(Notation, EqualityIsOfTheText) {
  const Ref<XQueryNotation> notation = XQueryNotation::notationWithString(text("p:a"));
  const Ref<XQueryNotation> same = XQueryNotation::notationWithString(text("p:a"));
  EXPECT_TRUE(notation->isEqual(*same));
  EXPECT_EQ(notation->hash(), same->hash());
  EXPECT_FALSE(notation->isEqual(*XQueryNotation::notationWithString(text("q:a"))));
}

}  // namespace
}  // namespace xquery
