// Object path text: the forms a user types, the escapes, the errors, and writing paths back.
#include <gtest/gtest.h>

#include <string>

#include "PathText.h"
#include "UsageError.h"

namespace bluelight::cli {
namespace {

using cmpihost::ObjectPathValue;
using cmpihost::Value;

std::string pathError(const std::string& text) {
  try {
    parseObjectPath(text, "root/cimv2");
  } catch (const UsageError& error) {
    return error.what();
  }
  return "";
}

ObjectPathValue lightPath() {
  ObjectPathValue path("root/cimv2", "KESTA_BlueLight");
  path.addKey("CreationClassName", "KESTA_BlueLight")
      .addKey("DeviceID", "Blue Light:1.2")
      .addKey("SystemCreationClassName", "KESTA_ComputerSystem")
      .addKey("SystemName", "host");
  return path;
}

TEST(PathText, FullPathWithNamespace) {
  const ObjectPathValue path = parseObjectPath(
      "root/cimv2:KESTA_BlueLight.CreationClassName=\"KESTA_BlueLight\",DeviceID=\"Blue "
      "Light:1.2\",SystemCreationClassName=\"KESTA_ComputerSystem\",SystemName=\"host\"",
      "other");
  EXPECT_EQ(path, lightPath());
}

TEST(PathText, NamespaceDefaultsWhenMissing) {
  const ObjectPathValue path = parseObjectPath("KESTA_BlueLight.DeviceID=\"x\"", "root/kesta");
  EXPECT_EQ(path.nameSpace(), "root/kesta");
  EXPECT_EQ(path.className(), "KESTA_BlueLight");
  ASSERT_EQ(path.keys().size(), 1u);
  EXPECT_EQ(path.keys()[0].value, Value("x"));
}

TEST(PathText, HostIsKept) {
  const ObjectPathValue path =
      parseObjectPath("//server.example:5989/root/cimv2:KESTA_BlueLight.DeviceID=\"x\"", "ns");
  EXPECT_EQ(path.host(), "server.example:5989");
  EXPECT_EQ(path.nameSpace(), "root/cimv2");
  const ObjectPathValue noNamespace = parseObjectPath("//h/KESTA_BlueLight.DeviceID=\"x\"", "ns");
  EXPECT_EQ(noNamespace.host(), "h");
  EXPECT_EQ(noNamespace.nameSpace(), "ns");
}

TEST(PathText, ClassPathWithoutKeys) {
  const ObjectPathValue path = parseClassPath("root/interop:KESTA_BlueLight", "root/cimv2");
  EXPECT_EQ(path.nameSpace(), "root/interop");
  EXPECT_EQ(path.className(), "KESTA_BlueLight");
  EXPECT_TRUE(path.keys().empty());
  EXPECT_EQ(parseClassPath("  KESTA_BlueLight ", "root/cimv2").className(), "KESTA_BlueLight");
}

TEST(PathText, ClassPathRefusesKeys) {
  try {
    parseClassPath("KESTA_BlueLight.DeviceID=\"x\"", "root/cimv2");
    FAIL() << "no error";
  } catch (const UsageError& error) {
    EXPECT_STREQ(error.what(),
                 "\"KESTA_BlueLight.DeviceID=\\\"x\\\"\" is an object path with keys; a class "
                 "name (optionally namespace:ClassName) is expected here");
  }
}

TEST(PathText, BareValues) {
  const ObjectPathValue path =
      parseObjectPath("C.a=42,b=-7,c=+3,d=TRUE,e=false,f=2.5,g=1e3,h=18446744073709551615", "ns");
  EXPECT_EQ(*path.findKey("a"), Value::sint64(42));
  EXPECT_EQ(*path.findKey("b"), Value::sint64(-7));
  EXPECT_EQ(*path.findKey("c"), Value::sint64(3));
  EXPECT_EQ(*path.findKey("d"), Value::boolean(true));
  EXPECT_EQ(*path.findKey("e"), Value::boolean(false));
  EXPECT_EQ(*path.findKey("f"), Value::real64(2.5));
  EXPECT_EQ(*path.findKey("g"), Value::real64(1000.0));
  EXPECT_EQ(*path.findKey("h"), Value::uint64(18446744073709551615ULL));
}

TEST(PathText, BlanksAroundEqualsAndCommas) {
  const ObjectPathValue path = parseObjectPath("C.a = \"x y\" , b= 1", "ns");
  EXPECT_EQ(*path.findKey("a"), Value("x y"));
  EXPECT_EQ(*path.findKey("b"), Value::sint64(1));
}

TEST(PathText, Escapes) {
  const ObjectPathValue path =
      parseObjectPath(R"(C.a="q\"b\\n\nt\tr\rb\bf\f'\'",x="\x41\x00e9\x263A")", "ns");
  EXPECT_EQ(path.findKey("a")->asString(), "q\"b\\n\nt\tr\rb\bf\f''");
  EXPECT_EQ(path.findKey("x")->asString(), "A\xC3\xA9\xE2\x98\xBA");
}

// A \x escape is one char16 of one to four hex digits, in UTF-8; a surrogate is passed on in its
// three-byte form rather than replaced, exactly as written.
TEST(PathText, HexEscapesBecomeUtf8) {
  const struct {
    const char* escape;
    std::string expected;
  } cases[] = {
      {R"(\x41)", "A"},
      {R"(\x7f)", "\x7F"},
      {R"(\x80)", "\xC2\x80"},
      {R"(\x00e9)", "\xC3\xA9"},
      {R"(\X7FF)", "\xDF\xBF"},
      {R"(\x800)", "\xE0\xA0\x80"},
      {R"(\x263A)", "\xE2\x98\xBA"},
      {R"(\xD800)", "\xED\xA0\x80"},
      {R"(\xdfff)", "\xED\xBF\xBF"},
      {R"(\xFFFF)", "\xEF\xBF\xBF"},
      {R"(\x263A1)",
       "\xE2\x98\xBA"
       "1"},
  };
  for (const auto& c : cases) {
    const ObjectPathValue path = parseObjectPath(std::string("C.a=\"") + c.escape + "\"", "ns");
    EXPECT_EQ(path.findKey("a")->asString(), c.expected) << c.escape;
  }
}

TEST(PathText, QuotedPathWithKeysIsAReference) {
  const ObjectPathValue path = parseObjectPath(
      R"(KESTA_BlueLightElementCapabilities.ManagedElement="root/cimv2:KESTA_BlueLight.)"
      R"(CreationClassName=\"KESTA_BlueLight\",DeviceID=\"Blue Light:1.2\",)"
      R"(SystemCreationClassName=\"KESTA_ComputerSystem\",SystemName=\"host\"",)"
      R"(Capabilities="KESTA_BlueLightCapabilities.InstanceID=\"KESTA:BlueLightCapabilities1\"")",
      "root/cimv2");
  const Value* element = path.findKey("ManagedElement");
  ASSERT_NE(element, nullptr);
  ASSERT_EQ(element->type(), CMPI_ref);
  EXPECT_EQ(element->asReference(), lightPath());
  const Value* capabilities = path.findKey("Capabilities");
  ASSERT_EQ(capabilities->type(), CMPI_ref);
  // A nested reference keeps having no namespace: it matches any.
  EXPECT_EQ(capabilities->asReference().nameSpace(), "");
  EXPECT_EQ(capabilities->asReference().className(), "KESTA_BlueLightCapabilities");
}

