// The Debian package: built with cpack from this build tree, unpacked with dpkg -x into a scratch
// root and checked file by file - the libraries with their SONAME links, the MOF, the
// registrations, the catalogues, the configuration and the documents - and its control data.
// Finally the packaged libraries are loaded from the scratch root and asked for instances.
//
// A sanitized build is not packaged (its libraries need the sanitizer runtime preloaded into the
// object manager); the tests skip themselves there, and so does the packaging step.
#include <gtest/gtest.h>

#include <filesystem>
#include <map>
#include <memory>
#include <regex>
#include <set>
#include <sstream>
#include <string>
#include <vector>

#include "DeployFiles.h"
#include "TestSupport.h"
#include "cmpihost/cmpihost.h"

namespace {

namespace fs = std::filesystem;

// One unpacked package, shared by the tests of this file (building it is the slow part).
struct Unpacked {
  std::string deb;
  std::string root;
  std::string control;
  std::map<std::string, std::string> fields;
};

std::string strip(std::string text) {
  while (!text.empty() && (text.back() == '\n' || text.back() == ' ')) text.pop_back();
  return text;
}

// "Key: value" lines of a control file, continuation lines joined to their field.
std::map<std::string, std::string> controlFields(const std::string& text) {
  std::map<std::string, std::string> fields;
  std::istringstream in(text);
  std::string current;
  for (std::string line; std::getline(in, line);) {
    if (!line.empty() && line[0] == ' ' && !current.empty()) {
      fields[current] += "\n" + line.substr(1);
      continue;
    }
    const std::size_t colon = line.find(':');
    if (colon == std::string::npos) continue;
    current = line.substr(0, colon);
    fields[current] = strip(line.substr(colon + 1 + (line.size() > colon + 1 ? 1 : 0)));
  }
  return fields;
}

// The path of `entry` inside the package, e.g. "/usr/lib/x86_64-linux-gnu/cmpi/x.so".
std::string packagePath(const fs::path& root, const fs::path& entry) {
  // lexically: relative() would resolve the SONAME links to the files they point at.
  return "/" + entry.lexically_relative(root).string();
}

class DebianPackage : public ::testing::Test {
 protected:
  // The package is built and unpacked by the CTest fixture deploy.package.build
  // (BuildPackage.cmake); these tests only read what it left.
  static void SetUpTestSuite() {
    if (!std::string(BLUELIGHT_DEPLOY_SANITIZERS).empty()) {
      skip_ = "a build with sanitizers (" BLUELIGHT_DEPLOY_SANITIZERS ") is not packaged";
      return;
    }
    if (deploy::runCommand("command -v dpkg-deb").empty()) {
      skip_ = "dpkg-deb is not installed: not a Debian system";
      return;
    }
    const std::string out = BLUELIGHT_DEPLOY_PACKAGE_TEST_DIR;
    if (!fs::exists(out + "/package.txt")) {
      failure_ = "no package in " + out + ": run the CTest test deploy.package.build first";
      return;
    }
    unpacked_ = std::make_unique<Unpacked>();
    unpacked_->deb = deploy::readText(out + "/package.txt");
    unpacked_->root = out + "/root";
    unpacked_->control = out + "/control";
    unpacked_->fields = controlFields(deploy::readText(unpacked_->control + "/control"));
  }

  static void TearDownTestSuite() { unpacked_.reset(); }

  void SetUp() override {
    if (!skip_.empty()) GTEST_SKIP() << skip_;
    ASSERT_TRUE(failure_.empty()) << failure_;
  }

  static const Unpacked& package() { return *unpacked_; }
  static std::string inRoot(const std::string& path) { return package().root + path; }

  static std::string providerDir() { return BLUELIGHT_DEPLOY_FULL_PROVIDER_DIR; }
  static std::string dataDir() { return BLUELIGHT_DEPLOY_FULL_DATA_DIR; }

