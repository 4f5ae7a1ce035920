// JSON of values, instances and whole reports, compared exactly.
#include <gtest/gtest.h>

#include <limits>

#include "JsonFormat.h"

namespace bluelight::cli {
namespace {

using cmpihost::InstanceValue;
using cmpihost::ObjectPathValue;
using cmpihost::ResultEvent;
using cmpihost::ResultKind;
using cmpihost::StatusValue;
using cmpihost::Value;

TEST(JsonFormat, ScalarsKeepTheirJsonType) {
  EXPECT_EQ(jsonValue(Value::boolean(true)).dump(), "true");
  EXPECT_EQ(jsonValue(Value::uint16(5)).dump(), "5");
  EXPECT_EQ(jsonValue(Value::uint64(18446744073709551615ULL)).dump(), "18446744073709551615");
  EXPECT_EQ(jsonValue(Value::sint64(-3)).dump(), "-3");
  EXPECT_EQ(jsonValue(Value::real64(2.5)).dump(), "2.5");
  EXPECT_EQ(jsonValue(Value::real64(std::numeric_limits<double>::infinity())).dump(), "null");
  EXPECT_EQ(jsonValue(Value("a \"b\"\n")).dump(), R"("a \"b\"\n")");
  EXPECT_EQ(jsonValue(Value::char16('x')).dump(), R"("x")");
  EXPECT_EQ(jsonValue(Value::dateTime("20240102030405.000000+000")).dump(),
            R"("20240102030405.000000+000")");
  EXPECT_EQ(jsonValue(Value::null(CMPI_string)).dump(), "null");
}

// A char16 is a one-character string: its 16-bit unit in UTF-8, a surrogate in its three-byte form
// as in paths.
TEST(JsonFormat, Char16IsItsCharacterInUtf8) {
  const struct {
    CMPIChar16 unit;
    std::string expected;
  } cases[] = {
      {'x', "x"},
      {0x0A, "\n"},
      {0x7F, "\x7F"},
      {0x80, "\xC2\x80"},
      {0xE9, "\xC3\xA9"},
      {0x7FF, "\xDF\xBF"},
      {0x800, "\xE0\xA0\x80"},
      {0x263A, "\xE2\x98\xBA"},
      {0xD800, "\xED\xA0\x80"},
      {0xDFFF, "\xED\xBF\xBF"},
      {0xFFFF, "\xEF\xBF\xBF"},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(jsonValue(Value::char16(c.unit)).get<std::string>(), c.expected) << c.unit;
  }
}

TEST(JsonFormat, ArraysAndReferences) {
  EXPECT_EQ(jsonValue(Value::array(CMPI_uint16, {Value::uint16(3), Value::uint16(5)})).dump(),
            "[3,5]");
  EXPECT_EQ(jsonValue(Value::array(CMPI_boolean, {})).dump(), "[]");
  ObjectPathValue path("root/cimv2", "KESTA_BlueLightCapabilities");
  path.addKey("InstanceID", "KESTA:BlueLightCapabilities1");
  EXPECT_EQ(
      jsonValue(Value::reference(path)).dump(),
      R"("root/cimv2:KESTA_BlueLightCapabilities.InstanceID=\"KESTA:BlueLightCapabilities1\"")");
}

TEST(JsonFormat, TypeNames) {
  EXPECT_EQ(cimTypeName(Value("x")), "string");
  EXPECT_EQ(cimTypeName(Value::uint16(1)), "uint16");
  EXPECT_EQ(cimTypeName(Value::array(CMPI_uint16, {})), "uint16[]");
  EXPECT_EQ(cimTypeName(Value::reference(ObjectPathValue("n", "C"))), "reference");
  EXPECT_EQ(cimTypeName(Value::dateTime("20240102030405.000000+000")), "datetime");
  EXPECT_EQ(cimTypeName(Value::null(CMPI_real32)), "real32");
  EXPECT_EQ(cimTypeName(Value::instance(InstanceValue())), "instance");
}

TEST(JsonFormat, InstanceKeepsPropertyOrder) {
  ObjectPathValue path("root/cimv2", "KESTA_BlueLight");
  path.addKey("DeviceID", "L:1");
  InstanceValue light(path);
  light.set("Zeta", Value::uint16(1)).set("Alpha", Value::boolean(false)).set("Mid", "m");
  EXPECT_EQ(jsonInstance(light).dump(),
            R"({"path":"root/cimv2:KESTA_BlueLight.DeviceID=\"L:1\"","class":"KESTA_BlueLight",)"
            R"("properties":{"Zeta":1,"Alpha":false,"Mid":"m"},)"
            R"("types":{"Zeta":"uint16","Alpha":"boolean","Mid":"string"}})");
}

TEST(JsonFormat, Status) {
  EXPECT_EQ(jsonStatus(StatusValue()).dump(), R"({"code":0,"name":"CMPI_RC_OK","message":null})");
  EXPECT_EQ(jsonStatus(StatusValue(CMPI_RC_ERR_FAILED, "boom")).dump(),
            R"({"code":1,"name":"CMPI_RC_ERR_FAILED","message":"boom"})");
}

TEST(JsonFormat, WholeReport) {
  ObjectPathValue name("root/cimv2", "KESTA_BlueLight");
  name.addKey("DeviceID", "L:1");
  ProviderRun run;
  run.provider = "BlueLightProfileProvider";
  run.kind = MIKind::Instance;
  run.outcome.results.push_back(
      ResultEvent{ResultKind::ObjectPath, cmpihost::ObjectState::Valid, Value::reference(name), 1});
  run.outcome.results.push_back(
      ResultEvent{ResultKind::Done, cmpihost::ObjectState::Valid, Value(), 1});
  run.outcome.doneCount = 1;
  const Report report = buildReport(Operation::EnumerateInstanceNames,
                                    ObjectPathValue("root/cimv2", "KESTA_BlueLight"), {run}, false);
  EXPECT_EQ(
      jsonReport(report).dump(),
      R"({"operation":"EnumerateInstanceNames","target":"root/cimv2:KESTA_BlueLight",)"
      R"("status":{"code":0,"name":"CMPI_RC_OK","message":null},)"
      R"("providers":[{"provider":"BlueLightProfileProvider","mi":"instance",)"
      R"("status":{"code":0,"name":"CMPI_RC_OK","message":null},"results":1,"doneCalls":1}],)"
      R"("instances":[],"paths":["root/cimv2:KESTA_BlueLight.DeviceID=\"L:1\""],"notes":[]})");
}

}  // namespace
}  // namespace bluelight::cli
