// The command line: every option, the operation names, and the errors a user can make.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "CommandLine.h"
#include "UsageError.h"

namespace bluelight::cli {
namespace {

const std::string kLight =
    "KESTA_BlueLight.CreationClassName=\"KESTA_BlueLight\",DeviceID=\"Blue Light:1.2\"";

CommandLine parse(const std::vector<std::string>& arguments) { return parseCommandLine(arguments); }

// The message of the UsageError that parsing `arguments` throws ("" when it does not throw).
std::string usageError(const std::vector<std::string>& arguments) {
  try {
    parseCommandLine(arguments);
  } catch (const UsageError& error) {
    return error.what();
  }
  return "";
}

TEST(CommandLine, ReadsShortLongAndCimOperationNames) {
  const std::vector<std::pair<std::string, Operation>> names = {
      {"ein", Operation::EnumerateInstanceNames},
      {"enumerate-instance-names", Operation::EnumerateInstanceNames},
      {"EnumerateInstanceNames", Operation::EnumerateInstanceNames},
      {"ei", Operation::EnumerateInstances},
      {"enumerate-instances", Operation::EnumerateInstances},
      {"gi", Operation::GetInstance},
      {"get-instance", Operation::GetInstance},
      {"ai", Operation::Associators},
      {"associators", Operation::Associators},
      {"ain", Operation::AssociatorNames},
      {"associator-names", Operation::AssociatorNames},
      {"ri", Operation::References},
      {"references", Operation::References},
      {"rin", Operation::ReferenceNames},
      {"reference-names", Operation::ReferenceNames},
      {"GI", Operation::GetInstance},
  };
  for (const auto& [name, operation] : names) {
    const CommandLine line = parse({name, "KESTA_BlueLight"});
    EXPECT_EQ(line.operation, operation) << name;
    EXPECT_EQ(line.argument, "KESTA_BlueLight") << name;
    EXPECT_EQ(line.action, CommandLine::Action::Run);
  }
}

TEST(CommandLine, DefaultsWhenNoOptionIsGiven) {
  const CommandLine line = parse({"ei", "KESTA_BlueLight"});
  EXPECT_EQ(line.nameSpace, "root/cimv2");
  EXPECT_FALSE(line.properties.has_value());
  EXPECT_FALSE(line.assocClass || line.resultClass || line.role || line.resultRole);
  EXPECT_FALSE(line.json);
  EXPECT_FALSE(line.verbose);
  EXPECT_FALSE(line.library.has_value());
  EXPECT_TRUE(line.computerSystems.empty());
  EXPECT_FALSE(line.noComputerSystem);
  EXPECT_FALSE(line.upcallFailure.has_value());
}

TEST(CommandLine, HelpAndVersionWinOverEverythingElse) {
  EXPECT_EQ(parse({"--help"}).action, CommandLine::Action::Help);
  EXPECT_EQ(parse({"-h"}).action, CommandLine::Action::Help);
  EXPECT_EQ(parse({"gi", "not a path", "--bogus", "--help"}).action, CommandLine::Action::Help);
  EXPECT_EQ(parse({"--version"}).action, CommandLine::Action::Version);
  EXPECT_EQ(parse({"--version", "--help"}).action, CommandLine::Action::Help);
}

TEST(CommandLine, OptionsTakeValuesInBothSpellingsAndAnyPlace) {
  const CommandLine line = parse({"--namespace", "root/interop", "ei", "KESTA_BlueLight",
                                  "--library=/tmp/lib.so", "--json", "--verbose"});
  EXPECT_EQ(line.nameSpace, "root/interop");
  EXPECT_EQ(line.library, "/tmp/lib.so");
  EXPECT_TRUE(line.json);
  EXPECT_TRUE(line.verbose);
}

TEST(CommandLine, PropertiesAbsentEmptyAndListed) {
  EXPECT_FALSE(parse({"ei", "KESTA_BlueLight"}).properties.has_value());
  const CommandLine empty = parse({"ei", "KESTA_BlueLight", "--properties", ""});
  ASSERT_TRUE(empty.properties.has_value());
  EXPECT_TRUE(empty.properties->empty());
  const CommandLine listed = parse({"gi", kLight, "--properties=AlarmState, HealthState"});
  ASSERT_TRUE(listed.properties.has_value());
  EXPECT_EQ(*listed.properties, (std::vector<std::string>{"AlarmState", "HealthState"}));
}

TEST(CommandLine, PropertyListErrors) {
  EXPECT_EQ(usageError({"ei", "KESTA_BlueLight", "--properties", "a,,b"}),
            "--properties has an empty name in \"a,,b\" (use --properties '' for the empty list)");
  EXPECT_EQ(usageError({"ei", "KESTA_BlueLight", "--properties", "a,"}),
            "--properties has an empty name in \"a,\" (use --properties '' for the empty list)");
  EXPECT_EQ(usageError({"ei", "KESTA_BlueLight", "--properties", "Alarm-State"}),
            "--properties: \"Alarm-State\" is not a property name");
  EXPECT_EQ(usageError({"ei", "KESTA_BlueLight", "--properties", "a", "--properties", "b"}),
            "--properties is given more than once");
}

TEST(CommandLine, AssociationOptions) {
  const CommandLine line =
      parse({"ai", kLight, "--assoc-class", "KESTA_BlueLightSystemDevice", "--result-class",
             "KESTA_ComputerSystem", "--role", "PartComponent", "--result-role", "GroupComponent"});
  EXPECT_EQ(line.assocClass, "KESTA_BlueLightSystemDevice");
  EXPECT_EQ(line.resultClass, "KESTA_ComputerSystem");
  EXPECT_EQ(line.role, "PartComponent");
  EXPECT_EQ(line.resultRole, "GroupComponent");
}

TEST(CommandLine, AssocClassNamesTheResultClassOfReferences) {
  const CommandLine line =
      parse({"rin", kLight, "--assoc-class", "KESTA_BlueLightElementCapabilities"});
  EXPECT_FALSE(line.assocClass.has_value());
  EXPECT_EQ(line.resultClass, "KESTA_BlueLightElementCapabilities");
  const CommandLine both = parse({"ri", kLight, "--assoc-class", "KESTA_BlueLightSystemDevice",
                                  "--result-class", "kesta_bluelightsystemdevice"});
  EXPECT_EQ(both.resultClass, "KESTA_BlueLightSystemDevice");
  EXPECT_EQ(usageError({"ri", kLight, "--assoc-class", "KESTA_BlueLightSystemDevice",
                        "--result-class", "KESTA_BlueLightElementCapabilities"}),
            "--assoc-class and --result-class both name the association class of references and "
            "must agree");
}

TEST(CommandLine, OptionsThatTheOperationDoesNotTake) {
  EXPECT_EQ(usageError({"ein", "KESTA_BlueLight", "--properties", "a"}),
            "--properties does not apply to enumerate-instance-names");
  EXPECT_EQ(usageError({"ain", kLight, "--properties", "a"}),
            "--properties does not apply to associator-names");
  EXPECT_EQ(usageError({"rin", kLight, "--properties", "a"}),
            "--properties does not apply to reference-names");
  EXPECT_EQ(usageError({"ei", "KESTA_BlueLight", "--assoc-class", "X"}),
            "--assoc-class does not apply to enumerate-instances");
  EXPECT_EQ(usageError({"gi", kLight, "--result-class", "X"}),
            "--result-class does not apply to get-instance");
  EXPECT_EQ(usageError({"gi", kLight, "--role", "X"}), "--role does not apply to get-instance");
  EXPECT_EQ(usageError({"ei", "X", "--result-role", "X"}),
            "--result-role does not apply to enumerate-instances");
  EXPECT_EQ(usageError({"ri", kLight, "--result-role", "X"}),
            "--result-role does not apply to references");
}

TEST(CommandLine, NamesMustBeCimNames) {
  EXPECT_EQ(usageError({"ai", kLight, "--assoc-class", "1X"}),
            "--assoc-class needs a class name (letters, digits and \"_\"), not \"1X\"");
  EXPECT_EQ(usageError({"ai", kLight, "--result-class", ""}),
            "--result-class needs a class name (letters, digits and \"_\"), not \"\"");
  EXPECT_EQ(usageError({"ai", kLight, "--role", "a b"}),
            "--role needs a property name (letters, digits and \"_\"), not \"a b\"");
  EXPECT_EQ(usageError({"ai", kLight, "--result-role", "a.b"}),
            "--result-role needs a property name (letters, digits and \"_\"), not \"a.b\"");
}

TEST(CommandLine, Namespace) {
  EXPECT_EQ(parse({"ei", "X", "--namespace", "root/kesta_2"}).nameSpace, "root/kesta_2");
  EXPECT_EQ(usageError({"ei", "X", "--namespace", "root//cimv2"}),
            "--namespace needs a namespace such as root/cimv2, not \"root//cimv2\"");
  EXPECT_EQ(usageError({"ei", "X", "--namespace", ""}),
            "--namespace needs a namespace such as root/cimv2, not \"\"");
  EXPECT_EQ(usageError({"ei", "X", "--namespace", "a", "--namespace", "b"}),
            "--namespace is given more than once");
}

TEST(CommandLine, ComputerSystems) {
  const CommandLine two =
      parse({"ain", kLight, "--computer-system", "alpha", "--computer-system=beta"});
  EXPECT_EQ(two.computerSystems, (std::vector<std::string>{"alpha", "beta"}));
  EXPECT_TRUE(parse({"ain", kLight, "--no-computer-system"}).noComputerSystem);
  EXPECT_EQ(usageError({"ain", kLight, "--computer-system", ""}), "--computer-system needs a name");
  EXPECT_EQ(usageError({"ain", kLight, "--computer-system", "a", "--no-computer-system"}),
            "--no-computer-system and --computer-system exclude each other");
}

TEST(CommandLine, UpcallFailureByNameOrNumber) {
  EXPECT_EQ(parse({"ain", kLight, "--upcall-failure", "CMPI_RC_ERR_ACCESS_DENIED"}).upcallFailure,
            CMPI_RC_ERR_ACCESS_DENIED);
  EXPECT_EQ(parse({"ain", kLight, "--upcall-failure", "err_not_found"}).upcallFailure,
            CMPI_RC_ERR_NOT_FOUND);
  EXPECT_EQ(parse({"ain", kLight, "--upcall-failure=1"}).upcallFailure, CMPI_RC_ERR_FAILED);
  EXPECT_EQ(usageError({"ain", kLight, "--upcall-failure", "CMPI_RC_OK"}),
            "--upcall-failure needs an error code, not CMPI_RC_OK");
  EXPECT_EQ(usageError({"ain", kLight, "--upcall-failure", "999"}),
            "--upcall-failure needs a CMPI return code, by name (e.g. CMPI_RC_ERR_ACCESS_DENIED "
            "or ERR_ACCESS_DENIED) or by number (e.g. 2), not \"999\"");
  EXPECT_EQ(usageError({"ain", kLight, "--upcall-failure", "2", "--computer-system", "a"}),
            "--upcall-failure makes the computer-system up-calls fail; it cannot be combined with "
            "--computer-system or --no-computer-system");
  EXPECT_EQ(usageError({"ain", kLight, "--upcall-failure", "2", "--no-computer-system"}),
            "--upcall-failure makes the computer-system up-calls fail; it cannot be combined with "
            "--computer-system or --no-computer-system");
}

TEST(CommandLine, OperationAndArgumentErrors) {
  EXPECT_EQ(usageError({}), "no operation given (discover, ei, ein, gi, ai, ain, ri or rin)");
  EXPECT_EQ(usageError({"--json"}),
            "no operation given (discover, ei, ein, gi, ai, ain, ri or rin)");
  EXPECT_EQ(usageError({"list", "X"}),
            "unknown operation \"list\"; the operations are discover, ei, ein, gi, ai, ain, ri and "
            "rin");
  EXPECT_EQ(usageError({"ei"}), "enumerate-instances needs a class name");
  EXPECT_EQ(usageError({"gi"}), "get-instance needs an object path");
  EXPECT_EQ(usageError({"ei", "A", "B"}), "unexpected argument \"B\"");
}

TEST(CommandLine, DiscoverTakesNoArgumentAndOnlyTheOptionsOfShowing) {
  for (const auto& arguments :
       std::vector<std::vector<std::string>>{{"discover"},
                                             {"DISCOVER"},
                                             {"--json", "discover"},
                                             {"discover", "--verbose"},
                                             {"discover", "--library", "/x/lib.so"}}) {
    const CommandLine line = parseCommandLine(arguments);
    EXPECT_EQ(line.action, CommandLine::Action::Discover);
  }
  EXPECT_TRUE(parseCommandLine({"discover", "--json"}).json);
  EXPECT_EQ(parseCommandLine({"discover", "--library=/x/lib.so"}).library, "/x/lib.so");
  EXPECT_EQ(usageError({"discover", "KESTA_BlueLight"}), "unexpected argument \"KESTA_BlueLight\"");
  EXPECT_EQ(usageError({"discover", "--properties", "A"}),
            "--properties does not apply to discover");
  EXPECT_EQ(usageError({"discover", "--namespace", "root/x"}),
            "--namespace does not apply to discover");
  EXPECT_EQ(usageError({"discover", "--assoc-class", "A"}),
            "--assoc-class does not apply to discover");
  EXPECT_EQ(usageError({"discover", "--computer-system", "a"}),
            "--computer-system does not apply to discover");
  EXPECT_EQ(usageError({"discover", "--upcall-failure", "2"}),
            "--upcall-failure does not apply to discover");
}

TEST(CommandLine, OptionErrors) {
  EXPECT_EQ(usageError({"ei", "X", "--bogus"}), "unknown option \"--bogus\"");
  EXPECT_EQ(usageError({"ei", "X", "-x"}), "unknown option \"-x\"");
  EXPECT_EQ(usageError({"ei", "X", "--library"}), "--library needs a value");
  EXPECT_EQ(usageError({"ei", "X", "--library="}),
            "--library needs the path of the provider library");
  EXPECT_EQ(usageError({"ei", "X", "--json=yes"}), "--json takes no value");
  EXPECT_EQ(usageError({"ai", kLight, "--role", "A", "--role", "B"}),
            "--role is given more than once");
}

TEST(CommandLine, DoubleDashEndsTheOptions) {
  const CommandLine line = parse({"--json", "--", "ei", "--help"});
  EXPECT_EQ(line.action, CommandLine::Action::Run);
  EXPECT_EQ(line.argument, "--help");
  EXPECT_TRUE(line.json);
}

}  // namespace
}  // namespace bluelight::cli
