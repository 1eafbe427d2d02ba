#include "Platform/Base/WorkMeter.h"
#include "Platform/Reading/KeptText.h"

#include <gtest/gtest.h>

#include <string>

namespace xquery {
namespace {

TEST(KeptText, IsReadFromItsBeginningAsOftenAsWanted) {
  const int64_t before = workMeter.valueBytes;
  {
    KeptText kept;
    std::string all;
    for (int index = 0; index < 100000; ++index) {
      const std::string part = std::to_string(index);
      kept.append(part);
      all += part;
    }
    EXPECT_GE(workMeter.valueBytes - before, static_cast<int64_t>(all.size()));
    for (const size_t room : {1000, 1 << 20}) {
      kept.rewind();
      std::string again;
      std::string buffer(room, '\0');
      for (size_t count = 0; (count = kept.read(buffer.data(), room)) > 0;) {
        again.append(buffer, 0, count);
      }
      EXPECT_TRUE(again == all) << room;
      kept.append("more");
      all += "more";
      EXPECT_EQ(kept.read(buffer.data(), room), 4U) << "what comes later is next";
    }
  }
  EXPECT_EQ(workMeter.valueBytes, before);
}

}  // namespace
}  // namespace xquery
