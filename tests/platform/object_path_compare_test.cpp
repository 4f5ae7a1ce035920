// Kesta::isObjPathsEqual against a minimal fake of CMPI object paths and strings: function
// tables with just the slots the comparison calls (the rest stay null, so a call to any other
// slot, such as getHostname, would crash the test).
#include <cmpidt.h>
#include <cmpift.h>
#include <cmpimacs.h>
#include <gtest/gtest.h>

#include <cstdint>
#include <deque>
#include <optional>
#include <string>
#include <vector>

#include "KestaCommon.h"

namespace {

void setStatus(CMPIStatus* status, CMPIrc rc) {
  if (status != nullptr) {
    status->rc = rc;
    status->msg = nullptr;
  }
}

class FakeString {
 public:
  explicit FakeString(std::optional<std::string> text) : text_(std::move(text)) {
    object_.hdl = this;
    object_.ft = &table();
  }
  FakeString(const FakeString&) = delete;
  FakeString& operator=(const FakeString&) = delete;
  ~FakeString() = default;

  CMPIString* get() { return &object_; }

 private:
  static CMPIStringFT& table() {
    static CMPIStringFT strings = [] {
      CMPIStringFT t = {};
      t.ftVersion = 200;
      t.getCharPtr = &FakeString::getCharPtr;
      return t;
    }();
    return strings;
  }
  static char* getCharPtr(const CMPIString* text, CMPIStatus* rc) {
    setStatus(rc, CMPI_RC_OK);
    auto* self = static_cast<FakeString*>(text->hdl);
    return self->text_ ? self->text_->data() : nullptr;
  }

  CMPIString object_ = {};
  std::optional<std::string> text_;
};

// What a fake path should get wrong.
struct Failures {
  bool className = false;      // getClassName reports an error
  bool nullClassName = false;  // getClassName returns no string
  bool nameSpace = false;      // getNameSpace reports an error
  bool keyCount = false;       // getKeyCount reports an error
  int keyAt = -1;              // getKeyAt reports an error for this index
  int nullKeyName = -1;        // getKeyAt returns no name for this index
};

class FakePath {
 public:
  explicit FakePath(std::string className,
                    std::optional<std::string> nameSpace = std::string("root/kesta"))
      : className_(std::move(className)), nameSpace_(std::move(nameSpace)) {
    object_.hdl = this;
    object_.ft = &table();
  }
  FakePath(const FakePath&) = delete;
  FakePath& operator=(const FakePath&) = delete;
  ~FakePath() = default;

  const CMPIObjectPath* get() const { return &object_; }
  CMPIObjectPath* get() { return &object_; }

  FakePath& chars(std::string name, std::string value) {
    chars_.push_back(std::move(value));
    CMPIData data = {};
    data.type = CMPI_chars;
    data.state = CMPI_keyValue;
    data.value.chars = chars_.back().data();
    return key(std::move(name), data);
  }
  FakePath& string(std::string name, std::optional<std::string> value) {
    strings_.emplace_back(std::move(value));
    CMPIData data = {};
    data.type = CMPI_string;
    data.state = CMPI_keyValue;
    data.value.string = strings_.back().get();
    return key(std::move(name), data);
  }
  FakePath& integer(std::string name, CMPIType type, std::int64_t value) {
    CMPIData data = {};
    data.type = type;
    data.state = CMPI_keyValue;
    switch (type) {
      case CMPI_uint8:
        data.value.uint8 = static_cast<CMPIUint8>(value);
        break;
      case CMPI_uint16:
        data.value.uint16 = static_cast<CMPIUint16>(value);
        break;
      case CMPI_uint32:
        data.value.uint32 = static_cast<CMPIUint32>(value);
        break;
      case CMPI_uint64:
        data.value.uint64 = static_cast<CMPIUint64>(value);
        break;
      case CMPI_sint8:
        data.value.sint8 = static_cast<CMPISint8>(value);
        break;
      case CMPI_sint16:
        data.value.sint16 = static_cast<CMPISint16>(value);
        break;
      case CMPI_sint32:
        data.value.sint32 = static_cast<CMPISint32>(value);
        break;
      default:
        data.value.sint64 = static_cast<CMPISint64>(value);
        break;
    }
    return key(std::move(name), data);
  }
  FakePath& boolean(std::string name, CMPIBoolean value) {
    CMPIData data = {};
    data.type = CMPI_boolean;
    data.state = CMPI_keyValue;
    data.value.boolean = value;
    return key(std::move(name), data);
  }
  FakePath& reference(std::string name, FakePath& target) {
    CMPIData data = {};
    data.type = CMPI_ref;
    data.state = CMPI_keyValue;
    data.value.ref = target.get();
    return key(std::move(name), data);
  }
  FakePath& key(std::string name, CMPIData data) {
    keys_.push_back({std::move(name), data});
    return *this;
  }

