// Kesta::Instrumentation walking the nodes of a source it is given.
#include <gtest/gtest.h>

#include <memory>
#include <stdexcept>
#include <string>
#include <vector>

#include "KestaInstrumentation.h"
#include "PlatformTestSupport.h"
#include "instrumentation/InstrumentationSource.h"

namespace {

using Kesta::Instrumentation;
using Kesta::NodeLexicon;
using Kesta::platform::InstrumentationNode;
using Kesta::platform::InstrumentationSource;
using Kesta::platform::SourceError;
using testsupport::LogCapture;

constexpr auto kBlueLight = NodeLexicon::NODE_TYPE_BLUE_LIGHT;
constexpr auto kAlarmState = NodeLexicon::PROPERTY_ALARM_STATE;

// A source with fixed nodes, or one that fails with a given reason.
class FakeSource final : public InstrumentationSource {
 public:
  explicit FakeSource(std::vector<InstrumentationNode> nodes) : nodes_(std::move(nodes)) {}
  explicit FakeSource(std::string failure) : failure_(std::move(failure)) {}

  std::string name() const override { return "fake:tree"; }
  std::vector<InstrumentationNode> readNodes() const override {
    if (!failure_.empty()) {
      throw SourceError(failure_);
    }
    return nodes_;
  }