TEST(PathText, QuotedTextsThatOnlyLookLikePathsStayStrings) {
  const ObjectPathValue path = parseObjectPath(
      R"(C.a="Blue Light:1.2",b="KESTA:BlueLightCapabilities1",c="Light:1.2",d="x.y")", "ns");
  for (const char* key : {"a", "b", "c", "d"}) {
    EXPECT_EQ(path.findKey(key)->type(), CMPI_string) << key;
  }
  EXPECT_EQ(path.findKey("c")->asString(), "Light:1.2");
}

TEST(PathText, MalformedPathsSayWhatIsWrongAndWhere) {
  EXPECT_EQ(pathError(""), "malformed object path \"\": the path is empty");
  EXPECT_EQ(pathError("   "), "malformed object path \"   \": the path is empty");
  EXPECT_EQ(pathError("KESTA_BlueLight.DeviceID=\"x"),
            "malformed object path \"KESTA_BlueLight.DeviceID=\\\"x\": the quoted value of key "
            "DeviceID has no closing quote (character 26)");
  EXPECT_EQ(pathError("KESTA_BlueLight.DeviceID\"x\""),
            "malformed object path \"KESTA_BlueLight.DeviceID\\\"x\\\"\": expected \"=\" after the "
            "key name DeviceID (character 25)");
  EXPECT_EQ(pathError("KESTA_BlueLight.DeviceID=x y"),
            "malformed object path \"KESTA_BlueLight.DeviceID=x y\": the value of key DeviceID, "
            "x y, is not quoted, not a number and not TRUE or FALSE; write strings in double "
            "quotes (character 26)");
  EXPECT_EQ(pathError("KESTA_BlueLight.DeviceID="),
            "malformed object path \"KESTA_BlueLight.DeviceID=\": the value of key DeviceID is "
            "missing (character 26)");
  EXPECT_EQ(pathError("KESTA_BlueLight."),
            "malformed object path \"KESTA_BlueLight.\": a key name is missing after \".\" "
            "(character 17)");
  EXPECT_EQ(pathError("KESTA_BlueLight.a=1,"),
            "malformed object path \"KESTA_BlueLight.a=1,\": a key name is missing after \",\" "
            "(character 21)");
  EXPECT_EQ(pathError("KESTA_BlueLight.a=\"1\"b=2"),
            "malformed object path \"KESTA_BlueLight.a=\\\"1\\\"b=2\": expected \",\" before the "
            "next key, found \"b\" (character 22)");
  EXPECT_EQ(pathError("KESTA_BlueLight.a=1,a=2"),
            "malformed object path \"KESTA_BlueLight.a=1,a=2\": key a is given twice (character "
            "21)");
  EXPECT_EQ(pathError("KESTA-BlueLight"),
            "malformed object path \"KESTA-BlueLight\": expected \".\" and the keys after the "
            "class name, found \"-\" (character 6)");
  EXPECT_EQ(pathError("1Light.a=1"),
            "malformed object path \"1Light.a=1\": \"1Light\" is not a class name (it must start "
            "with a letter or \"_\") (character 1)");
  EXPECT_EQ(pathError("root/cimv2.KESTA_BlueLight"),
            "malformed object path \"root/cimv2.KESTA_BlueLight\": the namespace \"root/cimv2\" "
            "must be followed by \":\" and the class name (character 1)");
  EXPECT_EQ(pathError("root//cimv2:X"),
            "malformed object path \"root//cimv2:X\": the namespace \"root//cimv2\" has an empty "
            "part (character 6)");
  EXPECT_EQ(pathError(":X"),
            "malformed object path \":X\": the namespace before \":\" is empty (character 1)");
  EXPECT_EQ(pathError("root/cimv2:"),
            "malformed object path \"root/cimv2:\": the class name is missing (character 12)");
  EXPECT_EQ(pathError("\"KESTA_BlueLight\""),
            "malformed object path \"\\\"KESTA_BlueLight\\\"\": expected a class name, found "
            "\"\\\"\" (character 1)");
  EXPECT_EQ(pathError("//host"),
            "malformed object path \"//host\": \"//\" must be followed by a host name and \"/\" "
            "(character 1)");
  EXPECT_EQ(pathError(R"(C.a="\q")"),
            "malformed object path \"C.a=\\\"\\\\q\\\"\": unknown escape \\q in the value of key a "
            "(write \\\\ for a backslash) (character 6)");
  EXPECT_EQ(pathError(R"(C.a="\xZ")"),
            "malformed object path \"C.a=\\\"\\\\xZ\\\"\": \\x must be followed by 1 to 4 hex "
            "digits in the value of key a (character 6)");
  EXPECT_EQ(pathError(R"(C.a="\x0")"),
            "malformed object path \"C.a=\\\"\\\\x0\\\"\": \\x0 (a NUL character) cannot be part "
            "of a value (character 6)");
  EXPECT_EQ(pathError(std::string("C.a=\"x\0y\"", 9)),
            "malformed object path \"C.a=\\\"x\\x0000y\\\"\": a NUL character cannot be part of "
            "a value (character 7)");
  EXPECT_EQ(pathError("C.a=99999999999999999999999"),
            "malformed object path \"C.a=99999999999999999999999\": the value of key a, "
            "99999999999999999999999, is out of range (character 5)");
  EXPECT_EQ(pathError("C.a=-99999999999999999999999"),
            "malformed object path \"C.a=-99999999999999999999999\": the value of key a, "
            "-99999999999999999999999, is out of range (character 5)");
  EXPECT_EQ(pathError("C.1a=1"),
            "malformed object path \"C.1a=1\": \"1a\" is not a key name (it must start with a "
            "letter or \"_\") (character 3)");
}

