// Where a result says that it failed: in the error slot, among its items, or not at all.
#include "Engine/EmbeddingTesting.h"

namespace xquery {
namespace {

class FirstError : public Embedding {
 protected:
  // What the search finds after an evaluation; empty for a result that did not fail.
  std::string firstError(std::string_view source) {
    const auto items = evaluate(source);
    const Ref<NSError> found = XQueryFirstError(items, error);
    return found ? found->description()->utf8() : "";
  }
};

TEST_F(FirstError, ThatEndedTheEvaluationIsFound) {
  EXPECT_EQ(firstError("1 idiv 0"), "XQueryError:6 - \"divide by zero\" at line:1");
  EXPECT_EQ(firstError("1 +"), "XQueryError:3 - \"parse error invalid token ()- 1 +\" at line:1");
}

TEST_F(FirstError, ThatIsAnItemIsFoundWhereverItStands) {
  const std::string invalid = "XQueryError:72 - \"invalid comment\" at line:1";
  EXPECT_EQ(firstError("<!-- a -- b -->"), invalid);
  EXPECT_EQ(firstError("(<!-- a -- b -->, 2)"), invalid);
  EXPECT_EQ(firstError("(1, <!-- a -- b -->, 2)"), invalid);
  EXPECT_EQ(firstError("(1, 2, <!-- a -- b -->)"), invalid);
  EXPECT_EQ(firstError("(1,\n <!-- a -- b -->,\n <!-- c -- d -->)"),
            "XQueryError:72 - \"invalid comment\" at line:2");
}

TEST_F(FirstError, ThatIsALaterItemLeavesTheEvaluationASuccess) {
  const auto items = evaluate("(1, <!-- a -- b -->, 2)");
  ASSERT_TRUE(items);
  EXPECT_FALSE(error);
  EXPECT_EQ(items->count(), 3U);
}

TEST_F(FirstError, IsNullForAResultThatDidNotFail) {
  EXPECT_EQ(firstError("1, 'two', <three/>"), "");
  EXPECT_EQ(firstError("()"), "");
}

TEST_F(FirstError, IsNullForAQueryWithoutAValue) {
  EXPECT_EQ(firstError(""), "");
  EXPECT_EQ(firstError("module namespace m = 'urn:m';"), "");
  EXPECT_FALSE(XQueryFirstError(nullptr));
}

TEST_F(FirstError, GoesBeforeTheItems) {
  EXPECT_FALSE(evaluate("1 idiv 0"));
  const auto array = NSArray::arrayWithObjects({XQueryError::error(8, "later")});
  EXPECT_EQ(XQueryFirstError(array, error)->code(), 6);
  EXPECT_EQ(XQueryFirstError(array)->code(), 8);
}

TEST_F(FirstError, MayBeOneThatIsNotTheEnginesOwn) {
  const auto foreign = NSError::errorWithDomain("host", 7, "of the host's own");
  const auto array = NSArray::arrayWithObjects({NSString::stringWithUTF8("a"), foreign});
  EXPECT_EQ(XQueryFirstError(array), foreign);
}

}  // namespace
}  // namespace xquery
