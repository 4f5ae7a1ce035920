// The CTest fixture of tests/redfish-mock (redfish_mock_service) as a suite that opts in sees it:
// the file it leaves behind holds one complete source text, and that text reads the fixture's
// service - a chassis and drives without lights - without a single problem. A suite that adds the
// source to its own list therefore sees exactly the lights it saw without it.
#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "PlatformTestSupport.h"
#include "RedfishMock.h"
#include "instrumentation/InstrumentationSource.h"

namespace {

using Kesta::platform::InstrumentationNode;
using Kesta::platform::makeInstrumentationSource;
using testsupport::LogCapture;

class RedfishFixtureTest : public ::testing::Test {
 protected:
  void SetUp() override {
    const std::vector<std::string> lines =
        platform_test::splitLines(testsupport::readFile(REDFISH_TEST_FIXTURE_SOURCE_FILE));
    ASSERT_EQ(lines.size(), 1u) << REDFISH_TEST_FIXTURE_SOURCE_FILE
                                << " should hold one line; is the fixture redfish_mock_service "
                                   "(test redfish.mock.start) running?";
    text_ = lines.front();
  }

  std::string text_;
};

TEST_F(RedfishFixtureTest, TheSourceTextNamesALoopbackServiceAndItsFiles) {
  const std::string start = "redfish:https://127.0.0.1:";
  ASSERT_EQ(text_.rfind(start, 0), 0u) << text_;
  EXPECT_NE(text_.find("?credentials=/"), std::string::npos) << text_;
  EXPECT_NE(text_.find("&ca=/"), std::string::npos) << text_;
  EXPECT_EQ(text_.find("insecure"), std::string::npos) << "the fixture's certificate is checked";
}

TEST_F(RedfishFixtureTest, TheServiceHasNoLightsAndReadsWithoutAProblem) {
  LogCapture capture;
  const std::vector<InstrumentationNode> nodes = makeInstrumentationSource(text_)->readNodes();
  EXPECT_TRUE(nodes.empty());
  EXPECT_TRUE(platform_test::rawLines(capture).empty()) << testsupport::readFile(capture.file());
}

}  // namespace