  static inline std::string skip_;
  static inline std::string failure_;
  static inline std::unique_ptr<Unpacked> unpacked_;
};

// Every file the package must hold, as absolute paths on the target system.
std::set<std::string> expectedFiles() {
  std::set<std::string> files;
  for (const std::string& library : deploy::providerLibraries()) {
    files.insert(std::string(BLUELIGHT_DEPLOY_FULL_PROVIDER_DIR) + "/lib" + library + ".so");
    files.insert(std::string(BLUELIGHT_DEPLOY_FULL_PROVIDER_DIR) + "/lib" + library + ".so.1");
  }
  const std::string data = BLUELIGHT_DEPLOY_FULL_DATA_DIR;
  files.insert(data + "/mof/" + fs::path(BLUELIGHT_DEPLOY_CLASS_MOF).filename().string());
  for (const std::string& file : deploy::sfcbFiles()) {
    files.insert(data + "/sfcb/" + fs::path(file).filename().string());
  }
  for (const std::string& file : deploy::pegasusFiles()) {
    files.insert(data + "/pegasus/" + fs::path(file).filename().string());
  }
  if (fs::exists(std::string(BLUELIGHT_DEPLOY_PROJECT_SOURCE_DIR) + "/examples/sample-tree.json")) {
    files.insert(data + "/examples/sample-tree.json");
  }
  files.insert(std::string(BLUELIGHT_DEPLOY_FULL_CONFIG_DIR) + "/instrumentation.conf");
#ifdef BLUELIGHT_DEPLOY_IPMI_LAN_PLUGIN
  // The network transport of the IPMI source, in builds that have it.
  files.insert(BLUELIGHT_DEPLOY_IPMI_LAN_PLUGIN);
#endif
#ifdef BLUELIGHT_DEPLOY_REDFISH_PLUGIN
  // The HTTPS transport of the Redfish source, in builds that have it.
  files.insert(BLUELIGHT_DEPLOY_REDFISH_PLUGIN);
#endif
  for (const std::string& doc : deploy::splitList(BLUELIGHT_DEPLOY_INSTALLED_DOCS)) {
    files.insert(std::string(BLUELIGHT_DEPLOY_FULL_DOC_DIR) + "/" + doc);
  }
  // One caption catalogue per language the platform has a translation for.
  for (const auto& entry : fs::directory_iterator(std::string(BLUELIGHT_DEPLOY_PROJECT_SOURCE_DIR) +
                                                  "/platform/locale/po")) {
    if (entry.path().extension() != ".po") continue;
    files.insert(std::string(BLUELIGHT_DEPLOY_FULL_LOCALEDIR) + "/" + entry.path().stem().string() +
                 "/LC_MESSAGES/bluelightprofileprovider.mo");
  }
#ifdef BLUELIGHT_DEPLOY_HAS_CLI
  files.insert(std::string(BLUELIGHT_DEPLOY_FULL_BINDIR) + "/bluelight-cli");
#endif
  return files;
}

TEST_F(DebianPackage, ControlDataNamesThePackage) {
  const auto& fields = package().fields;
  EXPECT_EQ(fields.at("Package"), BLUELIGHT_DEPLOY_PACKAGE_NAME);
  EXPECT_EQ(fields.at("Version"), std::string(BLUELIGHT_DEPLOY_PACKAGE_VERSION) + "-1");
  EXPECT_EQ(fields.at("Architecture"), strip(deploy::runCommand("dpkg --print-architecture")));
  EXPECT_EQ(fields.at("Section"), "admin");
  EXPECT_EQ(fields.at("Priority"), "optional");
  EXPECT_NE(fields.at("Maintainer").find('@'), std::string::npos) << fields.at("Maintainer");
  EXPECT_EQ(fields.at("Description").rfind("CMPI providers", 0), 0u) << fields.at("Description");
  EXPECT_NE(fields.count("Installed-Size"), 0u);
  // The file name follows Debian's convention.
  EXPECT_EQ(fs::path(package().deb).filename().string(),
            std::string(BLUELIGHT_DEPLOY_PACKAGE_NAME) + "_" + fields.at("Version") + "_" +
                fields.at("Architecture") + ".deb");
}

TEST_F(DebianPackage, DependsOnTheCAndCxxRuntimes) {
  ASSERT_NE(package().fields.count("Depends"), 0u);
  const std::string& depends = package().fields.at("Depends");
  EXPECT_TRUE(std::regex_search(depends, std::regex(R"((^|, )libc6( |,|$))"))) << depends;
  EXPECT_TRUE(std::regex_search(depends, std::regex(R"((^|, )libstdc\+\+6( |,|$))"))) << depends;
}

// The JSON snapshot reader links Debian's simdjson, whose package is named after its SONAME.
TEST_F(DebianPackage, DependsOnSimdjson) {
  ASSERT_NE(package().fields.count("Depends"), 0u);
  const std::string& depends = package().fields.at("Depends");
  EXPECT_TRUE(std::regex_search(depends, std::regex(R"((^|, )libsimdjson[0-9]+( |,|$))")))
      << depends;
}

TEST_F(DebianPackage, TheConfigurationIsAConffile) {
  EXPECT_EQ(deploy::readText(package().control + "/conffiles"),
            std::string(BLUELIGHT_DEPLOY_FULL_CONFIG_DIR) + "/instrumentation.conf\n");
}

TEST_F(DebianPackage, HoldsExactlyTheInstalledFiles) {
  std::set<std::string> found;
  for (const auto& entry : fs::recursive_directory_iterator(package().root)) {
    if (!entry.is_directory() || entry.is_symlink()) {
      found.insert(packagePath(package().root, entry.path()));
    }
  }
  const std::set<std::string> expected = expectedFiles();
  for (const std::string& file : expected) {
    EXPECT_EQ(found.count(file), 1u) << "missing: " << file;
  }
  for (const std::string& file : found) {
    EXPECT_EQ(expected.count(file), 1u) << "not expected: " << file;
  }
}

TEST_F(DebianPackage, LibrariesHaveTheirSonameAndTheLinkTheObjectManagersOpen) {
  for (const std::string& library : deploy::providerLibraries()) {
    const std::string soname = "lib" + library + ".so.1";
    const fs::path file = inRoot(providerDir() + "/" + soname);
    const fs::path link = inRoot(providerDir() + "/lib" + library + ".so");
    ASSERT_TRUE(fs::is_regular_file(fs::symlink_status(file))) << file;
    ASSERT_TRUE(fs::is_symlink(link)) << link;
    // Relative, so it holds wherever the package is unpacked.
    EXPECT_EQ(fs::read_symlink(link).string(), soname);
    const std::string dynamic = deploy::runCommand(std::string(BLUELIGHT_DEPLOY_READELF) + " -d " +
                                                   deploy::shellQuote(file.string()));
    EXPECT_NE(dynamic.find("Library soname: [" + soname + "]"), std::string::npos) << dynamic;
    // Provider libraries are plain files for the object manager; they must not need a run path.
    EXPECT_EQ(dynamic.find("RPATH"), std::string::npos) << dynamic;
    EXPECT_EQ(dynamic.find("RUNPATH"), std::string::npos) << dynamic;
  }
}

TEST_F(DebianPackage, LibrariesAreStrippedButExportTheSameFactories) {
  for (const std::string& library : deploy::providerLibraries()) {
    const std::string packaged = inRoot(providerDir() + "/lib" + library + ".so.1");
    EXPECT_EQ(deploy::definedDynamicSymbols(packaged),
              deploy::definedDynamicSymbols(deploy::libraryPathFor(library)))
        << library;
    const std::string sections = deploy::runCommand(std::string(BLUELIGHT_DEPLOY_READELF) + " -S " +
                                                    deploy::shellQuote(packaged));
    EXPECT_EQ(sections.find(".debug_info"), std::string::npos) << library;
  }
}

TEST_F(DebianPackage, MofAndRegistrationsAreTheBuildsOwn) {
  EXPECT_EQ(deploy::readText(inRoot(dataDir() + "/mof/" +
                                    fs::path(BLUELIGHT_DEPLOY_CLASS_MOF).filename().string())),
            deploy::readText(BLUELIGHT_DEPLOY_CLASS_MOF));
  for (const std::string& file : deploy::sfcbFiles()) {
    EXPECT_EQ(deploy::readText(inRoot(dataDir() + "/sfcb/" + fs::path(file).filename().string())),
              deploy::readText(file));
  }
  for (const std::string& file : deploy::pegasusFiles()) {
    EXPECT_EQ(
        deploy::readText(inRoot(dataDir() + "/pegasus/" + fs::path(file).filename().string())),
        deploy::readText(file));
  }
  EXPECT_EQ(deploy::readText(
                inRoot(std::string(BLUELIGHT_DEPLOY_FULL_CONFIG_DIR) + "/instrumentation.conf")),
            deploy::readText(BLUELIGHT_DEPLOY_CONFIG_EXAMPLE));
}

// The packaged libraries, opened under the name the registrations give, serve their classes.
TEST_F(DebianPackage, PackagedProvidersServeTheirClasses) {
  testsupport::TempDir dir;
  testsupport::writeTree(dir.file("tree.json"),
                         {testsupport::blueLight("1.2"), testsupport::blueLight("3.1")});
  testsupport::ScopedEnv source("KESTA_INSTRUMENTATION", "file:" + dir.file("tree.json"));
  testsupport::ScopedEnv systemName("KESTA_SYSTEM_NAME", std::string("package.example"));
  testsupport::ScopedEnv sink("VNLOG_SINK", std::string("none"));

  cmpihost::Broker broker;
  std::map<std::string, std::size_t> counts;
  for (const deploy::Registration& registration : deploy::sfcbRegistrations()) {
    cmpihost::ProviderLibrary library(
        inRoot(providerDir() + "/lib" + registration.location + ".so"));
    cmpihost::InstanceMILoad load;
    {
      cmpihost::Request request(broker);
      load = cmpihost::createInstanceMI(library, registration.provider, broker, request);
    }
    ASSERT_TRUE(load.ok()) << registration.summary() << ": " << load.error;
    const cmpihost::Outcome outcome = cmpihost::enumerateInstances(
        broker, load.mi, cmpihost::ObjectPathValue("root/cimv2", registration.className));
    EXPECT_EQ(outcome.status.rc, CMPI_RC_OK) << registration.className;
    counts[registration.className] = outcome.instances().size();
    cmpihost::cleanup(broker, load.mi);
  }
  EXPECT_EQ(counts["KESTA_BlueLight"], 2u);
  EXPECT_EQ(counts["KESTA_ComputerSystem"], 1u);
}

}  // namespace
