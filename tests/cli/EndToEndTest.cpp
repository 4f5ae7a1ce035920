// The built tool run as a user runs it: a subprocess on fixture trees, its standard output
// compared exactly, its standard error and exit code checked.
#include <gtest/gtest.h>

#include <map>
#include <nlohmann/json.hpp>
#include <string>
#include <vector>

#include "TestSupport.h"
#include "ToolProcess.h"

namespace {

using clitest::ProcessResult;
using Json = nlohmann::ordered_json;

const std::string kTool = BLUELIGHT_CLI_TOOL;
const std::string kLibrary = BLUELIGHT_CLI_PROVIDER_LIBRARY;
const std::string kTwoLights = std::string(BLUELIGHT_CLI_FIXTURES) + "/two-lights.json";
const std::string kSampleTree = BLUELIGHT_CLI_SAMPLE_TREE;

// ---- What the providers answer for the two-light tree, on system "testhost" -----------------

const std::string kLightKeys1 =
    R"(KESTA_BlueLight.CreationClassName="KESTA_BlueLight",DeviceID="Blue Light:1.2",)"
    R"(SystemCreationClassName="KESTA_ComputerSystem",SystemName="testhost")";
const std::string kLightKeys2 =
    R"(KESTA_BlueLight.CreationClassName="KESTA_BlueLight",DeviceID="Rear Blue Light:3.1",)"
    R"(SystemCreationClassName="KESTA_ComputerSystem",SystemName="testhost")";
const std::string kLightPath1 = "//testhost/root/cimv2:" + kLightKeys1;
const std::string kLightPath2 = "//testhost/root/cimv2:" + kLightKeys2;
const std::string kCapabilitiesKeys =
    R"(KESTA_BlueLightCapabilities.InstanceID="KESTA:BlueLightCapabilities1")";
const std::string kCapabilitiesPath = "//testhost/root/cimv2:" + kCapabilitiesKeys;
const std::string kSystemKeys =
    R"(KESTA_ComputerSystem.CreationClassName="KESTA_ComputerSystem",Name="testhost")";
const std::string kSystemPath = "root/cimv2:" + kSystemKeys;

const std::string kLightMof1 = "// " + kLightPath1 + R"(
instance of KESTA_BlueLight
{
    CreationClassName = "KESTA_BlueLight";
    DeviceID = "Blue Light:1.2";
    SystemCreationClassName = "KESTA_ComputerSystem";
    SystemName = "testhost";
    Caption = "Blue Light";
    Description = "Blue Light";
    Name = "Blue Light";
    ElementName = "Blue Light";
    RequestedState = 2;
    HealthState = 5;
    OperationalStatus = {2, 11};
    AudibleAlarm = FALSE;
    VisibleAlarm = TRUE;
    MotionAlarm = FALSE;
    AlarmState = 2;
};
)";

const std::string kLightMof2 = "// " + kLightPath2 + R"(
instance of KESTA_BlueLight
{
    CreationClassName = "KESTA_BlueLight";
    DeviceID = "Rear Blue Light:3.1";
    SystemCreationClassName = "KESTA_ComputerSystem";
    SystemName = "testhost";
    Caption = "Blue Light";
    Description = "Rear Blue Light";
    Name = "Rear Blue Light";
    ElementName = "Rear Blue Light";
    RequestedState = 2;
    HealthState = 10;
    OperationalStatus = {3, 5};
    AudibleAlarm = FALSE;
    VisibleAlarm = TRUE;
    MotionAlarm = FALSE;
    AlarmState = 3;
};
)";

const std::string kOk = "status: CMPI_RC_OK\n";

class CliEndToEnd : public ::testing::Test {
 protected:
  // Runs the tool on `tree` with the library given explicitly.
  ProcessResult run(std::vector<std::string> arguments, const std::string& tree = kTwoLights) {
    arguments.insert(arguments.begin(), {"--library", kLibrary});
    return runBare(arguments, tree);
  }

  // Runs the tool with nothing added to the arguments.
  ProcessResult runBare(const std::vector<std::string>& arguments,
                        const std::string& tree = kTwoLights) {
    return clitest::runProcess(kTool, arguments,
                               {{"KESTA_INSTRUMENTATION", "file:" + tree},
                                {"KESTA_SYSTEM_NAME", "testhost"},
                                {"KESTA_LANGUAGE", "en"},
                                {"VNLOG_SINK", "none"}});
  }
};