  Failures fail;

 private:
  struct Key {
    std::string name;
    CMPIData data;
  };

  static CMPIObjectPathFT& table() {
    static CMPIObjectPathFT paths = [] {
      CMPIObjectPathFT t = {};
      t.ftVersion = 200;
      t.getNameSpace = &FakePath::getNameSpace;
      t.getClassName = &FakePath::getClassName;
      t.getKeyAt = &FakePath::getKeyAt;
      t.getKeyCount = &FakePath::getKeyCount;
      return t;
    }();
    return paths;
  }
  static FakePath& self(const CMPIObjectPath* path) { return *static_cast<FakePath*>(path->hdl); }
  CMPIString* newString(std::optional<std::string> text) {
    strings_.emplace_back(std::move(text));
    return strings_.back().get();
  }

  static CMPIString* getNameSpace(const CMPIObjectPath* path, CMPIStatus* rc) {
    FakePath& fake = self(path);
    if (fake.fail.nameSpace) {
      setStatus(rc, CMPI_RC_ERR_FAILED);
      return nullptr;
    }
    setStatus(rc, CMPI_RC_OK);
    return fake.nameSpace_ ? fake.newString(fake.nameSpace_) : nullptr;
  }
  static CMPIString* getClassName(const CMPIObjectPath* path, CMPIStatus* rc) {
    FakePath& fake = self(path);
    if (fake.fail.className) {
      setStatus(rc, CMPI_RC_ERR_FAILED);
      return fake.newString(fake.className_);
    }
    setStatus(rc, CMPI_RC_OK);
    return fake.fail.nullClassName ? nullptr : fake.newString(fake.className_);
  }
  static CMPIData getKeyAt(const CMPIObjectPath* path, CMPICount index, CMPIString** name,
                           CMPIStatus* rc) {
    FakePath& fake = self(path);
    CMPIData data = {};
    data.state = CMPI_notFound;
    if (index >= fake.keys_.size() || static_cast<int>(index) == fake.fail.keyAt) {
      setStatus(rc, CMPI_RC_ERR_NO_SUCH_PROPERTY);
      return data;
    }
    setStatus(rc, CMPI_RC_OK);
    if (name != nullptr) {
      *name = static_cast<int>(index) == fake.fail.nullKeyName
                  ? nullptr
                  : fake.newString(fake.keys_[index].name);
    }
    return fake.keys_[index].data;
  }
  static CMPICount getKeyCount(const CMPIObjectPath* path, CMPIStatus* rc) {
    FakePath& fake = self(path);
    setStatus(rc, fake.fail.keyCount ? CMPI_RC_ERR_FAILED : CMPI_RC_OK);
    return static_cast<CMPICount>(fake.keys_.size());
  }