TEST(PathText, ControlCharactersInTheTextAreShownEscaped) {
  EXPECT_EQ(pathError("C\x01"),
            "malformed object path \"C\\x0001\": expected \".\" and the keys after the class name, "
            "found the byte 0x01 (character 2)");
}

TEST(PathText, FormatWritesHostNamespaceClassAndKeys) {
  ObjectPathValue path = lightPath();
  path.setHost("host");
  EXPECT_EQ(formatPath(path),
            "//host/root/cimv2:KESTA_BlueLight.CreationClassName=\"KESTA_BlueLight\",DeviceID="
            "\"Blue Light:1.2\",SystemCreationClassName=\"KESTA_ComputerSystem\",SystemName="
            "\"host\"");
  EXPECT_EQ(formatPath(ObjectPathValue("", "KESTA_BlueLight")), "KESTA_BlueLight");
  EXPECT_EQ(formatPath(ObjectPathValue("root/cimv2", "KESTA_BlueLight")),
            "root/cimv2:KESTA_BlueLight");
}

TEST(PathText, FormatKeyValues) {
  EXPECT_EQ(formatKeyValue(Value("a \"b\" \\ c\nd")), R"("a \"b\" \\ c\nd")");
  EXPECT_EQ(formatKeyValue(Value::boolean(true)), "TRUE");
  EXPECT_EQ(formatKeyValue(Value::boolean(false)), "FALSE");
  EXPECT_EQ(formatKeyValue(Value::uint16(7)), "7");
  EXPECT_EQ(formatKeyValue(Value::sint32(-7)), "-7");
  EXPECT_EQ(formatKeyValue(Value::real64(2)), "2.0");
  EXPECT_EQ(formatKeyValue(Value::real32(0.1f)), "0.1");
  EXPECT_EQ(formatKeyValue(Value::char16('x')), "\"x\"");
  EXPECT_EQ(formatKeyValue(Value::dateTime("20240102030405.000000+000")),
            "\"20240102030405.000000+000\"");
  EXPECT_EQ(formatKeyValue(Value::null(CMPI_string)), "NULL");
  ObjectPathValue inner("root/cimv2", "C");
  inner.addKey("k", "v");
  EXPECT_EQ(formatKeyValue(Value::reference(inner)), R"("root/cimv2:C.k=\"v\"")");
}