bool contains(const std::string& text, const std::string& part) {
  return text.find(part) != std::string::npos;
}

// ---- Instance operations ----------------------------------------------------------------------

TEST_F(CliEndToEnd, EnumerateInstanceNamesOfTwoLights) {
  const ProcessResult result = run({"ein", "KESTA_BlueLight"});
  EXPECT_EQ(result.exitCode, 0);
  EXPECT_EQ(result.out, kLightPath1 + "\n" + kLightPath2 + "\n");
  EXPECT_EQ(result.err, kOk);
}

TEST_F(CliEndToEnd, EnumerateInstancesOfTwoLights) {
  const ProcessResult result = run({"ei", "KESTA_BlueLight"});
  EXPECT_EQ(result.exitCode, 0);
  EXPECT_EQ(result.out, kLightMof1 + "\n" + kLightMof2);
  EXPECT_EQ(result.err, kOk);
}

TEST_F(CliEndToEnd, LongNamesNamespaceAndClassCase) {
  const ProcessResult result =
      run({"enumerate-instance-names", "--namespace", "root/kesta", "kesta_bluelight"});
  EXPECT_EQ(result.exitCode, 0);
  EXPECT_EQ(result.out, "//testhost/root/kesta:" + kLightKeys1 +
                            "\n//testhost/root/kesta:" + kLightKeys2 + "\n");
}

TEST_F(CliEndToEnd, GetInstanceOfOneLight) {
  const ProcessResult result = run({"gi", "root/cimv2:" + kLightKeys1});
  EXPECT_EQ(result.exitCode, 0);
  EXPECT_EQ(result.out, kLightMof1);
  EXPECT_EQ(result.err, kOk);
}

TEST_F(CliEndToEnd, GetInstanceOfAPrintedPath) {
  const ProcessResult result = run({"get-instance", kLightPath2});
  EXPECT_EQ(result.exitCode, 0);
  EXPECT_EQ(result.out, kLightMof2);
}

TEST_F(CliEndToEnd, GetInstanceOfAnUnknownDeviceID) {
  const ProcessResult result =
      run({"gi", R"(KESTA_BlueLight.CreationClassName="KESTA_BlueLight",DeviceID="Blue Light:9.9",)"
                 R"(SystemCreationClassName="KESTA_ComputerSystem",SystemName="testhost")"});
  EXPECT_EQ(result.exitCode, 0);
  EXPECT_EQ(result.out, "");
  EXPECT_EQ(result.err,
            "status: CMPI_RC_OK\n"
            "note: the provider returned neither an instance nor an error for this path; an "
            "object manager would answer its client with CIM_ERR_NOT_FOUND\n");
}

TEST_F(CliEndToEnd, GetInstanceWithPropertyLists) {
  const std::string keys = "// " + kLightPath1 + R"(
instance of KESTA_BlueLight
{
    CreationClassName = "KESTA_BlueLight";
    DeviceID = "Blue Light:1.2";
    SystemCreationClassName = "KESTA_ComputerSystem";
    SystemName = "testhost";
)";
  const ProcessResult one = run({"gi", kLightKeys1, "--properties", "AlarmState"});
  EXPECT_EQ(one.exitCode, 0);
  EXPECT_EQ(one.out, keys + "    AlarmState = 2;\n};\n");
  const ProcessResult none = run({"gi", kLightKeys1, "--properties", ""});
  EXPECT_EQ(none.exitCode, 0);
  EXPECT_EQ(none.out, keys + "};\n");
}

TEST_F(CliEndToEnd, GetInstanceWithoutKeysShowsTheProvidersError) {
  const ProcessResult result = run({"gi", "KESTA_BlueLight"});
  EXPECT_EQ(result.exitCode, 1);
  EXPECT_EQ(result.out, "");
  EXPECT_EQ(result.err, "status: CMPI_RC_ERR_FAILED: At least one key should be passed\n");
}

TEST_F(CliEndToEnd, EnumerateTheCapabilitiesRecord) {
  const ProcessResult result = run({"ei", "KESTA_BlueLightCapabilities"});
  EXPECT_EQ(result.exitCode, 0);
  EXPECT_EQ(result.out, "// " + kCapabilitiesPath + R"(
instance of KESTA_BlueLightCapabilities
{
    InstanceID = "KESTA:BlueLightCapabilities1";
    RequestedAlarmStatesSupported = {1, 2, 3};
};
)");
  EXPECT_EQ(result.err, kOk);
}