 private:
  std::vector<InstrumentationNode> nodes_;
  std::string failure_;
};

InstrumentationNode node(unsigned int type, std::string path, std::string description,
                         unsigned int status = 0,
                         std::vector<Kesta::platform::NodeProperty> properties = {}) {
  InstrumentationNode result;
  result.type = type;
  result.path = std::move(path);
  result.description = std::move(description);
  result.status = status;
  result.properties = std::move(properties);
  return result;
}

std::unique_ptr<InstrumentationSource> mixedTree() {
  return std::make_unique<FakeSource>(std::vector<InstrumentationNode>{
      node(3, "0.1", "Fan"),
      node(kBlueLight, "1.2", "Blue Light", 1, {{kAlarmState, 2}}),
      node(7, "0.2", "Temperature", 20),
      node(kBlueLight, "1.3", "Blue Light", 0),
      node(kBlueLight, "1.4", "Second Light", 20, {{9, 9}, {kAlarmState, 3}}),
  });
}

std::vector<std::string> walk(Instrumentation& cursor) {
  std::vector<std::string> paths;
  for (; cursor; ++cursor) {
    paths.push_back(cursor.convertPathToString(cursor.getPathToNode()));
  }
  return paths;
}

TEST(InstrumentationCursor, StandsOnTheFirstNodeOfAnyTypeBeforeSelection) {
  Instrumentation cursor(mixedTree());
  ASSERT_TRUE(static_cast<bool>(cursor));
  EXPECT_EQ(cursor.getPathToNode(), "0.1");
  EXPECT_EQ(cursor.getNodeDescription(), "Fan");
  EXPECT_EQ(walk(cursor), (std::vector<std::string>{"0.1", "1.2", "0.2", "1.3", "1.4"}));
}

TEST(InstrumentationCursor, SelectNodeRestrictsToOneTypeInOrder) {
  Instrumentation cursor(mixedTree());
  EXPECT_TRUE(cursor.selectNode(kBlueLight));
  EXPECT_EQ(walk(cursor), (std::vector<std::string>{"1.2", "1.3", "1.4"}));
}

TEST(InstrumentationCursor, SelectNodeStartsAgainFromTheTop) {
  Instrumentation cursor(mixedTree());
  ASSERT_TRUE(cursor.selectNode(kBlueLight));
  ++cursor;
  ++cursor;
  EXPECT_EQ(cursor.getPathToNode(), "1.4");
  ASSERT_TRUE(cursor.selectNode(kBlueLight));
  EXPECT_EQ(cursor.getPathToNode(), "1.2");
}

TEST(InstrumentationCursor, SelectNodeOfAMissingTypeFindsNothing) {
  Instrumentation cursor(mixedTree());
  EXPECT_FALSE(cursor.selectNode(static_cast<NodeLexicon::NodeType>(99)));
  EXPECT_FALSE(static_cast<bool>(cursor));
}

TEST(InstrumentationCursor, ReadsTheCurrentNode) {
  Instrumentation cursor(mixedTree());
  ASSERT_TRUE(cursor.selectNode(kBlueLight));
  unsigned int value = 77;
  EXPECT_EQ(cursor.getNodeDescription(), "Blue Light");
  EXPECT_EQ(cursor.getNodeStatus(), 1u);
  EXPECT_TRUE(cursor.getProperty(kAlarmState, value));
  EXPECT_EQ(value, 2u);

  ++cursor;
  value = 77;
  EXPECT_EQ(cursor.getNodeStatus(), 0u);
  EXPECT_FALSE(cursor.getProperty(kAlarmState, value));
  EXPECT_EQ(value, 77u) << "a missing property leaves the caller's value alone";

  ++cursor;
  EXPECT_EQ(cursor.getNodeDescription(), "Second Light");
  EXPECT_EQ(cursor.getNodeStatus(), 20u);
  EXPECT_TRUE(cursor.getProperty(kAlarmState, value));
  EXPECT_EQ(value, 3u);
}

TEST(InstrumentationCursor, ConvertPathToStringGivesThePrintablePath) {
  Instrumentation cursor(mixedTree());
  cursor.selectNode(kBlueLight);
  const std::string path = cursor.getPathToNode();
  EXPECT_EQ(cursor.convertPathToString(path), "1.2");
}

TEST(InstrumentationCursor, AccessorsPastTheEndAreEmpty) {
  Instrumentation cursor(mixedTree());
  cursor.selectNode(kBlueLight);
  walk(cursor);
  ASSERT_FALSE(static_cast<bool>(cursor));
  ++cursor;
  ++cursor;
  EXPECT_FALSE(static_cast<bool>(cursor));
  unsigned int value = 5;
  EXPECT_EQ(cursor.getPathToNode(), "");
  EXPECT_EQ(cursor.convertPathToString(cursor.getPathToNode()), "");
  EXPECT_EQ(cursor.getNodeDescription(), "");
  EXPECT_EQ(cursor.getNodeStatus(), 0u);
  EXPECT_FALSE(cursor.getProperty(kAlarmState, value));
  EXPECT_EQ(value, 5u);
}

TEST(InstrumentationCursor, AnEmptyTree) {
  Instrumentation cursor(std::make_unique<FakeSource>(std::vector<InstrumentationNode>{}));
  EXPECT_FALSE(static_cast<bool>(cursor));
  EXPECT_FALSE(cursor.selectNode(kBlueLight));
  EXPECT_EQ(cursor.getNodeDescription(), "");
}

TEST(InstrumentationCursor, AFailingSourceLogsOneLineAndThrows) {
  LogCapture capture;
  try {
    Instrumentation cursor(std::make_unique<FakeSource>(std::string("the bus is gone")));
    FAIL() << "no exception";
  } catch (const std::exception& error) {
    EXPECT_STREQ(error.what(),
                 "Instrumentation source \"fake:tree\" cannot be read: the bus is gone");
  }
  EXPECT_EQ(platform_test::rawLines(capture),
            (std::vector<std::string>{"Kesta.Platform.Instrumentation\t6000\tLOG\tInstrumentation "
                                      "source \"fake:tree\" cannot be read: the bus is gone"}));
}

TEST(InstrumentationCursor, ANullSourceLogsAndThrows) {
  LogCapture capture;
  EXPECT_THROW(Instrumentation cursor(nullptr), std::exception);
  EXPECT_EQ(platform_test::rawLines(capture).size(), 1u);
}

TEST(InstrumentationNode, PropertyLookup) {
  const InstrumentationNode light = node(kBlueLight, "1", "d", 0, {{4, 40}, {1, 10}});
  EXPECT_EQ(light.property(1), 10u);
  EXPECT_EQ(light.property(4), 40u);
  EXPECT_EQ(light.property(2), std::nullopt);
}

}  // namespace
