// The generated registrations against what they describe: the libraries and their exported MI
// factories, the class MOF, and each other. A provider renamed in the module, a class renamed in
// the MOF or a library renamed in the build fails here before any object manager sees it.
//
// The provider table is the one source of the registrations, of the module's class and provider
// names and of the tool's provider map; each of them is checked against the table as written.
#include <gtest/gtest.h>

#include <filesystem>
#include <map>
#include <regex>
#include <set>
#include <string>
#include <vector>

#include "BlueLightNames.h"
#include "DeployFiles.h"
#include "ProviderMap.h"
#include "TestSupport.h"
#include "cmpihost/cmpihost.h"
#include "text/Text.h"

namespace {

namespace fs = std::filesystem;
using deploy::Registration;

// The namespace the class MOF is compiled into and the documents use.
const char* const kNameSpace = "root/cimv2";

std::map<std::string, std::vector<Registration>> byLocation(
    const std::vector<Registration>& registrations) {
  std::map<std::string, std::vector<Registration>> grouped;
  for (const Registration& registration : registrations) {
    grouped[registration.location].push_back(registration);
  }
  return grouped;
}

std::set<std::string> summaries(const std::vector<Registration>& registrations) {
  std::set<std::string> result;
  for (const Registration& registration : registrations) {
    result.insert(registration.summary());
  }
  return result;
}

class RegistrationTest : public ::testing::Test {
 protected:
  void SetUp() override {
    ASSERT_NO_THROW(sfcb_ = deploy::sfcbRegistrations());
    ASSERT_NO_THROW(pegasus_ = deploy::pegasusRegistrations());
    ASSERT_FALSE(sfcb_.empty()) << "no sfcb registration was generated";
    ASSERT_FALSE(pegasus_.empty()) << "no OpenPegasus registration was generated";
  }

  // Both object managers' registrations; they are checked to be equal, but each is checked
  // against the libraries in its own right so a failure names the file.
  std::vector<Registration> all() const {
    std::vector<Registration> both = sfcb_;
    both.insert(both.end(), pegasus_.begin(), pegasus_.end());
    return both;
  }