TEST_F(CliEndToEnd, NoProviderServesTheComputerSystem) {
  const ProcessResult result = run({"gi", kSystemKeys});
  EXPECT_EQ(result.exitCode, 1);
  EXPECT_EQ(result.out, "");
  EXPECT_EQ(result.err, "bluelight-cli: error: no provider serves class KESTA_ComputerSystem\n");
}

// ---- Association operations -------------------------------------------------------------------

TEST_F(CliEndToEnd, AssociatorNamesOfALightFromEveryAssociationProvider) {
  const ProcessResult result = run({"ain", kLightKeys1});
  EXPECT_EQ(result.exitCode, 0);
  EXPECT_EQ(result.out, kCapabilitiesPath + "\n" + kSystemPath + "\n");
  EXPECT_EQ(result.err, kOk);
}

TEST_F(CliEndToEnd, AssociatorNamesOfALightThroughOneAssociation) {
  const ProcessResult capabilities =
      run({"ain", "--assoc-class", "KESTA_BlueLightElementCapabilities", kLightKeys1});
  EXPECT_EQ(capabilities.exitCode, 0);
  EXPECT_EQ(capabilities.out, kCapabilitiesPath + "\n");
  EXPECT_EQ(capabilities.err, kOk);

  const ProcessResult system =
      run({"ain", "--assoc-class", "KESTA_BlueLightSystemDevice", kLightKeys1});
  EXPECT_EQ(system.exitCode, 0);
  EXPECT_EQ(system.out, kSystemPath + "\n");
}

TEST_F(CliEndToEnd, ReferenceNamesOfTheCapabilitiesWithoutAssociationClassFail) {
  const ProcessResult result = run({"rin", kCapabilitiesKeys});
  EXPECT_EQ(result.exitCode, 1);
  EXPECT_EQ(result.out, "");
  EXPECT_EQ(result.err,
            "status: CMPI_RC_ERR_FAILED: Object Path is NULL in ReferenceNames.\n"
            "note: 2 results handed over by the providers are not shown: a client of an object "
            "manager only gets the error; name one association class with --assoc-class to ask "
            "only its provider\n");
}

TEST_F(CliEndToEnd, ReferenceNamesOfTheCapabilitiesThroughTheirAssociation) {
  const ProcessResult result =
      run({"rin", "--assoc-class", "KESTA_BlueLightElementCapabilities", kCapabilitiesKeys});
  EXPECT_EQ(result.exitCode, 0);
  const std::string capabilities = R"(Capabilities="root/cimv2:KESTA_BlueLightCapabilities.)"
                                   R"(InstanceID=\"KESTA:BlueLightCapabilities1\"")";
  auto managedElement = [](const std::string& keys) {
    std::string escaped;
    for (const char c : "//testhost/root/cimv2:" + keys) {
      if (c == '"') escaped += '\\';
      escaped += c;
    }
    return "ManagedElement=\"" + escaped + "\"";
  };
  EXPECT_EQ(result.out, "//testhost/root/cimv2:KESTA_BlueLightElementCapabilities." +
                            managedElement(kLightKeys1) + "," + capabilities + "\n" +
                            "//testhost/root/cimv2:KESTA_BlueLightElementCapabilities." +
                            managedElement(kLightKeys2) + "," + capabilities + "\n");
  EXPECT_EQ(result.err, kOk);
}

TEST_F(CliEndToEnd, ReferencesOfALightFromEveryAssociationProvider) {
  const ProcessResult result = run({"ri", kLightKeys1});
  EXPECT_EQ(result.exitCode, 0);
  const std::string light =
      R"("root/cimv2:KESTA_BlueLight.CreationClassName=\"KESTA_BlueLight\",)"
      R"(DeviceID=\"Blue Light:1.2\",SystemCreationClassName=\"KESTA_ComputerSystem\",)"
      R"(SystemName=\"testhost\"")";
  const std::string capabilities = R"("//testhost/root/cimv2:KESTA_BlueLightCapabilities.)"
                                   R"(InstanceID=\"KESTA:BlueLightCapabilities1\"")";
  const std::string system =
      R"("root/cimv2:KESTA_ComputerSystem.CreationClassName=\"KESTA_ComputerSystem\",)"
      R"(Name=\"testhost\"")";
  EXPECT_EQ(result.out,
            "// //testhost/root/cimv2:KESTA_BlueLightElementCapabilities.ManagedElement=" + light +
                ",Capabilities=" + capabilities +
                "\ninstance of KESTA_BlueLightElementCapabilities\n{\n"
                "    ManagedElement = " +
                light +
                ";\n"
                "    Capabilities = " +
                capabilities +
                ";\n};\n\n"
                "// //testhost/root/cimv2:KESTA_BlueLightSystemDevice.GroupComponent=" +
                system + ",PartComponent=" + light +
                "\ninstance of KESTA_BlueLightSystemDevice\n{\n"
                "    GroupComponent = " +
                system +
                ";\n"
                "    PartComponent = " +
                light + ";\n};\n");
  EXPECT_EQ(result.err, kOk);
}

