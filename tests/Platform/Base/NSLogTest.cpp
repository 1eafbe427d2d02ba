#include "Platform/Base/NSLog.h"

#include <gtest/gtest.h>

#include <cstdlib>

namespace xquery {
namespace {

class Log : public testing::Test {
 protected:
  void TearDown() override { ::unsetenv("XQUERY_LOG"); }
};

TEST_F(Log, IsOnWhenSetAndNeitherEmptyNorZero) {
  ::unsetenv("XQUERY_LOG");
  EXPECT_FALSE(XQueryLogEnabled());
  ::setenv("XQUERY_LOG", "", 1);
  EXPECT_FALSE(XQueryLogEnabled());
  ::setenv("XQUERY_LOG", "0", 1);
  EXPECT_FALSE(XQueryLogEnabled());
  for (const char* value : {"1", "yes", "00", " ", "0 "}) {
    ::setenv("XQUERY_LOG", value, 1);
    EXPECT_TRUE(XQueryLogEnabled()) << value;
  }
}

TEST_F(Log, WritesOneLinePerCall) {
  testing::internal::CaptureStderr();
  NSLog("first %d");
  NSLog("");
  NSLog("with\nline\rends");
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "first %d\n\nwith\\nline\\rends\n");
}

}  // namespace
}  // namespace xquery