  std::vector<Registration> sfcb_;
  std::vector<Registration> pegasus_;
};

TEST_F(RegistrationTest, SfcbAndPegasusRegisterTheSameProviders) {
  EXPECT_EQ(summaries(sfcb_), summaries(pegasus_));
  EXPECT_EQ(sfcb_.size(), pegasus_.size());
}

TEST_F(RegistrationTest, EveryRegistrationIsComplete) {
  for (const Registration& registration : all()) {
    SCOPED_TRACE(registration.file + ": " + registration.summary());
    EXPECT_FALSE(registration.className.empty());
    EXPECT_FALSE(registration.provider.empty());
    EXPECT_FALSE(registration.location.empty());
    // Object managers route EnumerateInstances and GetInstance of association classes to the
    // instance MI too, so every class needs one.
    EXPECT_EQ(registration.kinds.count("instance"), 1u);
    for (const std::string& kind : registration.kinds) {
      EXPECT_TRUE(kind == "instance" || kind == "association") << kind;
    }
  }
}

TEST_F(RegistrationTest, EachClassIsRegisteredOnce) {
  for (const auto* registrations : {&sfcb_, &pegasus_}) {
    std::set<std::string> seen;
    for (const Registration& registration : *registrations) {
      EXPECT_TRUE(seen.insert(registration.className).second)
          << registration.className << " is registered twice in " << registration.file;
    }
  }
}

TEST_F(RegistrationTest, ClassesAreRegisteredInTheNamespaceOfTheClassMof) {
  for (const Registration& registration : all()) {
    EXPECT_EQ(registration.namespaces, std::set<std::string>{kNameSpace})
        << registration.file << ": " << registration.className;
  }
}

TEST_F(RegistrationTest, EveryLocationIsABuiltProviderLibrary) {
  const std::vector<std::string> libraries = deploy::providerLibraries();
  const std::set<std::string> known(libraries.begin(), libraries.end());
  for (const Registration& registration : all()) {
    SCOPED_TRACE(registration.file + ": " + registration.className);
    EXPECT_EQ(known.count(registration.location), 1u)
        << "location " << registration.location << " is not a provider library of this build";
    // The object managers open lib<location>.so: that exact name must exist.
    EXPECT_TRUE(fs::exists(deploy::libraryPathFor(registration.location)))
        << deploy::libraryPathFor(registration.location);
  }
}

TEST_F(RegistrationTest, EveryProviderLibraryIsRegisteredForBothObjectManagers) {
  const auto sfcbLibraries = byLocation(sfcb_);
  const auto pegasusLibraries = byLocation(pegasus_);
  for (const std::string& library : deploy::providerLibraries()) {
    EXPECT_EQ(sfcbLibraries.count(library), 1u) << library << " has no sfcb registration";
    EXPECT_EQ(pegasusLibraries.count(library), 1u) << library << " has no OpenPegasus registration";
  }
}

TEST_F(RegistrationTest, RegisteredFactoriesAreExactlyTheExportedOnes) {
  for (const auto& [location, registrations] : byLocation(all())) {
    const std::string path = deploy::libraryPathFor(location);
    SCOPED_TRACE(path);
    std::set<std::string> exported;
    ASSERT_NO_THROW(exported = deploy::definedDynamicSymbols(path));
    std::set<std::string> exportedFactories;
    for (const std::string& symbol : exported) {
      if (deploy::isFactorySymbol(symbol)) exportedFactories.insert(symbol);
    }
    std::set<std::string> registered;
    for (const Registration& registration : registrations) {
      const std::set<std::string> symbols = deploy::factorySymbols(registration);
      registered.insert(symbols.begin(), symbols.end());
    }
    for (const std::string& symbol : registered) {
      EXPECT_EQ(exportedFactories.count(symbol), 1u) << "registered but not exported: " << symbol;
    }
    for (const std::string& symbol : exportedFactories) {
      EXPECT_EQ(registered.count(symbol), 1u) << "exported but not registered: " << symbol;
    }
  }
}

TEST_F(RegistrationTest, ProviderLibrariesExportNothingButTheirFactories) {
  for (const std::string& library : deploy::providerLibraries()) {
    const std::string path = deploy::libraryPathFor(library);
    std::set<std::string> exported;
    ASSERT_NO_THROW(exported = deploy::definedDynamicSymbols(path)) << path;
    EXPECT_FALSE(exported.empty()) << path;
    for (const std::string& symbol : exported) {
      EXPECT_TRUE(deploy::isFactorySymbol(symbol) || deploy::isLinkerSymbol(symbol))
          << path << " exports " << symbol;
    }
  }
}

TEST_F(RegistrationTest, TheModuleExportsItsSixFactories) {
  const std::set<std::string> expected = {
      "BlueLightProfileProvider_Create_InstanceMI",
      "BlueLightCapabilitiesProvider_Create_InstanceMI",
      "BlueLightElementCapabilitiesProvider_Create_InstanceMI",
      "BlueLightElementCapabilitiesProvider_Create_AssociationMI",
      "BlueLightSystemDeviceProvider_Create_InstanceMI",
      "BlueLightSystemDeviceProvider_Create_AssociationMI"};
  std::set<std::string> factories;
  for (const std::string& symbol :
       deploy::definedDynamicSymbols(deploy::libraryPathFor("bluelightprofileprovider"))) {
    if (!deploy::isLinkerSymbol(symbol)) factories.insert(symbol);
  }
  EXPECT_EQ(factories, expected);
}

TEST_F(RegistrationTest, RegisteredClassesAreTheClassesOfTheClassMof) {
  const mof::Document& classes = deploy::classMof();
  std::set<std::string> declared;
  for (const mof::Class& c : classes.classes) declared.insert(c.name);
  for (const auto* registrations : {&sfcb_, &pegasus_}) {
    std::set<std::string> registered;
    for (const Registration& registration : *registrations) {
      registered.insert(registration.className);
    }
    // Exact spelling: the object managers look registrations up by the repository's class name.
    EXPECT_EQ(registered, declared);
  }
}

TEST_F(RegistrationTest, AssociationProvidersServeAssociationClasses) {
  for (const Registration& registration : all()) {
    const mof::Class* c = deploy::classMof().findClass(registration.className);
    ASSERT_NE(c, nullptr) << registration.className;
    EXPECT_EQ(registration.kinds.count("association") == 1, c->hasQualifier("Association"))
        << registration.file << ": " << registration.className;
  }
}

TEST_F(RegistrationTest, ProviderQualifiersNameTheRegisteredProvider) {
  for (const Registration& registration : sfcb_) {
    const mof::Class* c = deploy::classMof().findClass(registration.className);
    ASSERT_NE(c, nullptr) << registration.className;
    const mof::Qualifier* provider = c->qualifier("Provider");
    ASSERT_NE(provider, nullptr) << registration.className << " has no Provider qualifier";
    EXPECT_EQ(provider->value.scalar(), "cmpi:" + registration.provider) << registration.className;
  }
}

TEST_F(RegistrationTest, PegasusModulesUseCmpi2) {
  for (const std::string& file : deploy::pegasusFiles()) {
    const mof::Document doc = mof::parseFile(file);
    const auto modules = doc.instancesOf("PG_ProviderModule");
    ASSERT_EQ(modules.size(), 1u) << file;
    const mof::Instance& module = *modules.front();
    EXPECT_EQ(module.text("InterfaceType"), "CMPI") << file;
    EXPECT_EQ(module.text("InterfaceVersion"), "2.0.0") << file;
    EXPECT_EQ(module.text("Version"), BLUELIGHT_DEPLOY_PACKAGE_VERSION) << file;
    EXPECT_FALSE(module.text("Vendor").empty()) << file;
    // The file is named after the library it registers.
    EXPECT_EQ(fs::path(file).filename().string(), module.text("Location") + "-registration.mof");
    std::set<std::string> capabilityIds;
    for (const mof::Instance* capability : doc.instancesOf("PG_ProviderCapabilities")) {
      EXPECT_TRUE(capabilityIds.insert(capability->text("CapabilityID")).second)
          << file << ": CapabilityID " << capability->text("CapabilityID") << " is not unique";
    }
  }
}

TEST_F(RegistrationTest, SfcbFilesAreNamedAfterTheirLibrary) {
  for (const std::string& file : deploy::sfcbFiles()) {
    for (const Registration& registration :
         deploy::parseSfcbRegistration(deploy::readText(file), file)) {
      EXPECT_EQ(fs::path(file).filename().string(), registration.location + ".reg");
    }
  }
}

// Loads every registered MI the way an object manager does, through the factory the
// registration names, and checks that an instance MI answers for the class it is registered
// for.
TEST_F(RegistrationTest, EveryRegisteredMiLoadsAndServesItsClass) {
  testsupport::TempDir dir;
  testsupport::writeTree(dir.file("tree.json"),
                         {testsupport::blueLight("1.2"), testsupport::blueLight("3.1", 20u, 3u)});
  testsupport::ScopedEnv source("KESTA_INSTRUMENTATION", "file:" + dir.file("tree.json"));
  testsupport::ScopedEnv systemName("KESTA_SYSTEM_NAME", std::string("deploy.example"));
  testsupport::ScopedEnv sink("VNLOG_SINK", std::string("none"));

  cmpihost::Broker broker;
  cmpihost::InstanceValue system(cmpihost::ObjectPathValue(kNameSpace, "KESTA_ComputerSystem"));
  system.set("CreationClassName", "KESTA_ComputerSystem").set("Name", "deploy.example");
  broker.setUpcallInstances("KESTA_ComputerSystem", {system});

  for (const auto& [location, registrations] : byLocation(sfcb_)) {
    cmpihost::ProviderLibrary library(deploy::libraryPathFor(location));
    for (const Registration& registration : registrations) {
      SCOPED_TRACE(registration.summary());
      const cmpihost::ObjectPathValue classPath(kNameSpace, registration.className);
      cmpihost::InstanceMILoad instanceMI;
      {
        cmpihost::Request request(broker);
        instanceMI = cmpihost::createInstanceMI(library, registration.provider, broker, request);
      }
      ASSERT_TRUE(instanceMI.ok()) << instanceMI.error;
      const cmpihost::Outcome names =
          cmpihost::enumerateInstanceNames(broker, instanceMI.mi, classPath);
      EXPECT_EQ(names.status.rc, CMPI_RC_OK) << names.status;
      EXPECT_FALSE(names.paths().empty());
      for (const cmpihost::ObjectPathValue& path : names.paths()) {
        EXPECT_EQ(path.className(), registration.className) << path;
        EXPECT_EQ(path.nameSpace(), kNameSpace) << path;
      }
      const cmpihost::Outcome instances =
          cmpihost::enumerateInstances(broker, instanceMI.mi, classPath);
      EXPECT_EQ(instances.status.rc, CMPI_RC_OK) << instances.status;
      cmpihost::cleanup(broker, instanceMI.mi);

      if (registration.kinds.count("association") == 0) continue;
      cmpihost::AssociationMILoad associationMI;
      {
        cmpihost::Request request(broker);
        associationMI =
            cmpihost::createAssociationMI(library, registration.provider, broker, request);
      }
      ASSERT_TRUE(associationMI.ok()) << associationMI.error;
      // From each end of an association instance, References of this class leads back to it.
      const std::vector<cmpihost::InstanceValue> served = instances.instances();
      ASSERT_FALSE(served.empty());
      for (const cmpihost::Property& end : served.front().properties()) {
        if (end.value.type() != CMPI_ref || end.value.isNull()) continue;
        const cmpihost::Outcome references = cmpihost::references(
            broker, associationMI.mi, end.value.asReference(), registration.className);
        EXPECT_EQ(references.status.rc, CMPI_RC_OK) << end.name << ": " << references.status;
        EXPECT_FALSE(references.instances().empty()) << end.name;
        for (const cmpihost::InstanceValue& reference : references.instances()) {
          EXPECT_EQ(reference.className(), registration.className) << reference;
        }
      }
      cmpihost::cleanup(broker, associationMI.mi);
    }
  }
}

// ---- The provider table and what is generated from it ---------------------------------------

// The library of the module, the one the tool loads.
const char* const kModuleLibrary = "bluelightprofileprovider";

std::vector<deploy::TableRow> tableRows() {
  std::vector<deploy::TableRow> rows;
  EXPECT_NO_THROW(rows = deploy::providerTable());
  EXPECT_FALSE(rows.empty()) << "deploy/providers.txt lists no provider";
  return rows;
}

TEST(ProviderTableTest, TheRegistrationsAreTheTable) {
  std::set<std::string> table;
  for (const deploy::TableRow& row : tableRows()) table.insert(row.summary());
  for (const auto& registrations : {deploy::sfcbRegistrations(), deploy::pegasusRegistrations()}) {
    EXPECT_EQ(summaries(registrations), table);
  }
}

// The symbols name C++ constants, so each must be an identifier, and a different one.
TEST(ProviderTableTest, SymbolsAreDistinctIdentifiers) {
  const std::regex identifier("[A-Za-z_][A-Za-z0-9_]*");
  std::set<std::string> seen;
  for (const deploy::TableRow& row : tableRows()) {
    EXPECT_TRUE(std::regex_match(row.symbol, identifier))
        << "line " << row.line << ": " << row.symbol;
    EXPECT_TRUE(seen.insert(row.symbol).second) << "line " << row.line << ": " << row.symbol;
  }
}

// Every class and provider name the module defines, against the row that names it. A name the
// module has that the table lacks, or a value that differs, fails here.
TEST(ProviderTableTest, TheModulesNamesAreTheTables) {
  namespace names = Kesta::BlueLightProvider;
  const std::map<std::string, std::string> moduleClasses = {
      {"BlueLightClass", names::BlueLightClass},
      {"BlueLightCapabilitiesClass", names::BlueLightCapabilitiesClass},
      {"BlueLightElementCapabilitiesClass", names::BlueLightElementCapabilitiesClass},
      {"BlueLightSystemDeviceClass", names::BlueLightSystemDeviceClass},
      {"ComputerSystemClass", names::ComputerSystemClass}};
  const std::set<std::string> moduleProviders = {
      names::BlueLightProfileProvider, names::BlueLightCapabilitiesProvider,
      names::BlueLightElementCapabilitiesProvider, names::BlueLightSystemDeviceProvider};

  std::map<std::string, std::string> tableClasses;
  std::set<std::string> tableProviders;
  for (const deploy::TableRow& row : tableRows()) {
    tableClasses[row.symbol] = row.className;
    if (row.library == kModuleLibrary) tableProviders.insert(row.provider);
  }
  EXPECT_EQ(moduleClasses, tableClasses);
  EXPECT_EQ(moduleProviders, tableProviders);
}

// The tool asks the module's providers in the table's order, knows which have association MIs,
// and finds each class whatever its case.
TEST(ProviderTableTest, TheToolsProviderMapIsTheTables) {
  std::vector<std::string> table;
  std::vector<std::string> associationTable;
  std::string computerSystemClass;
  for (const deploy::TableRow& row : tableRows()) {
    if (row.symbol == "ComputerSystemClass") computerSystemClass = row.className;
    if (row.library != kModuleLibrary) continue;
    table.push_back(row.provider + " " + row.className);
    if (row.kinds.count("association") == 1) associationTable.push_back(row.provider);
  }

  std::vector<std::string> tool;
  for (const bluelight::cli::ProviderInfo& provider : bluelight::cli::allProviders()) {
    tool.push_back(std::string(provider.name) + " " + provider.className);
    const std::string lower = Kesta::platform::asciiLowerCopy(provider.className);
    EXPECT_EQ(bluelight::cli::canonicalClassName(lower), provider.className);
    EXPECT_EQ(bluelight::cli::instanceProviderFor(lower), &provider);
  }
  EXPECT_EQ(tool, table);

  std::vector<std::string> toolAssociations;
  for (const bluelight::cli::ProviderInfo* provider : bluelight::cli::associationProviders()) {
    toolAssociations.emplace_back(provider->name);
    EXPECT_EQ(bluelight::cli::associationProviderFor(provider->className), provider);
  }
  EXPECT_EQ(toolAssociations, associationTable);

  EXPECT_EQ(bluelight::cli::kComputerSystemClass, computerSystemClass);
  EXPECT_EQ(bluelight::cli::canonicalClassName(
                Kesta::platform::asciiLowerCopy(bluelight::cli::kComputerSystemClass)),
            computerSystemClass);
}

}  // namespace