TEST_F(CliEndToEnd, AssociatorsOfTheComputerSystemAreItsLights) {
  const ProcessResult result =
      run({"ai", "--assoc-class", "KESTA_BlueLightSystemDevice", kSystemKeys});
  EXPECT_EQ(result.exitCode, 0);
  EXPECT_EQ(result.out, kLightMof1 + "\n" + kLightMof2);
  EXPECT_EQ(result.err, kOk);
}

TEST_F(CliEndToEnd, AssociatorsOfTheComputerSystemWithoutAssociationClassGiveItsLights) {
  // Both association providers are asked; the capabilities association does not start at a
  // computer system and adds nothing, without failing the request.
  const ProcessResult result = run({"ai", kSystemKeys});
  EXPECT_EQ(result.exitCode, 0) << result.err;
  EXPECT_EQ(result.out, kLightMof1 + "\n" + kLightMof2);
  EXPECT_EQ(result.err, "status: CMPI_RC_OK\n");
}

TEST_F(CliEndToEnd, AssociatorNamesOfTheComputerSystemWithoutAssociationClassGiveItsLights) {
  const ProcessResult result = run({"ain", kSystemKeys});
  EXPECT_EQ(result.exitCode, 0) << result.err;
  EXPECT_EQ(result.out, kLightPath1 + "\n" + kLightPath2 + "\n");
  EXPECT_EQ(result.err, "status: CMPI_RC_OK\n");
}

TEST_F(CliEndToEnd, AssociationClassThatNoProviderServes) {
  const ProcessResult result = run({"ai", "--assoc-class", "CIM_SystemDevice", kLightKeys1});
  EXPECT_EQ(result.exitCode, 1);
  EXPECT_EQ(result.err,
            "bluelight-cli: error: no provider serves association class CIM_SystemDevice\n");
}

// ---- The computer systems the up-calls return -------------------------------------------------

TEST_F(CliEndToEnd, UpcallFailureByName) {
  const ProcessResult result = run({"ain", "--assoc-class", "KESTA_BlueLightSystemDevice",
                                    "--upcall-failure", "CMPI_RC_ERR_ACCESS_DENIED", kLightKeys1});
  EXPECT_EQ(result.exitCode, 1);
  EXPECT_EQ(result.out, "");
  EXPECT_EQ(result.err,
            "status: CMPI_RC_ERR_ACCESS_DENIED: KESTA_ComputerSystem enumeration failed on "
            "purpose (--upcall-failure)\n");
}

TEST_F(CliEndToEnd, UpcallFailureByNumberInTheMergedAnswer) {
  const ProcessResult result = run({"ain", "--upcall-failure", "6", kLightKeys1});
  EXPECT_EQ(result.exitCode, 1);
  EXPECT_EQ(result.out, "");
  EXPECT_EQ(result.err,
            "status: CMPI_RC_ERR_NOT_FOUND: KESTA_ComputerSystem enumeration failed on purpose "
            "(--upcall-failure)\n"
            "note: 1 result handed over by the providers is not shown: a client of an object "
            "manager only gets the error; name one association class with --assoc-class to ask "
            "only its provider\n");
}

TEST_F(CliEndToEnd, ChosenComputerSystems) {
  const ProcessResult two =
      run({"ain", "--assoc-class", "KESTA_BlueLightSystemDevice", "--computer-system", "alpha",
           "--computer-system", "beta.example", kLightKeys1});
  EXPECT_EQ(two.exitCode, 0);
  EXPECT_EQ(two.out,
            "root/cimv2:KESTA_ComputerSystem.CreationClassName=\"KESTA_ComputerSystem\","
            "Name=\"alpha\"\n"
            "root/cimv2:KESTA_ComputerSystem.CreationClassName=\"KESTA_ComputerSystem\","
            "Name=\"beta.example\"\n");

  const ProcessResult none = run(
      {"ain", "--assoc-class", "KESTA_BlueLightSystemDevice", "--no-computer-system", kLightKeys1});
  EXPECT_EQ(none.exitCode, 0);
  EXPECT_EQ(none.out, "");
  EXPECT_EQ(none.err, kOk);
}

