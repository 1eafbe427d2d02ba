#include "xquery/Error.h"
#include "xquery/Exception.h"

#include <gtest/gtest.h>

#include <cstdlib>

namespace xquery {
namespace {

TEST(Error, LineIsStoredCountedFromOne) {
  const Ref<XQueryError> error = XQueryError::error(3, "message", 4);
  EXPECT_EQ(error->line(), 5);
  ASSERT_NE(error->userInfo(), nullptr);
  EXPECT_EQ(error->userInfo()->errorLine, 5);
  EXPECT_EQ(error->description()->utf8(), "XQueryError:3 - \"message\" at line:5");
  EXPECT_EQ(error->localizedDescription()->utf8(), "XQueryError:3 - \"message\" at line:5");
}

TEST(Error, WithoutALineThereIsNoLineEntryAndNoLineText) {
  const Ref<XQueryError> error = XQueryError::error(6, "invalid type");
  EXPECT_EQ(error->line(), 0);
  ASSERT_NE(error->userInfo(), nullptr);
  EXPECT_FALSE(error->userInfo()->errorLine.has_value());
  EXPECT_EQ(error->userInfo()->errorMessage->utf8(), "invalid type");
  EXPECT_EQ(error->description()->utf8(), "XQueryError:6 - \"invalid type\"");
}

TEST(Error, LineMinusOneMeansNoLine) {
  EXPECT_FALSE(XQueryError::error(6, "m", -1)->userInfo()->errorLine.has_value());
}

TEST(Error, WithoutAMessageThereIsOnlyTheLine) {
  const Ref<XQueryError> error = XQueryError::error(8, Ref<NSString>(), 0);
  ASSERT_NE(error->userInfo(), nullptr);
  EXPECT_FALSE(error->userInfo()->errorMessage);
  EXPECT_EQ(error->userInfo()->errorLine, 1);
  EXPECT_FALSE(error->msg());
  EXPECT_EQ(error->description()->utf8(), "XQueryError:8 - \"(null)\" at line:1");
}

TEST(Error, WithNeitherMessageNorLineThereIsNoUserInfo) {
  const Ref<XQueryError> error = XQueryError::error(8, Ref<NSString>());
  EXPECT_EQ(error->userInfo(), nullptr);
  EXPECT_EQ(error->description()->utf8(), "XQueryError:8 - \"(null)\"");
}

TEST(Error, CarriesDomainNumberAndMessage) {
  const Ref<XQueryError> error =
      XQueryError::error(37, NSString::stringWithUTF8("duplicate definition of variable \xC3\xA9"));
  EXPECT_EQ(error->domain()->utf8(), "XQueryErrorDomain");
  EXPECT_EQ(error->code(), 37);
  EXPECT_EQ(error->err(), 37);
  EXPECT_EQ(error->msg()->utf8(), "duplicate definition of variable \xC3\xA9");
  EXPECT_EQ(error->description()->utf8(),
            "XQueryError:37 - \"duplicate definition of variable \xC3\xA9\"");
  EXPECT_TRUE(isa<NSError>(static_cast<NSObject*>(error.get())));
}

TEST(Error, OfAModuleNamesItOnALineOfItsOwn) {
  const auto error = XQueryError::error(8, "message", 4);
  EXPECT_FALSE(error->moduleURL());
  const auto inModule =
      XQueryError::errorInModule(*error, NSString::stringWithASCII("file:///a/m.xq"));
  EXPECT_EQ(inModule->moduleURL()->utf8(), "file:///a/m.xq");
  EXPECT_EQ(inModule->err(), 8);
  EXPECT_EQ(inModule->code(), 8);
  EXPECT_EQ(inModule->line(), 5);
  EXPECT_EQ(inModule->userInfo()->errorLine, 5);
  EXPECT_EQ(inModule->description()->utf8(),
            "XQueryError:8 - \"message\" at line:5\n  at file:///a/m.xq:5");
  const auto withoutLine = XQueryError::errorInModule(*XQueryError::error(47, "message"),
                                                      NSString::stringWithASCII("urn:m"));
  EXPECT_EQ(withoutLine->description()->utf8(), "XQueryError:47 - \"message\"\n  at urn:m");
}

TEST(Error, NewErrorsAreLoggedOnlyWhenDiagnosticsAreOn) {
  ::setenv("XQUERY_LOG", "1", 1);
  testing::internal::CaptureStderr();
  const Ref<XQueryError> logged = XQueryError::error(20, "context item not a node", 2);
  EXPECT_EQ(testing::internal::GetCapturedStderr(),
            "XQueryError:20 - \"context item not a node\" at line:3\n");
  ::setenv("XQUERY_LOG", "0", 1);
  testing::internal::CaptureStderr();
  const Ref<XQueryError> silent = XQueryError::error(20, "context item not a node", 2);
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
  ::unsetenv("XQUERY_LOG");
}

TEST(Error, OfAnotherDomainNamesItWithCodeAndMessage) {
  const Ref<NSError> error = NSError::errorWithDomain("XSLT", 1, "cannot load \xC3\xA9");
  EXPECT_EQ(error->domain()->utf8(), "XSLT");
  EXPECT_EQ(error->code(), 1);
  EXPECT_EQ(error->userInfo()->errorMessage->utf8(), "cannot load \xC3\xA9");
  EXPECT_FALSE(error->userInfo()->errorLine);
  EXPECT_EQ(error->description()->utf8(), "XSLT:1 - cannot load \xC3\xA9");
  EXPECT_FALSE(isa<XQueryError>(static_cast<NSObject*>(error.get())));
}

TEST(Error, ExceptionKeepsNameAndReason) {
  const NSException exception("XQueryError", NSString::stringWithASCII("why"));
  EXPECT_EQ(exception.name(), "XQueryError");
  EXPECT_EQ(exception.reason()->utf8(), "why");
}

}  // namespace
}  // namespace xquery
