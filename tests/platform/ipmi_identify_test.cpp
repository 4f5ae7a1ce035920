// Decoding of Get Chassis Status answers, byte by byte, and the node made of each reading.
#include <gtest/gtest.h>

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "instrumentation/ipmi/IpmiIdentify.h"

namespace {

using Kesta::platform::completionCodeText;
using Kesta::platform::decodeChassisStatus;
using Kesta::platform::identifyNode;
using Kesta::platform::IdentifyReading;
using Kesta::platform::IdentifyState;
using Kesta::platform::InstrumentationNode;
using Kesta::platform::OnReport;

using Kind = IdentifyReading::Kind;

struct AnswerCase {
  const char* name;
  std::vector<std::uint8_t> answer;  // completion code first
  Kind kind;
  IdentifyState state;  // when Known
  const char* problem;  // when Unusable
};

const std::vector<AnswerCase>& answerCases() {
  static const std::vector<AnswerCase> cases = {
      // The misc chassis state byte (the fourth) alone decides.
      {"NotReported", {0x00, 0x01, 0x00, 0x00}, Kind::NotReported, IdentifyState::Off, ""},
      {"Off", {0x00, 0x01, 0x00, 0x40}, Kind::Known, IdentifyState::Off, ""},
      {"TimedOn", {0x00, 0x01, 0x00, 0x50}, Kind::Known, IdentifyState::TimedOn, ""},
      {"IndefinitelyOn", {0x00, 0x01, 0x00, 0x60}, Kind::Known, IdentifyState::IndefinitelyOn, ""},
      {"Reserved",
       {0x00, 0x01, 0x00, 0x70},
       Kind::Unusable,
       IdentifyState::Off,
       "Get Chassis Status reports the reserved identify state 11b"},
      // Without bit 6 the state bits mean nothing, whatever they hold.
      {"StateBitsWithoutReportBit",
       {0x00, 0x01, 0x00, 0x30},
       Kind::NotReported,
       IdentifyState::Off,
       ""},
      // The other misc bits (intrusion, front panel lockout, faults) and bit 7 do not disturb.
      {"OffWithOtherBits", {0x00, 0x00, 0x1f, 0xcf}, Kind::Known, IdentifyState::Off, ""},
      {"TimedWithOtherBits", {0x00, 0x7f, 0xff, 0xdf}, Kind::Known, IdentifyState::TimedOn, ""},
      {"IndefiniteWithOtherBits",
       {0x00, 0x00, 0x00, 0xef},
       Kind::Known,
       IdentifyState::IndefinitelyOn,
       ""},
      // The front panel byte that follows is optional and ignored.
      {"WithFrontPanelByte",
       {0x00, 0x01, 0x00, 0x60, 0xff},
       Kind::Known,
       IdentifyState::IndefinitelyOn,
       ""},
      {"LongerStill",
       {0x00, 0x01, 0x00, 0x50, 0x00, 0x01, 0x02},
       Kind::Known,
       IdentifyState::TimedOn,
       ""},
      // Short answers.
      {"Empty",
       {},
       Kind::Unusable,
       IdentifyState::Off,
       "the answer to Get Chassis Status is empty"},
      {"CompletionCodeOnly",
       {0x00},
       Kind::Unusable,
       IdentifyState::Off,
       "the answer to Get Chassis Status is too short (1 bytes, at least 4 expected)"},
      {"TwoBytes",
       {0x00, 0x01},
       Kind::Unusable,
       IdentifyState::Off,
       "the answer to Get Chassis Status is too short (2 bytes, at least 4 expected)"},
      {"ThreeBytes",
       {0x00, 0x01, 0x00},
       Kind::Unusable,
       IdentifyState::Off,
       "the answer to Get Chassis Status is too short (3 bytes, at least 4 expected)"},
      // Error completion codes win over whatever follows them.
      {"InvalidCommand",
       {0xc1},
       Kind::Unusable,
       IdentifyState::Off,
       "Get Chassis Status failed with completion code C1h (invalid command)"},
      {"NodeBusyWithData",
       {0xc0, 0x01, 0x00, 0x60},
       Kind::Unusable,
       IdentifyState::Off,
       "Get Chassis Status failed with completion code C0h (node busy)"},
      {"Timeout",
       {0xc3},
       Kind::Unusable,
       IdentifyState::Off,
       "Get Chassis Status failed with completion code C3h (timeout while processing the "
       "command)"},
      {"InsufficientPrivilege",
       {0xd4},
       Kind::Unusable,
       IdentifyState::Off,
       "Get Chassis Status failed with completion code D4h (insufficient privilege level)"},
      {"Unspecified",
       {0xff, 0x01, 0x00, 0x40},
       Kind::Unusable,
       IdentifyState::Off,
       "Get Chassis Status failed with completion code FFh (unspecified error)"},
      {"CommandSpecificCode",
       {0x80},
       Kind::Unusable,
       IdentifyState::Off,
       "Get Chassis Status failed with completion code 80h"},
      {"OemCode",
       {0x01, 0x01, 0x00, 0x40},
       Kind::Unusable,
       IdentifyState::Off,
       "Get Chassis Status failed with completion code 01h"},
  };
  return cases;
}

class IpmiChassisStatusAnswer : public ::testing::TestWithParam<AnswerCase> {};

TEST_P(IpmiChassisStatusAnswer, DecodesAsExpected) {
  const AnswerCase& expected = GetParam();
  const IdentifyReading reading = decodeChassisStatus(expected.answer);
  EXPECT_EQ(reading.kind, expected.kind);
  if (expected.kind == Kind::Known) {
    EXPECT_EQ(reading.state, expected.state);
  }
  EXPECT_EQ(reading.problem, expected.problem);
}

INSTANTIATE_TEST_SUITE_P(IpmiTable, IpmiChassisStatusAnswer, ::testing::ValuesIn(answerCases()),
                         [](const ::testing::TestParamInfo<AnswerCase>& info) {
                           return std::string(info.param.name);
                         });

TEST(IpmiChassisStatusDecoding, EveryMiscByteDecodesOneWay) {
  // All 256 values of the misc byte: bit 6 and bits 5:4 decide, nothing else.
  for (unsigned int misc = 0; misc < 256; ++misc) {
    const std::vector<std::uint8_t> answer = {0x00, 0x01, 0x00, static_cast<std::uint8_t>(misc)};
    const IdentifyReading reading = decodeChassisStatus(answer);
    SCOPED_TRACE(misc);
    if ((misc & 0x40) == 0) {
      EXPECT_EQ(reading.kind, Kind::NotReported);
      continue;
    }
    switch ((misc >> 4) & 0x03) {
      case 0:
        EXPECT_EQ(reading.kind, Kind::Known);
        EXPECT_EQ(reading.state, IdentifyState::Off);
        break;
      case 1:
        EXPECT_EQ(reading.kind, Kind::Known);
        EXPECT_EQ(reading.state, IdentifyState::TimedOn);
        break;
      case 2:
        EXPECT_EQ(reading.kind, Kind::Known);
        EXPECT_EQ(reading.state, IdentifyState::IndefinitelyOn);
        break;
      default:
        EXPECT_EQ(reading.kind, Kind::Unusable);
    }
  }
}

TEST(IpmiChassisStatusDecoding, NullPointerIsAnEmptyAnswer) {
  EXPECT_EQ(decodeChassisStatus(nullptr, 4).kind, Kind::Unusable);
}

TEST(IpmiCompletionCodeText, NamesTheGenericCodesAndNumbersTheRest) {
  EXPECT_EQ(completionCodeText(0xc1), "C1h (invalid command)");
  EXPECT_EQ(completionCodeText(0xcc), "CCh (invalid data field in the request)");
  EXPECT_EQ(completionCodeText(0xd5), "D5h (command not supported in the present state)");
  EXPECT_EQ(completionCodeText(0x00), "00h");
  EXPECT_EQ(completionCodeText(0x9a), "9Ah");
}

struct NodeCase {
  const char* name;
  std::vector<std::uint8_t> answer;
  OnReport onReport;
  unsigned int status;
  std::optional<unsigned int> alarmState;
};

class IpmiIdentifyNodeFromAnswer : public ::testing::TestWithParam<NodeCase> {};

TEST_P(IpmiIdentifyNodeFromAnswer, CarriesStatusAndAlarmState) {
  const NodeCase& expected = GetParam();
  const InstrumentationNode node = identifyNode(decodeChassisStatus(expected.answer),
                                                "ipmi:/dev/ipmi0", "Front ID", expected.onReport);
  EXPECT_EQ(node.type, 26u);
  EXPECT_EQ(node.path, "ipmi:/dev/ipmi0");
  EXPECT_EQ(node.description, "Front ID");
  EXPECT_EQ(node.status, expected.status);
  EXPECT_EQ(node.property(1), expected.alarmState);
  EXPECT_EQ(node.properties.size(), expected.alarmState ? 1u : 0u);
}

INSTANTIATE_TEST_SUITE_P(
    IpmiTable, IpmiIdentifyNodeFromAnswer,
    ::testing::Values(
        NodeCase{"Off", {0x00, 0x01, 0x00, 0x40}, OnReport::Alternating, 1, 1u},
        NodeCase{"TimedOn", {0x00, 0x01, 0x00, 0x50}, OnReport::Alternating, 1, 3u},
        NodeCase{"IndefinitelyOn", {0x00, 0x01, 0x00, 0x60}, OnReport::Alternating, 1, 3u},
        NodeCase{"OffSteady", {0x00, 0x01, 0x00, 0x40}, OnReport::Steady, 1, 1u},
        NodeCase{"TimedOnSteady", {0x00, 0x01, 0x00, 0x50}, OnReport::Steady, 1, 2u},
        NodeCase{"IndefinitelyOnSteady", {0x00, 0x01, 0x00, 0x60}, OnReport::Steady, 1, 2u},
        NodeCase{"NotReported", {0x00, 0x01, 0x00, 0x00}, OnReport::Alternating, 0, std::nullopt},
        NodeCase{"Reserved", {0x00, 0x01, 0x00, 0x70}, OnReport::Alternating, 21, std::nullopt},
        NodeCase{"Short", {0x00, 0x01, 0x00}, OnReport::Alternating, 21, std::nullopt},
        NodeCase{"ErrorCode", {0xc1}, OnReport::Steady, 21, std::nullopt}),
    [](const ::testing::TestParamInfo<NodeCase>& info) { return std::string(info.param.name); });

TEST(IpmiIdentifyNode, AFailedTransportIsDegraded) {
  const InstrumentationNode node =
      identifyNode(IdentifyReading::unusable("no answer"), "ipmi-lan:bmc:623", "Blue Light",
                   OnReport::Alternating);
  EXPECT_EQ(node.status, 21u);
  EXPECT_TRUE(node.properties.empty());
}

}  // namespace