// ---- Errors before and while loading ----------------------------------------------------------

TEST_F(CliEndToEnd, MalformedPathExitsWithTwoAndLoadsNothing) {
  const ProcessResult result =
      runBare({"gi", "--library", "/nonexistent/lib.so", "KESTA_BlueLight.DeviceID=\"1.2"});
  EXPECT_EQ(result.exitCode, 2);
  EXPECT_EQ(result.out, "");
  EXPECT_EQ(result.err,
            "bluelight-cli: error: malformed object path \"KESTA_BlueLight.DeviceID=\\\"1.2\": the "
            "quoted value of key DeviceID has no closing quote (character 26)\n"
            "Try 'bluelight-cli --help' for more information.\n");
}

TEST_F(CliEndToEnd, MissingLibraryExitsWithThree) {
  const ProcessResult result = runBare(
      {"ei", "--library", "/nonexistent/libbluelightprofileprovider.so.1", "KESTA_BlueLight"});
  EXPECT_EQ(result.exitCode, 3);
  EXPECT_EQ(result.out, "");
  EXPECT_EQ(result.err,
            "bluelight-cli: error: the provider library "
            "/nonexistent/libbluelightprofileprovider.so.1 does not exist\n");
}

TEST_F(CliEndToEnd, FileThatIsNoLibraryExitsWithThree) {
  const ProcessResult result = runBare({"ei", "--library", kTwoLights, "KESTA_BlueLight"});
  EXPECT_EQ(result.exitCode, 3);
  EXPECT_EQ(result.out, "");
  EXPECT_TRUE(result.err.rfind("bluelight-cli: error: ", 0) == 0) << result.err;
  EXPECT_TRUE(contains(result.err, kTwoLights)) << result.err;
}

TEST_F(CliEndToEnd, LibraryWithoutTheProviderExitsWithThree) {
  const std::string library = BLUELIGHT_CLI_NOT_A_PROVIDER;
  const ProcessResult result = runBare({"ei", "--library", library, "KESTA_BlueLight"});
  EXPECT_EQ(result.exitCode, 3);
  EXPECT_EQ(result.out, "");
  EXPECT_TRUE(result.err.rfind("bluelight-cli: error: cannot create the instance MI of "
                               "BlueLightProfileProvider from " +
                                   library + ": ",
                               0) == 0)
      << result.err;
}

TEST_F(CliEndToEnd, DefaultLibraryIsTheOneNextToTheTool) {
  const ProcessResult result = runBare({"ein", "KESTA_BlueLight", "--verbose"});
  EXPECT_EQ(result.exitCode, 0);
  EXPECT_EQ(result.out, kLightPath1 + "\n" + kLightPath2 + "\n");
  EXPECT_TRUE(contains(result.err, "library: ")) << result.err;
  EXPECT_TRUE(contains(result.err, "/lib/libbluelightprofileprovider.so.1\n")) << result.err;
}

// ---- --json and --verbose ---------------------------------------------------------------------

