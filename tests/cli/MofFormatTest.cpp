// MOF text of values and instances, compared exactly.
#include <gtest/gtest.h>

#include <limits>
#include <string>

#include "MofFormat.h"
#include "TextForms.h"

namespace bluelight::cli {
namespace {

using cmpihost::InstanceValue;
using cmpihost::ObjectPathValue;
using cmpihost::Value;

TEST(MofFormat, Scalars) {
  EXPECT_EQ(mofValue(Value::boolean(true)), "TRUE");
  EXPECT_EQ(mofValue(Value::boolean(false)), "FALSE");
  EXPECT_EQ(mofValue(Value::uint8(255)), "255");
  EXPECT_EQ(mofValue(Value::uint16(5)), "5");
  EXPECT_EQ(mofValue(Value::uint32(4294967295u)), "4294967295");
  EXPECT_EQ(mofValue(Value::uint64(18446744073709551615ULL)), "18446744073709551615");
  EXPECT_EQ(mofValue(Value::sint8(-128)), "-128");
  EXPECT_EQ(mofValue(Value::sint16(-2)), "-2");
  EXPECT_EQ(mofValue(Value::sint32(0)), "0");
  EXPECT_EQ(mofValue(Value::sint64(-9223372036854775807LL - 1)), "-9223372036854775808");
  EXPECT_EQ(mofValue(Value::real32(1.5f)), "1.5");
  EXPECT_EQ(mofValue(Value::real32(0.1f)), "0.1");
  EXPECT_EQ(mofValue(Value::real64(0.1)), "0.1");
  EXPECT_EQ(mofValue(Value::real64(3)), "3.0");
  EXPECT_EQ(mofValue(Value::real64(1e300)), "1e+300");
  EXPECT_EQ(mofValue(Value::dateTime("20240102030405.000000+060")),
            "\"20240102030405.000000+060\"");
}

TEST(MofFormat, Nulls) {
  EXPECT_EQ(mofValue(Value()), "NULL");
  EXPECT_EQ(mofValue(Value::null(CMPI_uint16)), "NULL");
  EXPECT_EQ(mofValue(Value::null(CMPI_uint16A)), "NULL");
}

TEST(MofFormat, StringsAreEscaped) {
  EXPECT_EQ(mofValue(Value("Blue Light")), "\"Blue Light\"");
  EXPECT_EQ(mofValue(Value("")), "\"\"");
  EXPECT_EQ(mofValue(Value("say \"hi\"")), R"("say \"hi\"")");
  EXPECT_EQ(mofValue(Value("C:\\leds")), R"("C:\\leds")");
  EXPECT_EQ(mofValue(Value("a\nb\tc\rd\be\ff")), R"("a\nb\tc\rd\be\ff")");
  EXPECT_EQ(mofValue(Value("bell\x07 del\x7f")), R"("bell\x0007 del\x007F")");
  EXPECT_EQ(mofValue(Value("it's")), "\"it's\"");
  EXPECT_EQ(mofValue(Value("Licht \xC3\xA4")), "\"Licht \xC3\xA4\"");
}

TEST(MofFormat, Char16) {
  EXPECT_EQ(mofValue(Value::char16('A')), "'A'");
  EXPECT_EQ(mofValue(Value::char16('\'')), R"('\'')");
  EXPECT_EQ(mofValue(Value::char16('\\')), R"('\\')");
  EXPECT_EQ(mofValue(Value::char16(0x263A)), R"('\x263A')");
  EXPECT_EQ(mofValue(Value::char16(0x0A)), R"('\x000A')");
}

TEST(MofFormat, Arrays) {
  EXPECT_EQ(mofValue(Value::array(CMPI_uint16, {Value::uint16(2), Value::uint16(11)})), "{2, 11}");
  EXPECT_EQ(mofValue(Value::array(CMPI_uint16, {})), "{}");
  EXPECT_EQ(mofValue(Value::array(CMPI_string, {Value("a"), Value::null(CMPI_string)})),
            "{\"a\", NULL}");
  EXPECT_EQ(mofValue(Value::array(CMPI_boolean, {Value::boolean(true)})), "{TRUE}");
}

TEST(MofFormat, ReferencesAreQuotedPathText) {
  ObjectPathValue path("root/cimv2", "KESTA_BlueLight");
  path.setHost("host");
  path.addKey("CreationClassName", "KESTA_BlueLight").addKey("DeviceID", "Blue Light:1.2");
  EXPECT_EQ(mofValue(Value::reference(path)),
            R"("//host/root/cimv2:KESTA_BlueLight.CreationClassName=\"KESTA_BlueLight\",)"
            R"(DeviceID=\"Blue Light:1.2\"")");
}

TEST(MofFormat, EmbeddedInstanceIsItsQuotedOneLineText) {
  InstanceValue inner(ObjectPathValue("root/cimv2", "KESTA_Thing"));
  inner.set("Name", "x").set("Count", Value::uint8(2));
  EXPECT_EQ(mofValue(Value::instance(inner)),
            R"("instance of KESTA_Thing { Name = \"x\"; Count = 2; }")");
}

TEST(MofFormat, InstanceWithPathComment) {
  ObjectPathValue path("root/cimv2", "KESTA_BlueLight");
  path.setHost("host").addKey("CreationClassName", "KESTA_BlueLight").addKey("DeviceID", "L:1.2");
  InstanceValue light(path);
  light.set("CreationClassName", "KESTA_BlueLight")
      .set("DeviceID", "L:1.2")
      .set("HealthState", Value::uint16(5))
      .set("OperationalStatus", Value::array(CMPI_uint16, {Value::uint16(2), Value::uint16(11)}))
      .set("AudibleAlarm", Value::boolean(false))
      .set("Caption", Value::null(CMPI_string));
  EXPECT_EQ(mofInstance(light),
            "// //host/root/cimv2:KESTA_BlueLight.CreationClassName=\"KESTA_BlueLight\","
            "DeviceID=\"L:1.2\"\n"
            "instance of KESTA_BlueLight\n"
            "{\n"
            "    CreationClassName = \"KESTA_BlueLight\";\n"
            "    DeviceID = \"L:1.2\";\n"
            "    HealthState = 5;\n"
            "    OperationalStatus = {2, 11};\n"
            "    AudibleAlarm = FALSE;\n"
            "    Caption = NULL;\n"
            "};\n");
}

TEST(MofFormat, InstanceWithoutPropertiesOrComment) {
  const InstanceValue empty(ObjectPathValue("root/cimv2", "KESTA_BlueLight"));
  EXPECT_EQ(mofInstance(empty, false), "instance of KESTA_BlueLight\n{\n};\n");
}

TEST(TextForms, RealTextReadsBackAsAReal) {
  EXPECT_EQ(realText(0, false), "0.0");
  EXPECT_EQ(realText(-2.5, false), "-2.5");
  EXPECT_EQ(realText(1e21, false), "1e+21");
  EXPECT_EQ(realText(16777217.0, true), "16777216.0");
  constexpr double kInfinity = std::numeric_limits<double>::infinity();
  EXPECT_EQ(realText(std::numeric_limits<double>::quiet_NaN(), false), "NaN");
  EXPECT_EQ(realText(kInfinity, false), "Infinity");
  EXPECT_EQ(realText(-kInfinity, false), "-Infinity");
}

TEST(TextForms, QuoteKeepsEverythingOnOneLine) {
  EXPECT_EQ(quote("line1\nline2"), R"("line1\nline2")");
  EXPECT_EQ(quote(std::string("nul\0x", 5)), R"("nul\x0000x")");
}

// The tool's one quoted form is MOF's: \b and \f have short escapes, the other controls and DEL
// are \xHHHH, which the path reader reads back.
TEST(TextForms, QuoteWritesMofEscapes) {
  const struct {
    std::string text;
    std::string expected;
  } cases[] = {
      {"", R"("")"},
      {"Blue Light:1.2", R"("Blue Light:1.2")"},
      {R"(a "b" \ c)", R"("a \"b\" \\ c")"},
      {"n\nt\tr\r", R"("n\nt\tr\r")"},
      {"b\bf\f", R"("b\bf\f")"},
      {"\x01", R"("\x0001")"},
      {"\x1B[1m", R"("\x001B[1m")"},
      {"\x1F", R"("\x001F")"},
      {"del\x7F", R"("del\x007F")"},
      {"'single'", R"("'single'")"},
      {"Licht \xC3\xA4", "\"Licht \xC3\xA4\""},
      {"\xFF", "\"\xFF\""},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(quote(c.text), c.expected) << c.expected;
  }
}

}  // namespace
}  // namespace bluelight::cli
