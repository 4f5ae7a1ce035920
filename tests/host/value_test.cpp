// The value model: Value, ObjectPathValue, InstanceValue and their text forms; status and type
// names.
#include <cmpihost/status.h>
#include <cmpihost/value.h>
#include <gtest/gtest.h>

#include <sstream>

namespace cmpihost {
namespace {

ObjectPathValue lightPath() {
  return ObjectPathValue("root/cimv2", "KESTA_BlueLight")
      .addKey("CreationClassName", "KESTA_BlueLight")
      .addKey("DeviceID", "Blue Light:1.2");
}

TEST(ValueTest, DefaultIsUntypedNull) {
  const Value value;
  EXPECT_TRUE(value.isNull());
  EXPECT_EQ(value.type(), CMPI_null);
  EXPECT_EQ(value.toString(), "NULL");
}

TEST(ValueTest, ScalarsKeepTheirTypeCode) {
  EXPECT_EQ(Value::boolean(true).type(), CMPI_boolean);
  EXPECT_EQ(Value::char16(65).type(), CMPI_char16);
  EXPECT_EQ(Value::uint8(1).type(), CMPI_uint8);
  EXPECT_EQ(Value::uint16(1).type(), CMPI_uint16);
  EXPECT_EQ(Value::uint32(1).type(), CMPI_uint32);
  EXPECT_EQ(Value::uint64(1).type(), CMPI_uint64);
  EXPECT_EQ(Value::sint8(1).type(), CMPI_sint8);
  EXPECT_EQ(Value::sint16(1).type(), CMPI_sint16);
  EXPECT_EQ(Value::sint32(1).type(), CMPI_sint32);
  EXPECT_EQ(Value::sint64(1).type(), CMPI_sint64);
  EXPECT_EQ(Value::real32(1).type(), CMPI_real32);
  EXPECT_EQ(Value::real64(1).type(), CMPI_real64);
  EXPECT_EQ(Value::string("x").type(), CMPI_string);
  EXPECT_EQ(Value::dateTime("20240101000000.000000+000").type(), CMPI_dateTime);
  EXPECT_EQ(Value::reference(lightPath()).type(), CMPI_ref);
  EXPECT_EQ(Value::instance(InstanceValue()).type(), CMPI_instance);
}

TEST(ValueTest, TypedAccessReturnsTheData) {
  EXPECT_TRUE(Value::boolean(true).asBoolean());
  EXPECT_EQ(Value::uint16(65535).asUnsigned(), 65535u);
  EXPECT_EQ(Value::char16(0x41).asUnsigned(), 0x41u);
  EXPECT_EQ(Value::sint8(-5).asSigned(), -5);
  EXPECT_EQ(Value::sint64(-9000000000LL).asSigned(), -9000000000LL);
  EXPECT_FLOAT_EQ(static_cast<float>(Value::real32(1.5f).asReal()), 1.5f);
  EXPECT_EQ(Value::string("abc").asString(), "abc");
  EXPECT_EQ(Value::reference(lightPath()).asReference(), lightPath());
}

TEST(ValueTest, WrongOrNullAccessThrows) {
  EXPECT_THROW(Value::uint16(1).asSigned(), BadValueAccess);
  EXPECT_THROW(Value::string("x").asBoolean(), BadValueAccess);
  EXPECT_THROW(Value::null(CMPI_string).asString(), BadValueAccess);
  EXPECT_THROW(Value::uint16(1).elements(), BadValueAccess);
  EXPECT_THROW(Value().asReference(), BadValueAccess);
}

TEST(ValueTest, CharsAreStoredAsStrings) {
  EXPECT_EQ(Value::null(CMPI_chars).type(), CMPI_string);
  EXPECT_EQ(Value::null(CMPI_charsA).type(), CMPI_stringA);
  EXPECT_EQ(Value::array(CMPI_chars, {}).type(), CMPI_stringA);
  const Value fromCString("abc");
  EXPECT_EQ(fromCString.type(), CMPI_string);
  const Value fromNull(static_cast<const char*>(nullptr));
  EXPECT_TRUE(fromNull.isNull());
  EXPECT_EQ(fromNull.type(), CMPI_string);
}

TEST(ValueTest, Arrays) {
  const Value array = Value::array(CMPI_uint16, {Value::uint16(2), Value::uint16(3)});
  EXPECT_TRUE(array.isArray());
  EXPECT_EQ(array.type(), CMPI_uint16A);
  EXPECT_EQ(array.elementType(), CMPI_uint16);
  ASSERT_EQ(array.elements().size(), 2u);
  EXPECT_EQ(array.elements()[1].asUnsigned(), 3u);
  EXPECT_EQ(array.toString(), "{2, 3}");
  // Passing the array type instead of the element type means the same.
  EXPECT_EQ(Value::array(CMPI_uint16A, {}).type(), CMPI_uint16A);
}

TEST(ValueTest, Equality) {
  EXPECT_EQ(Value::uint16(1), Value::uint16(1));
  EXPECT_NE(Value::uint16(1), Value::uint32(1));
  EXPECT_NE(Value::uint16(1), Value::uint16(2));
  EXPECT_EQ(Value::null(CMPI_uint16), Value::null(CMPI_uint16));
  EXPECT_NE(Value::null(CMPI_uint16), Value::null(CMPI_uint32));
  EXPECT_NE(Value::null(CMPI_string), Value::string(""));
  EXPECT_EQ(Value::reference(lightPath()), Value::reference(lightPath()));
  EXPECT_EQ(Value::array(CMPI_string, {"a"}), Value::array(CMPI_string, {"a"}));
  EXPECT_NE(Value::array(CMPI_string, {"a"}), Value::array(CMPI_string, {"b"}));
}

TEST(ValueTest, CopiesAreIndependentValues) {
  InstanceValue instance(lightPath());
  instance.set("A", Value::uint8(1));
  const Value original = Value::instance(instance);
  const Value copy = original;  // NOLINT(performance-unnecessary-copy-initialization)
  instance.set("A", Value::uint8(2));
  EXPECT_EQ(copy.asInstance().find("A")->asUnsigned(), 1u);
  EXPECT_EQ(copy, original);
}

TEST(ValueTest, TextForms) {
  EXPECT_EQ(Value::boolean(false).toString(), "false");
  EXPECT_EQ(Value::sint32(-3).toString(), "-3");
  EXPECT_EQ(Value::uint64(18446744073709551615ULL).toString(), "18446744073709551615");
  EXPECT_EQ(Value::real64(0.1).toString(), "0.1");
  EXPECT_EQ(Value::char16('A').toString(), "'A'");
  EXPECT_EQ(Value::char16(7).toString(), "7");
  EXPECT_EQ(Value::string("say \"hi\"\\").toString(), "\"say \\\"hi\\\"\\\\\"");
  EXPECT_EQ(Value::string("a\nb").toString(), "\"a\\nb\"");
  EXPECT_EQ(Value::null(CMPI_uint16A).toString(), "NULL");
  std::ostringstream out;
  out << Value::uint8(9);
  EXPECT_EQ(out.str(), "9");
}

// Strings, date/times and references print quoted in the host's own form: \n \t \r have short
// escapes, every other control below U+0020 is \xHH, DEL and non-ASCII bytes stay as they are.
// Records and test expectations hold these texts.
TEST(ValueTest, StringTextsQuoteControlsAsHexBytes) {
  const struct {
    std::string text;
    std::string expected;
  } cases[] = {
      {"", "\"\""},
      {"tab\there", "\"tab\\there\""},
      {"cr\r", "\"cr\\r\""},
      {"\b\f", "\"\\x08\\x0C\""},
      {std::string("nul\0x", 5), "\"nul\\x00x\""},
      {"\x1B[1m", "\"\\x1B[1m\""},
      {"\x1F", "\"\\x1F\""},
      {"del\x7F", "\"del\x7F\""},
      {"Voyant bleu \xC3\xA9", "\"Voyant bleu \xC3\xA9\""},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(Value::string(c.text).toString(), c.expected) << c.expected;
    EXPECT_EQ(ObjectPathValue("root/cimv2", "C").addKey("K", c.text).toString(),
              "root/cimv2:C.K=" + c.expected);
  }
}

TEST(ObjectPathValueTest, TextFormWithKeysInOrder) {
  EXPECT_EQ(lightPath().toString(),
            "root/cimv2:KESTA_BlueLight.CreationClassName=\"KESTA_BlueLight\","
            "DeviceID=\"Blue Light:1.2\"");
}

TEST(ObjectPathValueTest, TextFormsWithHostAndWithoutParts) {
  ObjectPathValue path = lightPath();
  path.setHost("server1");
  EXPECT_EQ(path.toString(),
            "//server1/root/cimv2:KESTA_BlueLight.CreationClassName="
            "\"KESTA_BlueLight\",DeviceID=\"Blue Light:1.2\"");
  EXPECT_EQ(path.toString(PathText::WithoutHost), lightPath().toString());
  EXPECT_EQ(path.toString(PathText::ClassAndKeys),
            "KESTA_BlueLight.CreationClassName=\"KESTA_BlueLight\",DeviceID=\"Blue Light:1.2\"");
  EXPECT_EQ(ObjectPathValue("root/cimv2", "KESTA_BlueLight").toString(),
            "root/cimv2:KESTA_BlueLight");
  EXPECT_EQ(ObjectPathValue("", "KESTA_BlueLight").toString(), "KESTA_BlueLight");
}

TEST(ObjectPathValueTest, KeyValuesAreQuotedAndEscaped) {
  ObjectPathValue path("ns", "C");
  path.addKey("S", "a\"b\\c").addKey("N", Value::uint16(5)).addKey("B", Value::boolean(true));
  EXPECT_EQ(path.toString(), "ns:C.S=\"a\\\"b\\\\c\",N=5,B=true");
}

TEST(ObjectPathValueTest, ReferenceKeysNestTheQuotedPath) {
  ObjectPathValue association("root/cimv2", "KESTA_BlueLightElementCapabilities");
  association.addKey("ManagedElement", lightPath());
  EXPECT_EQ(association.toString(),
            "root/cimv2:KESTA_BlueLightElementCapabilities.ManagedElement="
            "\"root/cimv2:KESTA_BlueLight.CreationClassName=\\\"KESTA_BlueLight\\\","
            "DeviceID=\\\"Blue Light:1.2\\\"\"");
}

TEST(ObjectPathValueTest, KeyLookupIgnoresCase) {
  const ObjectPathValue path = lightPath();
  ASSERT_NE(path.findKey("deviceid"), nullptr);
  EXPECT_EQ(path.findKey("DEVICEID")->asString(), "Blue Light:1.2");
  EXPECT_EQ(path.findKey("Missing"), nullptr);
}

TEST(ObjectPathValueTest, AddingAnExistingKeyReplacesItInPlace) {
  ObjectPathValue path = lightPath();
  path.addKey("deviceID", "other");
  ASSERT_EQ(path.keys().size(), 2u);
  EXPECT_EQ(path.keys()[1].name, "DeviceID");
  EXPECT_EQ(path.keys()[1].value.asString(), "other");
  EXPECT_TRUE(path.removeKey("CREATIONCLASSNAME"));
  EXPECT_FALSE(path.removeKey("CreationClassName"));
  EXPECT_EQ(path.keys().size(), 1u);
}

TEST(ObjectPathValueTest, ParseReadsWhatToStringWrites) {
  ObjectPathValue association("root/cimv2", "KESTA_BlueLightSystemDevice");
  association.setHost("my.host");
  association.addKey("GroupComponent", lightPath()).addKey("PartComponent", lightPath());
  const std::optional<ObjectPathValue> parsed = ObjectPathValue::parse(association.toString());
  ASSERT_TRUE(parsed);
  EXPECT_EQ(*parsed, association);
}

TEST(ObjectPathValueTest, ParseTypesBareValues) {
  const auto parsed = ObjectPathValue::parse("ns:C.A=5,B=-2,C=1.5,D=TRUE,E=\"x\",F='c'");
  ASSERT_TRUE(parsed);
  EXPECT_EQ(*parsed->findKey("A"), Value::sint64(5));
  EXPECT_EQ(*parsed->findKey("B"), Value::sint64(-2));
  EXPECT_EQ(*parsed->findKey("C"), Value::real64(1.5));
  EXPECT_EQ(*parsed->findKey("D"), Value::boolean(true));
  EXPECT_EQ(*parsed->findKey("E"), Value::string("x"));
  EXPECT_EQ(*parsed->findKey("F"), Value::char16('c'));
}

TEST(ObjectPathValueTest, ParseKeepsStringsThatLookLikePathsWithoutKeys) {
  const auto parsed = ObjectPathValue::parse(
      "ns:C.InstanceID=\"KESTA:BlueLightCapabilities1\",D=\"Blue Light:1.2\"");
  ASSERT_TRUE(parsed);
  EXPECT_EQ(*parsed->findKey("InstanceID"), Value::string("KESTA:BlueLightCapabilities1"));
  EXPECT_EQ(*parsed->findKey("D"), Value::string("Blue Light:1.2"));
}

TEST(ObjectPathValueTest, ParseRejectsMalformedText) {
  EXPECT_FALSE(ObjectPathValue::parse(""));
  EXPECT_FALSE(ObjectPathValue::parse("ns:"));
  EXPECT_FALSE(ObjectPathValue::parse("ns:C."));
  EXPECT_FALSE(ObjectPathValue::parse("ns:C.A"));
  EXPECT_FALSE(ObjectPathValue::parse("ns:C.A=\"open"));
  EXPECT_FALSE(ObjectPathValue::parse("ns:C.A=1,"));
  EXPECT_FALSE(ObjectPathValue::parse("ns:C.A=word"));
  EXPECT_FALSE(ObjectPathValue::parse("bad space:C"));
  EXPECT_FALSE(ObjectPathValue::parse("//host"));
}

TEST(ObjectPathValueTest, EquivalenceIsTheCimComparison) {
  ObjectPathValue a = lightPath();
  ObjectPathValue b("ROOT/CIMV2", "kesta_bluelight");
  b.addKey("deviceid", "Blue Light:1.2").addKey("creationclassname", "KESTA_BlueLight");
  b.setHost("elsewhere");
  EXPECT_TRUE(a.equivalent(b));
  EXPECT_NE(a, b);
  b.addKey("DeviceID", "blue light:1.2");  // key values stay case-sensitive
  EXPECT_FALSE(a.equivalent(b));
}

TEST(InstanceValueTest, PropertiesKeepTheOrderOfFirstSetting) {
  InstanceValue instance(lightPath());
  instance.set("B", Value::uint8(1)).set("A", Value::uint8(2)).set("b", Value::uint8(3));
  ASSERT_EQ(instance.propertyCount(), 2u);
  EXPECT_EQ(instance.properties()[0].name, "B");
  EXPECT_EQ(instance.properties()[0].value, Value::uint8(3));
  EXPECT_EQ(instance.properties()[1].name, "A");
  EXPECT_EQ(instance.className(), "KESTA_BlueLight");
}

TEST(InstanceValueTest, FindAndRemoveIgnoreCase) {
  InstanceValue instance;
  instance.set("ElementName", "light");
  EXPECT_TRUE(instance.has("elementname"));
  EXPECT_EQ(instance.find("ELEMENTNAME")->asString(), "light");
  EXPECT_EQ(instance.find("Other"), nullptr);
  EXPECT_TRUE(instance.remove("elementNAME"));
  EXPECT_FALSE(instance.has("ElementName"));
}

TEST(InstanceValueTest, TextForms) {
  InstanceValue instance(ObjectPathValue("", "KESTA_BlueLight"));
  EXPECT_EQ(instance.toString(), "instance of KESTA_BlueLight { }");
  instance.set("DeviceID", "x").set("Count", Value::uint32(2));
  EXPECT_EQ(instance.toString(), "instance of KESTA_BlueLight { DeviceID = \"x\"; Count = 2; }");
  EXPECT_EQ(instance.toString(true),
            "instance of KESTA_BlueLight {\n  DeviceID = \"x\";\n  Count = 2;\n}");
  instance.path().setNameSpace("root/cimv2");
  EXPECT_EQ(instance.toString(),
            "instance of KESTA_BlueLight (root/cimv2:KESTA_BlueLight) { DeviceID = \"x\"; "
            "Count = 2; }");
}

TEST(InstanceValueTest, EqualityComparesPathAndPropertiesInOrder) {
  InstanceValue a(lightPath());
  a.set("X", Value::uint8(1)).set("Y", Value::uint8(2));
  InstanceValue b(lightPath());
  b.set("Y", Value::uint8(2)).set("X", Value::uint8(1));
  EXPECT_NE(a, b);
  InstanceValue c = a;
  EXPECT_EQ(a, c);
  c.path().setHost("h");
  EXPECT_NE(a, c);
}

TEST(StatusTest, NamesAndText) {
  EXPECT_EQ(rcName(CMPI_RC_ERR_NOT_FOUND), "CMPI_RC_ERR_NOT_FOUND");
  EXPECT_EQ(rcName(static_cast<CMPIrc>(77)), "CMPI_RC_77");
  EXPECT_EQ(StatusValue(CMPI_RC_OK).toString(), "CMPI_RC_OK");
  EXPECT_EQ(StatusValue(CMPI_RC_ERR_FAILED, "boom").toString(), "CMPI_RC_ERR_FAILED: boom");
  EXPECT_EQ(StatusValue(CMPI_RC_ERR_FAILED, "boom"), StatusValue(CMPI_RC_ERR_FAILED, "boom"));
  EXPECT_NE(StatusValue(CMPI_RC_ERR_FAILED, "boom"), StatusValue(CMPI_RC_ERR_FAILED));
  EXPECT_TRUE(StatusValue().ok());
}

TEST(StatusTest, TypeNames) {
  EXPECT_EQ(typeName(CMPI_uint16), "CMPI_uint16");
  EXPECT_EQ(typeName(CMPI_uint16A), "CMPI_uint16A");
  EXPECT_EQ(typeName(CMPI_chars), "CMPI_chars");
  EXPECT_EQ(typeName(CMPI_refA), "CMPI_refA");
  EXPECT_EQ(typeName(CMPI_null), "CMPI_null");
  EXPECT_EQ(typeName(0x0777), "CMPI_type_0x0777");
}

}  // namespace
}  // namespace cmpihost