TEST_F(CliEndToEnd, JsonInstancesParseBack) {
  const ProcessResult result = run({"ei", "--json", "KESTA_BlueLight"});
  ASSERT_EQ(result.exitCode, 0);
  EXPECT_EQ(result.err, kOk);
  const Json document = Json::parse(result.out);

  std::vector<std::string> members;
  for (const auto& member : document.items()) members.push_back(member.key());
  EXPECT_EQ(members, (std::vector<std::string>{"operation", "target", "status", "providers",
                                               "instances", "paths", "notes"}));
  EXPECT_EQ(document["operation"], "EnumerateInstances");
  EXPECT_EQ(document["target"], "root/cimv2:KESTA_BlueLight");
  EXPECT_EQ(document["status"], Json::parse(R"({"code":0,"name":"CMPI_RC_OK","message":null})"));
  ASSERT_EQ(document["providers"].size(), 1u);
  EXPECT_EQ(document["providers"][0]["provider"], "BlueLightProfileProvider");
  EXPECT_EQ(document["providers"][0]["mi"], "instance");
  EXPECT_EQ(document["providers"][0]["results"], 2);
  EXPECT_EQ(document["providers"][0]["doneCalls"], 1);
  EXPECT_TRUE(document["paths"].empty());
  EXPECT_TRUE(document["notes"].empty());

  ASSERT_EQ(document["instances"].size(), 2u);
  const Json& light = document["instances"][1];
  EXPECT_EQ(light["path"], kLightPath2);
  EXPECT_EQ(light["class"], "KESTA_BlueLight");
  std::vector<std::string> names;
  for (const auto& property : light["properties"].items()) names.push_back(property.key());
  EXPECT_EQ(names,
            (std::vector<std::string>{
                "CreationClassName", "DeviceID", "SystemCreationClassName", "SystemName", "Caption",
                "Description", "Name", "ElementName", "RequestedState", "HealthState",
                "OperationalStatus", "AudibleAlarm", "VisibleAlarm", "MotionAlarm", "AlarmState"}));
  const Json& properties = light["properties"];
  EXPECT_EQ(properties["DeviceID"], "Rear Blue Light:3.1");
  EXPECT_TRUE(properties["HealthState"].is_number_unsigned());
  EXPECT_EQ(properties["HealthState"], 10);
  EXPECT_EQ(properties["OperationalStatus"], Json::parse("[3, 5]"));
  EXPECT_TRUE(properties["AudibleAlarm"].is_boolean());
  EXPECT_EQ(properties["VisibleAlarm"], true);
  EXPECT_EQ(light["types"]["OperationalStatus"], "uint16[]");
  EXPECT_EQ(light["types"]["AudibleAlarm"], "boolean");
  EXPECT_EQ(light["types"]["DeviceID"], "string");
}

TEST_F(CliEndToEnd, JsonReferencesAreTheirPathText) {
  const ProcessResult result =
      run({"ri", "--json", "--assoc-class", "KESTA_BlueLightSystemDevice", kLightKeys2});
  ASSERT_EQ(result.exitCode, 0);
  const Json document = Json::parse(result.out);
  ASSERT_EQ(document["instances"].size(), 1u);
  const Json& association = document["instances"][0];
  EXPECT_EQ(association["properties"]["GroupComponent"], kSystemPath);
  EXPECT_EQ(association["properties"]["PartComponent"], "root/cimv2:" + kLightKeys2);
  EXPECT_EQ(association["types"]["PartComponent"], "reference");
}

TEST_F(CliEndToEnd, JsonNamesAndErrors) {
  const ProcessResult names = run({"ain", "--json", kLightKeys1});
  ASSERT_EQ(names.exitCode, 0);
  const Json merged = Json::parse(names.out);
  EXPECT_EQ(merged["operation"], "AssociatorNames");
  EXPECT_EQ(merged["paths"], Json({kCapabilitiesPath, kSystemPath}));
  ASSERT_EQ(merged["providers"].size(), 2u);
  EXPECT_EQ(merged["providers"][1]["provider"], "BlueLightSystemDeviceProvider");
  EXPECT_EQ(merged["providers"][1]["mi"], "association");
  EXPECT_EQ(merged["providers"][1]["doneCalls"], 0);

  const ProcessResult failed = run({"rin", "--json", kCapabilitiesKeys});
  ASSERT_EQ(failed.exitCode, 1);
  const Json error = Json::parse(failed.out);
  EXPECT_EQ(error["status"]["code"], 1);
  EXPECT_EQ(error["status"]["name"], "CMPI_RC_ERR_FAILED");
  EXPECT_EQ(error["status"]["message"], "Object Path is NULL in ReferenceNames.");
  EXPECT_TRUE(error["paths"].empty());
  EXPECT_EQ(error["providers"][0]["status"]["code"], 0);
  EXPECT_EQ(error["providers"][0]["results"], 2);
  EXPECT_EQ(error["notes"].size(), 1u);
}

