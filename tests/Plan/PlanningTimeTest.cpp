// Long programs are planned in time in proportion to them.
#include "Plan/PlanTesting.h"
#include "Platform/Base/ProcessorTime.h"

#include <gtest/gtest.h>

#include <string>

namespace xquery {
namespace {

using namespace plantest;

using Program = std::string (*)(size_t size);

std::string predicatesOfOneStep(size_t size) {
  std::string text = "/r/a";
  for (size_t i = 0; i < size; ++i) text += "[b = " + std::to_string(i) + "]";
  return text;
}

std::string pathsInLets(size_t size) {
  std::string text;
  for (size_t i = 0; i < size; ++i) {
    text += "let $v" + std::to_string(i) + " := /r/a" + std::to_string(i) + " ";
  }
  return text + "return $v0";
}

TEST(PlanningTime, IsInProportionToTheProgram) {
  const Program programs[] = {predicatesOfOneStep, pathsInLets};
  for (const Program program : programs) {
    const auto secondsToPlan = [program](size_t size) {
      const std::string text = program(size);
      return processorSecondsOf([&text] { compiled(text, XQueryWay::Planned); });
    };
    EXPECT_TRUE(growsInProportion(secondsToPlan, 4000)) << program(2);
  }
}

}  // namespace
}  // namespace xquery
