// The readers the deployment tests rely on: if they misread a file, the other tests would check
// the wrong thing, so they are checked on small texts with known content first.
#include <gtest/gtest.h>

#include "DeployFiles.h"
#include "MofReader.h"

namespace {

TEST(MofReader, ReadsClassesWithQualifiersPropertiesAndMethods) {
  const mof::Document doc = mof::parse(R"(
#pragma locale ("en_US")
// a comment
[Association, Version("1.0.0"), Description("two " "parts"), Provider("cmpi:P")]
class X_Assoc : CIM_Component
{
    [Key, Override("GroupComponent"), Min(1), ValueMap{"1", "2"}]
  X_System REF GroupComponent;
  /* a block
     comment */
  uint16 States[] = {1, 2};
  string Text = "a \"quoted\" text";
  uint32 Reset([IN] uint16 How, [IN(false), OUT] string Why[]);
  boolean Flag;
};
class X_Root { datetime When; };
)");
  ASSERT_EQ(doc.classes.size(), 2u);
  const mof::Class& c = doc.classes[0];
  EXPECT_EQ(c.name, "X_Assoc");
  EXPECT_EQ(c.superclass, "CIM_Component");
  EXPECT_TRUE(c.hasQualifier("association"));
  EXPECT_EQ(c.qualifier("Description")->value.scalar(), "two parts");
  EXPECT_EQ(c.qualifier("Provider")->value.scalar(), "cmpi:P");
  ASSERT_EQ(c.properties.size(), 4u);
  const mof::Property* group = c.property("groupcomponent");
  ASSERT_NE(group, nullptr);
  EXPECT_TRUE(group->reference);
  EXPECT_EQ(group->typeText(), "REF X_System");
  EXPECT_TRUE(group->hasQualifier("Key"));
  EXPECT_EQ(group->qualifier("Override")->value.scalar(), "GroupComponent");
  EXPECT_EQ(group->qualifier("ValueMap")->value.items, (std::vector<std::string>{"1", "2"}));
  EXPECT_EQ(c.property("States")->typeText(), "uint16[]");
  EXPECT_EQ(c.property("Text")->typeText(), "string");
  EXPECT_EQ(c.property("Flag")->typeText(), "boolean");
  EXPECT_EQ(c.methods, std::vector<std::string>{"Reset"});
  EXPECT_EQ(c.property("Reset"), nullptr);
  EXPECT_EQ(doc.classes[1].superclass, "");
  EXPECT_EQ(doc.classes[1].property("When")->type, "datetime");
}

TEST(MofReader, ReadsInstances) {
  const mof::Document doc = mof::parse(R"(
instance of PG_ProviderCapabilities
{
    Name = "n";
    Namespaces = {"root/cimv2", "root/x"};
    ProviderType = {2, 3};
    SupportedMethods = NULL;
};
)");
  ASSERT_EQ(doc.instances.size(), 1u);
  const mof::Instance& i = doc.instances[0];
  EXPECT_EQ(i.className, "PG_ProviderCapabilities");
  EXPECT_EQ(i.text("name"), "n");
  EXPECT_EQ(i.value("Namespaces")->items, (std::vector<std::string>{"root/cimv2", "root/x"}));
  EXPECT_TRUE(i.value("ProviderType")->array);
  EXPECT_TRUE(i.value("SupportedMethods")->null);
  EXPECT_EQ(i.value("Missing"), nullptr);
  EXPECT_THROW(i.text("Namespaces"), mof::MofError);
  EXPECT_EQ(doc.instancesOf("pg_providercapabilities").size(), 1u);
}

TEST(MofReader, RefusesWhatItDoesNotUnderstandNamingTheLine) {
  try {
    mof::parse("class A {\n  string Good;\n  strnig Bad;\n};\n");
    FAIL() << "no error";
  } catch (const mof::MofError& error) {
    EXPECT_NE(std::string(error.what()).find("line 3"), std::string::npos) << error.what();
  }
  EXPECT_THROW(mof::parse("class A { string S; }"), mof::MofError);             // no ';'
  EXPECT_THROW(mof::parse("class A { string S; string s; };"), mof::MofError);  // twice
  EXPECT_THROW(mof::parse("qualifier Key : boolean;"), mof::MofError);
  EXPECT_THROW(mof::parse("class A { string S = \"open; };"), mof::MofError);
}

TEST(SfcbRegistrationReader, ReadsSections) {
  const auto registrations = deploy::parseSfcbRegistration(R"(# comment
[KESTA_A]
   provider: PA
   location: liba
   type: instance association
   namespace: root/cimv2 root/x
   group: liba
#
[KESTA_B]
   provider: PB
   location: liba
   type: instance
   namespace: root/cimv2
)",
                                                           "test.reg");
  ASSERT_EQ(registrations.size(), 2u);
  EXPECT_EQ(registrations[0].className, "KESTA_A");
  EXPECT_EQ(registrations[0].provider, "PA");
  EXPECT_EQ(registrations[0].location, "liba");
  EXPECT_EQ(registrations[0].kinds, (std::set<std::string>{"instance", "association"}));
  EXPECT_EQ(registrations[0].namespaces, (std::set<std::string>{"root/cimv2", "root/x"}));
  EXPECT_EQ(registrations[1].kinds, std::set<std::string>{"instance"});
  EXPECT_EQ(deploy::factorySymbols(registrations[0]),
            (std::set<std::string>{"PA_Create_InstanceMI", "PA_Create_AssociationMI"}));
}

TEST(SfcbRegistrationReader, RefusesUnknownKeysAndEntriesOutsideSections) {
  EXPECT_THROW(deploy::parseSfcbRegistration("provider: P\n", "x.reg"), std::runtime_error);
  EXPECT_THROW(deploy::parseSfcbRegistration("[A]\n  provder: P\n", "x.reg"), std::runtime_error);
}

TEST(FactorySymbols, RecogniseTheMiFactoryNames) {
  EXPECT_TRUE(deploy::isFactorySymbol("BlueLightProfileProvider_Create_InstanceMI"));
  EXPECT_TRUE(deploy::isFactorySymbol("X_Create_AssociationMI"));
  EXPECT_FALSE(deploy::isFactorySymbol("_ZN5Kesta13getSystemNameB5cxx11Ev"));
  EXPECT_FALSE(deploy::isFactorySymbol("Create_InstanceMI"));
}

}  // namespace