  CMPIObjectPath object_ = {};
  std::string className_;
  std::optional<std::string> nameSpace_;
  std::vector<Key> keys_;
  std::deque<std::string> chars_;
  std::deque<FakeString> strings_;
};

// The four keys of a light, as the module builds them.
void addLightKeys(FakePath& path, const std::string& deviceId = "Blue Light:1.2") {
  path.chars("CreationClassName", "KESTA_BlueLight")
      .chars("DeviceID", deviceId)
      .chars("SystemCreationClassName", "KESTA_ComputerSystem")
      .chars("SystemName", "server7.example.test");
}

bool equal(const FakePath& a, const FakePath& b, bool compareNamespaces) {
  return Kesta::isObjPathsEqual(a.get(), b.get(), compareNamespaces);
}

TEST(ObjectPathCompare, SamePathsAreEqual) {
  FakePath a("KESTA_BlueLight");
  FakePath b("KESTA_BlueLight");
  addLightKeys(a);
  addLightKeys(b);
  EXPECT_TRUE(equal(a, b, false));
  EXPECT_TRUE(equal(a, b, true));
  EXPECT_TRUE(equal(a, a, true));
}

TEST(ObjectPathCompare, ClassNamesIgnoreCase) {
  FakePath a("KESTA_BlueLight");
  FakePath b("kesta_bluelight");
  FakePath c("KESTA_BlueLightCapabilities");
  EXPECT_TRUE(equal(a, b, true));
  EXPECT_FALSE(equal(a, c, true));
}

TEST(ObjectPathCompare, KeyOrderAndNameCaseDoNotMatter) {
  FakePath a("KESTA_BlueLight");
  addLightKeys(a);
  FakePath b("KESTA_BlueLight");
  b.chars("systemname", "server7.example.test")
      .chars("DEVICEID", "Blue Light:1.2")
      .chars("SystemCreationClassName", "KESTA_ComputerSystem")
      .chars("creationClassName", "KESTA_BlueLight");
  EXPECT_TRUE(equal(a, b, false));
}

TEST(ObjectPathCompare, KeySetsMustMatch) {
  FakePath a("KESTA_BlueLight");
  addLightKeys(a);
  FakePath fewer("KESTA_BlueLight");
  fewer.chars("CreationClassName", "KESTA_BlueLight").chars("DeviceID", "Blue Light:1.2");
  FakePath other("KESTA_BlueLight");
  other.chars("CreationClassName", "KESTA_BlueLight")
      .chars("DeviceID", "Blue Light:1.2")
      .chars("SystemCreationClassName", "KESTA_ComputerSystem")
      .chars("Name", "server7.example.test");
  EXPECT_FALSE(equal(a, fewer, false));
  EXPECT_FALSE(equal(fewer, a, false));
  EXPECT_FALSE(equal(a, other, false));
}

TEST(ObjectPathCompare, StringValuesCompareExactly) {
  FakePath a("C");
  a.chars("DeviceID", "Blue Light:1.2");
  FakePath b("C");
  b.chars("DeviceID", "blue light:1.2");
  FakePath c("C");
  c.chars("DeviceID", "Blue Light:1.2 ");
  EXPECT_FALSE(equal(a, b, false));
  EXPECT_FALSE(equal(a, c, false));
}

TEST(ObjectPathCompare, CharsAndStringValuesAreAlike) {
  FakePath a("C");
  a.chars("DeviceID", "Blue Light:1.2");
  FakePath b("C");
  b.string("DeviceID", std::string("Blue Light:1.2"));
  FakePath c("C");
  c.string("DeviceID", std::string("Blue Light:1.3"));
  EXPECT_TRUE(equal(a, b, false));
  EXPECT_TRUE(equal(b, a, false));
  EXPECT_FALSE(equal(b, c, false));
}

struct IntegerCase {
  CMPIType firstType;
  std::int64_t first;
  CMPIType secondType;
  std::int64_t second;
  bool equal;
};

class IntegerKeys : public ::testing::TestWithParam<IntegerCase> {};

TEST_P(IntegerKeys, CompareByValue) {
  const IntegerCase& c = GetParam();
  FakePath a("C");
  a.integer("Id", c.firstType, c.first);
  FakePath b("C");
  b.integer("Id", c.secondType, c.second);
  EXPECT_EQ(equal(a, b, false), c.equal);
  EXPECT_EQ(equal(b, a, false), c.equal);
}

INSTANTIATE_TEST_SUITE_P(
    Table, IntegerKeys,
    ::testing::Values(IntegerCase{CMPI_uint8, 5, CMPI_sint64, 5, true},
                      IntegerCase{CMPI_uint16, 300, CMPI_uint32, 300, true},
                      IntegerCase{CMPI_uint16, 300, CMPI_uint64, 301, false},
                      IntegerCase{CMPI_sint8, -1, CMPI_sint64, -1, true},
                      IntegerCase{CMPI_sint32, -1, CMPI_uint32, 4294967295LL, false},
                      IntegerCase{CMPI_sint64, -1, CMPI_uint64, -1, false},
                      IntegerCase{CMPI_sint16, 0, CMPI_uint8, 0, true},
                      IntegerCase{CMPI_uint64, INT64_MAX, CMPI_sint64, INT64_MAX, true},
                      IntegerCase{CMPI_sint32, 26, CMPI_uint16, 26, true}));

TEST(ObjectPathCompare, BooleansCompareByTruth) {
  FakePath a("C");
  a.boolean("Flag", 1);
  FakePath b("C");
  b.boolean("Flag", 2);
  FakePath c("C");
  c.boolean("Flag", 0);
  EXPECT_TRUE(equal(a, b, false));
  EXPECT_FALSE(equal(a, c, false));
}

TEST(ObjectPathCompare, DifferentKindsOfValueDiffer) {
  FakePath text("C");
  text.chars("Id", "5");
  FakePath number("C");
  number.integer("Id", CMPI_uint32, 5);
  FakePath flag("C");
  flag.boolean("Id", 1);
  FakePath one("C");
  one.integer("Id", CMPI_uint8, 1);
  EXPECT_FALSE(equal(text, number, false));
  EXPECT_FALSE(equal(flag, one, false));
}

TEST(ObjectPathCompare, OtherTypesAndArraysAreNeverEqual) {
  CMPIData real = {};
  real.type = CMPI_real64;
  real.value.real64 = 1.5;
  FakePath a("C");
  a.key("Id", real);
  FakePath b("C");
  b.key("Id", real);
  EXPECT_FALSE(equal(a, b, false));

  CMPIData array = {};
  array.type = CMPI_chars | CMPI_ARRAY;
  FakePath c("C");
  c.key("Id", array);
  FakePath d("C");
  d.key("Id", array);
  EXPECT_FALSE(equal(c, d, false));
}

TEST(ObjectPathCompare, NullValuesAreNeverEqual) {
  CMPIData nothing = {};
  nothing.type = CMPI_chars;
  nothing.state = CMPI_nullValue;
  FakePath a("C");
  a.key("Id", nothing);
  FakePath b("C");
  b.key("Id", nothing);
  EXPECT_FALSE(equal(a, b, false));

  FakePath nullChars("C");
  CMPIData chars = {};
  chars.type = CMPI_chars;
  chars.value.chars = nullptr;
  nullChars.key("Id", chars);
  EXPECT_FALSE(equal(nullChars, nullChars, false));

  FakePath nullString("C");
  nullString.string("Id", std::nullopt);
  EXPECT_FALSE(equal(nullString, nullString, false));

  FakePath noStringObject("C");
  CMPIData string = {};
  string.type = CMPI_string;
  string.value.string = nullptr;
  noStringObject.key("Id", string);
  EXPECT_FALSE(equal(noStringObject, noStringObject, false));
}

TEST(ObjectPathCompare, NamespacesOnlyWhenAsked) {
  FakePath a("C", std::string("root/kesta"));
  FakePath b("C", std::string("ROOT/Kesta"));
  FakePath c("C", std::string("root/cimv2"));
  EXPECT_TRUE(equal(a, b, true));
  EXPECT_FALSE(equal(a, c, true));
  EXPECT_TRUE(equal(a, c, false));
}

TEST(ObjectPathCompare, MissingTopLevelNamespaceOnlyEqualsAnotherMissingOne) {
  FakePath present("C", std::string("root/kesta"));
  FakePath empty("C", std::string(""));
  FakePath missing("C", std::nullopt);
  EXPECT_FALSE(equal(present, empty, true));
  EXPECT_FALSE(equal(missing, present, true));
  EXPECT_TRUE(equal(empty, missing, true));
  EXPECT_TRUE(equal(present, empty, false));
}

TEST(ObjectPathCompare, ReferencesCompareRecursively) {
  FakePath light1("KESTA_BlueLight");
  addLightKeys(light1);
  FakePath light2("kesta_bluelight");
  addLightKeys(light2);
  FakePath otherLight("KESTA_BlueLight");
  addLightKeys(otherLight, "Blue Light:1.3");
  FakePath capabilities("KESTA_BlueLightCapabilities");
  capabilities.chars("InstanceID", "KESTA:BlueLightCapabilities1");

  FakePath a("KESTA_BlueLightElementCapabilities");
  a.reference("ManagedElement", light1).reference("Capabilities", capabilities);
  FakePath b("KESTA_BlueLightElementCapabilities");
  b.reference("Capabilities", capabilities).reference("ManagedElement", light2);
  FakePath c("KESTA_BlueLightElementCapabilities");
  c.reference("ManagedElement", otherLight).reference("Capabilities", capabilities);
  EXPECT_TRUE(equal(a, b, true));
  EXPECT_FALSE(equal(a, c, true));
}

TEST(ObjectPathCompare, NestedReferencesWithoutNamespaceMatchAny) {
  FakePath withNamespace("KESTA_BlueLight", std::string("root/kesta"));
  addLightKeys(withNamespace);
  FakePath withoutNamespace("KESTA_BlueLight", std::string(""));
  addLightKeys(withoutNamespace);
  FakePath missingNamespace("KESTA_BlueLight", std::nullopt);
  addLightKeys(missingNamespace);
  FakePath elsewhere("KESTA_BlueLight", std::string("root/other"));
  addLightKeys(elsewhere);

  FakePath a("Assoc");
  a.reference("PartComponent", withNamespace);
  FakePath b("Assoc");
  b.reference("PartComponent", withoutNamespace);
  FakePath c("Assoc");
  c.reference("PartComponent", missingNamespace);
  FakePath d("Assoc");
  d.reference("PartComponent", elsewhere);
  EXPECT_TRUE(equal(a, b, true));
  EXPECT_TRUE(equal(a, c, true));
  EXPECT_FALSE(equal(a, d, true));
  EXPECT_TRUE(equal(a, d, false));
}

TEST(ObjectPathCompare, NullPathsEqualNothing) {
  FakePath a("C");
  EXPECT_FALSE(Kesta::isObjPathsEqual(nullptr, nullptr, false));
  EXPECT_FALSE(Kesta::isObjPathsEqual(a.get(), nullptr, false));
  EXPECT_FALSE(Kesta::isObjPathsEqual(nullptr, a.get(), true));

  CMPIObjectPath noHandle = {nullptr, a.get()->ft};
  EXPECT_FALSE(Kesta::isObjPathsEqual(&noHandle, a.get(), false));
  CMPIObjectPath noTable = {a.get()->hdl, nullptr};
  EXPECT_FALSE(Kesta::isObjPathsEqual(a.get(), &noTable, false));

  FakePath withNullReference("Assoc");
  CMPIData reference = {};
  reference.type = CMPI_ref;
  reference.value.ref = nullptr;
  withNullReference.key("Part", reference);
  EXPECT_FALSE(equal(withNullReference, withNullReference, false));
}

TEST(ObjectPathCompare, FailingCallsMeanNotEqual) {
  const auto check = [](auto breakIt, bool compareNamespaces) {
    FakePath good("C");
    good.chars("Id", "1").chars("Other", "2");
    FakePath broken("C");
    broken.chars("Id", "1").chars("Other", "2");
    breakIt(broken.fail);
    EXPECT_TRUE(equal(good, good, compareNamespaces));
    EXPECT_FALSE(equal(good, broken, compareNamespaces));
    EXPECT_FALSE(equal(broken, good, compareNamespaces));
  };
  check([](Failures& f) { f.className = true; }, false);
  check([](Failures& f) { f.nullClassName = true; }, false);
  check([](Failures& f) { f.keyCount = true; }, false);
  check([](Failures& f) { f.keyAt = 1; }, false);
  check([](Failures& f) { f.nullKeyName = 0; }, false);
  check([](Failures& f) { f.nameSpace = true; }, true);
}

TEST(ObjectPathCompare, AFailingNamespaceDoesNotMatterWhenNotCompared) {
  FakePath good("C");
  FakePath broken("C");
  broken.fail.nameSpace = true;
  EXPECT_TRUE(equal(good, broken, false));
}

TEST(ObjectPathCompare, MissingTableSlotsMeanNotEqual) {
  FakePath a("C");
  CMPIObjectPathFT partial = {};
  partial.getClassName = a.get()->ft->getClassName;
  CMPIObjectPath path = {a.get()->hdl, &partial};
  EXPECT_FALSE(Kesta::isObjPathsEqual(&path, &path, false));
  EXPECT_FALSE(Kesta::isObjPathsEqual(&path, &path, true));
}

TEST(ObjectPathCompare, KeyNamesRepeatedInOnePathMakeItUnequal) {
  FakePath twice("C");
  twice.chars("Id", "1").chars("ID", "1");
  FakePath other("C");
  other.chars("Id", "1").chars("Name", "1");
  EXPECT_FALSE(equal(twice, other, false));
  EXPECT_FALSE(equal(other, twice, false));
  EXPECT_FALSE(equal(twice, twice, false));
}

TEST(ObjectPathCompare, SelfReferenceEnds) {
  FakePath loop("C");
  loop.reference("Self", loop);
  EXPECT_FALSE(equal(loop, loop, true));
}

}  // namespace
