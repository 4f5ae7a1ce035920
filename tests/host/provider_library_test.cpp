// Loading provider libraries and creating their MIs, including every way that can fail.
#include <cmpihost/provider_library.h>

#include "host_test_support.h"

namespace cmpihost {
namespace {

const char* const kProviderPath = HOST_TEST_PROVIDER_PATH;

TEST(ProviderLibraryTest, LoadsAndFindsSymbols) {
  ProviderLibrary library(kProviderPath);
  EXPECT_EQ(library.path(), kProviderPath);
  EXPECT_TRUE(library.hasSymbol("HostTestProvider_Create_InstanceMI"));
  EXPECT_TRUE(library.hasSymbol("HostTestProvider_Create_AssociationMI"));
  std::string error;
  EXPECT_EQ(library.symbol("NoSuchProvider_Create_InstanceMI", &error), nullptr);
  EXPECT_NE(error.find("NoSuchProvider_Create_InstanceMI"), std::string::npos) << error;
}

TEST(ProviderLibraryTest, HiddenSymbolsAreNotFound) {
  // The provider's own functions stay inside the library; only the factories are exported.
  ProviderLibrary library(kProviderPath);
  EXPECT_FALSE(library.hasSymbol("TestEnumInstances"));
}

TEST(ProviderLibraryTest, MissingLibraryThrowsWithTheLoadersText) {
  try {
    ProviderLibrary library("/nonexistent/libnothing.so");
    FAIL() << "loading a missing library must throw";
  } catch (const LoadError& error) {
    const std::string text = error.what();
    EXPECT_NE(text.find("/nonexistent/libnothing.so"), std::string::npos) << text;
    EXPECT_NE(text.find("No such file"), std::string::npos) << text;
  }
}

TEST(ProviderLibraryTest, NotALibraryThrows) { EXPECT_THROW(ProviderLibrary(__FILE__), LoadError); }

TEST(ProviderLibraryTest, Moves) {
  ProviderLibrary first(kProviderPath);
  ProviderLibrary second = std::move(first);
  EXPECT_TRUE(second.hasSymbol("HostTestProvider_Create_InstanceMI"));
  // A moved-from library holds nothing; asking it is what the test is about.
  // NOLINTNEXTLINE(bugprone-use-after-move,clang-analyzer-cplusplus.Move)
  EXPECT_FALSE(first.hasSymbol("HostTestProvider_Create_InstanceMI"));
  ProviderLibrary third(kProviderPath);
  third = std::move(second);
  EXPECT_TRUE(third.hasSymbol("HostTestProvider_Create_InstanceMI"));
}

TEST(ProviderLibraryTest, SymbolNames) {
  EXPECT_EQ(instanceMISymbol("BlueLightProfileProvider"),
            "BlueLightProfileProvider_Create_InstanceMI");
  EXPECT_EQ(associationMISymbol("BlueLightSystemDeviceProvider"),
            "BlueLightSystemDeviceProvider_Create_AssociationMI");
}

class CreateMITest : public ::testing::Test {
 protected:
  Broker broker;
  ProviderLibrary library{kProviderPath};
};

TEST_F(CreateMITest, InstanceMI) {
  Request request(broker);
  const InstanceMILoad load = createInstanceMI(library, "HostTestProvider", broker, request);
  ASSERT_TRUE(load.ok()) << load.error;
  EXPECT_TRUE(static_cast<bool>(load));
  EXPECT_EQ(load.symbolName, "HostTestProvider_Create_InstanceMI");
  EXPECT_EQ(load.miName, "instanceHostTestProvider");
  EXPECT_EQ(load.miVersion, 200);
  EXPECT_EQ(load.ftVersion, 200);
  EXPECT_EQ(load.status, StatusValue(CMPI_RC_OK));
  ASSERT_NE(load.mi->ft, nullptr);
  EXPECT_NE(load.mi->ft->enumerateInstances, nullptr);
}

TEST_F(CreateMITest, AssociationMIWithABareContext) {
  Request request(broker);
  const AssociationMILoad load =
      createAssociationMI(library, "HostTestProvider", broker, request.context());
  ASSERT_TRUE(load.ok()) << load.error;
  EXPECT_EQ(load.miName, "associationHostTestProvider");
  EXPECT_NE(load.mi->ft->associators, nullptr);
}

TEST_F(CreateMITest, MissingSymbolIsAClearError) {
  Request request(broker);
  const InstanceMILoad load = createInstanceMI(library, "NoSuchProvider", broker, request);
  EXPECT_FALSE(load.ok());
  EXPECT_EQ(load.mi, nullptr);
  EXPECT_NE(load.error.find("NoSuchProvider_Create_InstanceMI"), std::string::npos) << load.error;
  const AssociationMILoad association =
      createAssociationMI(library, "HostTestNullProvider", broker, request);
  EXPECT_FALSE(association.ok());
  EXPECT_NE(association.error.find("HostTestNullProvider_Create_AssociationMI"), std::string::npos);
}

TEST_F(CreateMITest, FactoryReturningNull) {
  Request request(broker);
  const InstanceMILoad load = createInstanceMI(library, "HostTestNullProvider", broker, request);
  EXPECT_FALSE(load.ok());
  EXPECT_EQ(load.status, StatusValue(CMPI_RC_ERR_FAILED, "cannot start"));
  EXPECT_NE(load.error.find("returned NULL"), std::string::npos) << load.error;
  EXPECT_NE(load.error.find("cannot start"), std::string::npos) << load.error;
}

TEST_F(CreateMITest, NewerMIVersionIsRefused) {
  Request request(broker);
  const InstanceMILoad load = createInstanceMI(library, "HostTestFutureProvider", broker, request);
  EXPECT_FALSE(load.ok());
  EXPECT_EQ(load.mi, nullptr);
  EXPECT_EQ(load.miVersion, 300);
  EXPECT_EQ(load.miName, "instanceHostTestFutureProvider");
  EXPECT_NE(load.error.find("300"), std::string::npos) << load.error;
}

TEST_F(CreateMITest, OlderBrokerRefusesCurrentMIs) {
  BrokerOptions options;
  options.version = 100;
  Broker old(options);
  Request request(old);
  const InstanceMILoad load = createInstanceMI(library, "HostTestProvider", old, request);
  EXPECT_FALSE(load.ok());
  EXPECT_NE(load.error.find("100"), std::string::npos) << load.error;
}

TEST_F(CreateMITest, MIWithoutTable) {
  Request request(broker);
  const InstanceMILoad load = createInstanceMI(library, "HostTestNoTableProvider", broker, request);
  EXPECT_FALSE(load.ok());
  EXPECT_NE(load.error.find("function table"), std::string::npos) << load.error;
}

}  // namespace
}  // namespace cmpihost