// A char16 key value is its one character in UTF-8, quoted like a string; a surrogate keeps its
// three-byte form.
TEST(PathText, FormatChar16KeyValues) {
  const struct {
    CMPIChar16 unit;
    std::string expected;
  } cases[] = {
      {'x', R"("x")"},
      {'"', R"("\"")"},
      {0x0A, R"("\n")"},
      {0x01, R"("\x0001")"},
      {0x7F, R"("\x007F")"},
      {0xE9, "\"\xC3\xA9\""},
      {0x263A, "\"\xE2\x98\xBA\""},
      {0xD800, "\"\xED\xA0\x80\""},
      {0xFFFF, "\"\xEF\xBF\xBF\""},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(formatKeyValue(Value::char16(c.unit)), c.expected) << c.unit;
  }
}

TEST(PathText, FormattedPathsReadBackEqual) {
  ObjectPathValue inner = lightPath();
  inner.setHost("host").addKey("DeviceID", "tab\there \"quoted\" back\\slash");
  ObjectPathValue outer("root/cimv2", "KESTA_BlueLightElementCapabilities");
  outer.setHost("host");
  outer.addKey("ManagedElement", Value::reference(inner));
  outer.addKey("Number", Value::sint64(-12));
  outer.addKey("Flag", Value::boolean(true));
  const std::string text = formatPath(outer);
  EXPECT_EQ(parseObjectPath(text, "unused"), outer);
  EXPECT_EQ(formatPath(parseObjectPath(text, "unused")), text);
}

TEST(PathText, CimNames) {
  EXPECT_TRUE(isCimName("KESTA_BlueLight"));
  EXPECT_TRUE(isCimName("_x1"));
  EXPECT_FALSE(isCimName(""));
  EXPECT_FALSE(isCimName("1x"));
  EXPECT_FALSE(isCimName("a-b"));
}

}  // namespace
}  // namespace bluelight::cli