TEST_F(CliEndToEnd, VerboseShowsCallsTracesAndHowResultsEnded) {
  const ProcessResult result = run({"ain", "--verbose", kLightKeys1});
  EXPECT_EQ(result.exitCode, 0);
  EXPECT_EQ(result.out, kCapabilitiesPath + "\n" + kSystemPath + "\n");
  for (const char* line :
       {"up-calls: KESTA_ComputerSystem enumerations return Name=\"testhost\"\n",
        "call: BlueLightElementCapabilitiesProvider.associatorNames(root/cimv2:KESTA_BlueLight.",
        "trace: [INFO] BlueLightElementCapabilitiesProvider: Target Class is "
        "BlueLightCapabilitiesClass\n",
        "call: BlueLightSystemDeviceProvider.associatorNames(",
        "trace: [INFO] BlueLightSystemDeviceProvider: Target Class is ComputerSystemClass\n",
        "status: CMPI_RC_OK\n",
        "note: BlueLightElementCapabilitiesProvider did not signal the end of the result (no "
        "CMReturnDone)\n",
        "note: BlueLightSystemDeviceProvider did not signal the end of the result (no "
        "CMReturnDone)\n"}) {
    EXPECT_TRUE(contains(result.err, line)) << line << "\n--- in ---\n" << result.err;
  }
  // The trace of a call comes between the call and what it returned.
  EXPECT_LT(result.err.find("call: BlueLightElementCapabilitiesProvider"),
            result.err.find("trace: [INFO] BlueLightElementCapabilitiesProvider"));
}

TEST_F(CliEndToEnd, WithoutVerboseNothingButTheStatus) {
  const ProcessResult result = run({"ain", kLightKeys1});
  EXPECT_EQ(result.err, kOk);
}

TEST_F(CliEndToEnd, HelpAndVersion) {
  const ProcessResult help = runBare({"--help"});
  EXPECT_EQ(help.exitCode, 0);
  EXPECT_TRUE(contains(help.out, "Exit codes:"));
  const ProcessResult version = runBare({"--version"});
  EXPECT_EQ(version.exitCode, 0);
  EXPECT_TRUE(version.out.rfind("bluelight-cli ", 0) == 0);
}

TEST_F(CliEndToEnd, UnreadableTreeIsPointedOut) {
  const ProcessResult result = run({"ein", "KESTA_BlueLight"}, "/nonexistent/tree.json");
  EXPECT_EQ(result.exitCode, 0);
  EXPECT_EQ(result.out, "");
  EXPECT_EQ(result.err,
            "status: CMPI_RC_OK\n"
            "note: KESTA_INSTRUMENTATION names file:/nonexistent/tree.json, which cannot be read: "
            "the provider finds no lights (VNLOG_SINK=stderr shows its log)\n");
}

// ---- The bundled sample tree ------------------------------------------------------------------

TEST_F(CliEndToEnd, SampleTreeHasSixLightsAndNothingElse) {
  const ProcessResult result = run({"ein", "KESTA_BlueLight"}, kSampleTree);
  EXPECT_EQ(result.exitCode, 0);
  std::string expected;
  for (const char* id : {"Blue Light:1.2", "Drawer Blue Light:4.1", "Front Panel Blue Light:1.3",
                         "Rear Blue Light:3.1", "Rear Blue Light:3.2", "Service Blue Light:5.1"}) {
    expected += std::string("//testhost/root/cimv2:KESTA_BlueLight.CreationClassName=") +
                "\"KESTA_BlueLight\",DeviceID=\"" + id +
                "\",SystemCreationClassName=\"KESTA_ComputerSystem\",SystemName=\"testhost\"\n";
  }
  EXPECT_EQ(result.out, expected);
}

TEST_F(CliEndToEnd, SampleTreeStates) {
  const ProcessResult result = run({"ei", "--json", "--properties",
                                    "HealthState,OperationalStatus,AlarmState", "KESTA_BlueLight"},
                                   kSampleTree);
  ASSERT_EQ(result.exitCode, 0);
  const Json document = Json::parse(result.out);
  std::map<std::string, std::string> states;
  for (const Json& light : document["instances"]) {
    const Json& p = light["properties"];
    states[p["DeviceID"].get<std::string>()] = p["HealthState"].dump() + " " +
                                               p["OperationalStatus"].dump() + " " +
                                               p["AlarmState"].dump();
  }
  EXPECT_EQ(states, (std::map<std::string, std::string>{
                        {"Blue Light:1.2", "5 [2,11] 2"},
                        {"Front Panel Blue Light:1.3", "5 [2,11] 3"},
                        {"Rear Blue Light:3.1", "5 [2,11] 1"},
                        {"Rear Blue Light:3.2", "10 [3,5] 2"},
                        {"Drawer Blue Light:4.1", "10 [3] 3"},
                        {"Service Blue Light:5.1", "0 [] 0"},
                    }));
}

// ---- discover ------------------------------------------------------------------------------

class CliDiscover : public ::testing::Test {
 protected:
  ProcessResult discover(const std::string& sources, std::vector<std::string> arguments = {}) {
    arguments.insert(arguments.begin(), {"--library", kLibrary, "discover"});
    return clitest::runProcess(kTool, arguments,
                               {{"KESTA_INSTRUMENTATION", sources},
                                {"KESTA_DISCOVERY_ROOT", root_.path()},
                                {"KESTA_SYSTEM_NAME", "testhost"},
                                {"VNLOG_SINK", "none"}});
  }
  void identifyLed(const std::string& name, const std::string& brightness) {
    const std::string folder = root_.file("sys/class/leds/" + name);
    std::filesystem::create_directories(folder);
    testsupport::writeFile(folder + "/brightness", brightness + "\n");
  }

  testsupport::TempDir root_;
};

TEST_F(CliDiscover, AListTellsWhatEachSourceGaveThenTheLights) {
  const std::string missing = root_.file("missing.json");
  const ProcessResult result = discover("file:" + kTwoLights + "; file:" + missing + ";;");
  EXPECT_EQ(result.exitCode, 0) << result.err;
  EXPECT_EQ(result.out, "sources: file:" + kTwoLights + "; file:" + missing +
                            ";; (from KESTA_INSTRUMENTATION)\n"
                            "  read       2 lights   file:" +
                            kTwoLights +
                            "\n"
                            "  unreadable -          file:" +
                            missing +
                            "  (No such file or directory)\n"
                            "  note: the list has 2 empty entries (entries 3, 4); left out\n"
                            "\n"
                            "lights: 2\n"
                            "  AlarmState      HealthState   DeviceID\n"
                            "  2 steady        5 OK          Blue Light:1.2\n"
                            "  3 alternating   10 degraded   Rear Blue Light:3.1\n");
  EXPECT_EQ(result.err, kOk);
}

TEST_F(CliDiscover, AutoOnAMachineWithNothingFindsNothingAndSaysWhy) {
  const ProcessResult result = discover("auto");
  EXPECT_EQ(result.exitCode, 0) << result.err;
  const std::string r = root_.path();
  EXPECT_EQ(result.out,
            "sources: auto (from KESTA_INSTRUMENTATION)\n"
            "  absent     -          ipmi:  (no IPMI device (looked for " +
                r + "/dev/ipmi0, " + r + "/dev/ipmi/0, " + r +
                "/dev/ipmidev/0))\n"
                "  absent     -          enclosure:  (no " +
                r +
                "/sys/class/enclosure)\n"
                "  absent     -          sysfs:?lights=identify  (no " +
                r + "/sys/class/leds)\n\nlights: 0\n");
  EXPECT_EQ(result.err, kOk);
}

TEST_F(CliDiscover, AutoFindsTheIdentifyLeds) {
  identifyLed("platform::uid", "1");
  identifyLed("platform:blue:power", "1");
  const ProcessResult result = discover("auto");
  EXPECT_EQ(result.exitCode, 0) << result.err;
  EXPECT_TRUE(contains(result.out, "  read       1 light    sysfs:" + root_.path() +
                                       "/sys/class/leds?lights=identify\n"))
      << result.out;
  EXPECT_TRUE(contains(result.out,
                       "lights: 1\n  AlarmState      HealthState   DeviceID\n"
                       "  2 steady        5 OK          Blue Light:platform::uid\n"))
      << result.out;
}

TEST_F(CliDiscover, AsJson) {
  identifyLed("x::locate", "0");
  const ProcessResult result = discover("auto", {"--json"});
  EXPECT_EQ(result.exitCode, 0) << result.err;
  const Json json = Json::parse(result.out);
  EXPECT_EQ(json["setting"]["text"], "auto");
  EXPECT_EQ(json["setting"]["origin"], "KESTA_INSTRUMENTATION");
  ASSERT_EQ(json["sources"].size(), 3u);
  EXPECT_EQ(json["sources"][2]["state"], "read");
  EXPECT_EQ(json["sources"][2]["lights"], 1);
  ASSERT_EQ(json["lights"].size(), 1u);
  EXPECT_EQ(json["lights"][0]["properties"]["DeviceID"], "Blue Light:x::locate");
  EXPECT_EQ(json["lights"][0]["properties"]["AlarmState"], 1);
  EXPECT_EQ(json["status"]["name"], "CMPI_RC_OK");
  EXPECT_EQ(result.err, kOk);
}

}  // namespace
