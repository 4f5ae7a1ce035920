#include "HelpText.h"

#include <string_view>

#include "LibraryLocation.h"

namespace bluelight::cli {

namespace {

// "@INSTALLED@" stands for the installed library, which only the build knows.
constexpr std::string_view kHelp =
    R"(bluelight-cli - show the blue alarm lights of this server as CIM instances, without an
object manager

Usage: bluelight-cli [options] <operation> <CLASS | PATH>
       bluelight-cli [--json] [--library PATH] discover

The tool loads the blue-light provider library into an in-process CMPI host and sends it the
CIM read operations a WBEM client would send through an object manager. The lights come from
the instrumentation source named by KESTA_INSTRUMENTATION. Results are printed on standard
output as MOF (or JSON with --json); the status the providers returned goes to standard error.

Quick start, from the top of the source tree (the examples below use these settings):
  export KESTA_INSTRUMENTATION=file:examples/sample-tree.json KESTA_SYSTEM_NAME=demo-host
  export VNLOG_SINK=none
  LIGHT='KESTA_BlueLight.CreationClassName="KESTA_BlueLight",DeviceID="Blue Light:1.2",SystemCreationClassName="KESTA_ComputerSystem",SystemName="demo-host"'
  CAPS='KESTA_BlueLightCapabilities.InstanceID="KESTA:BlueLightCapabilities1"'
  CS='KESTA_ComputerSystem.CreationClassName="KESTA_ComputerSystem",Name="demo-host"'
  bluelight-cli ei KESTA_BlueLight

Classes served by the library:
  KESTA_BlueLight                     the lights
  KESTA_BlueLightCapabilities         the one capabilities record of the lights
  KESTA_BlueLightElementCapabilities  association: light (ManagedElement) to the capabilities
                                      record (Capabilities)
  KESTA_BlueLightSystemDevice         association: computer system (GroupComponent) to light
                                      (PartComponent)
  KESTA_ComputerSystem is not served here: the tool itself answers the provider's up-calls
  for it (see --computer-system).

Start here:
  discover                              which sources of lights this server has (with the
                                        configured list, or what auto finds), how many lights
                                        each gave and why not when none, then every light
         bluelight-cli discover

Operations:
  ein, enumerate-instance-names CLASS   the object paths of every instance of a class
         bluelight-cli ein KESTA_BlueLight
  ei,  enumerate-instances CLASS        every instance of a class
         bluelight-cli ei KESTA_BlueLightCapabilities
  gi,  get-instance PATH                one instance
         bluelight-cli gi --properties AlarmState,HealthState "$LIGHT"
  ai,  associators PATH                 the objects associated with an object
         bluelight-cli ai --assoc-class KESTA_BlueLightSystemDevice "$CS"
  ain, associator-names PATH            the object paths of those objects
         bluelight-cli ain "$LIGHT"
  ri,  references PATH                  the association instances that refer to an object
         bluelight-cli ri --assoc-class KESTA_BlueLightElementCapabilities "$LIGHT"
  rin, reference-names PATH             the object paths of those association instances
         bluelight-cli rin --assoc-class KESTA_BlueLightElementCapabilities "$CAPS"

  CLASS is ClassName or namespace:ClassName. PATH is an object path in CIM text form:
    [//host/][namespace:]ClassName.Key="string",Key=42,Key=TRUE,...
  Strings are in double quotes, with \" for a quote and \\ for a backslash; numbers and
  TRUE/FALSE are bare; a reference key is the quoted text of the path it refers to. Put the
  whole path in single quotes for the shell. Every path the tool prints can be given back.

Options:
  --namespace NS          namespace of a CLASS or PATH that names none (default root/cimv2)
  --properties A,B        ask only for these properties (ei, gi, ai, ri); --properties '' asks
                          for none besides the keys; without the option all are asked for
  --assoc-class CLASS     ai, ain: the association to follow; ri, rin: the association class
                          (their ResultClass). Only that association's provider is asked.
                          Without it every association provider is asked in turn and the
                          results merged; an error from any of them is the answer, as object
                          managers do it
  --result-class CLASS    ai, ain: only objects of this class; ri, rin: as --assoc-class
  --role NAME             the role of the given object in the association (ai, ain, ri, rin)
  --result-role NAME      the role of the objects at the other end (ai, ain)
  --json                  print one JSON document instead of MOF (schema in docs/cli.md)
  --verbose               also print on standard error each provider call, the broker's trace
                          messages as they arrive, and how the providers ended their results
  --library PATH          the provider library to load; by default the one next to the tool
                          (<tool's directory>/../lib/@LIBRARY@), else
                          @INSTALLED@
  --computer-system NAME  a KESTA_ComputerSystem the tool returns to the provider's up-calls
                          (repeatable); by default one, named after this system like the lights
                          (KESTA_SYSTEM_NAME, else the host's fully qualified name)
  --no-computer-system    the up-calls return no computer system
  --upcall-failure CODE   the up-calls fail with this CMPI return code, given by name
                          (CMPI_RC_ERR_ACCESS_DENIED, ERR_ACCESS_DENIED) or number (2)
  -h, --help              this text
  --version               the version of the tool

Environment (read by the provider library; KESTA_SYSTEM_NAME also by the tool):
  KESTA_INSTRUMENTATION   where the lights come from: auto, file:<tree.json> (a JSON
                          snapshot, see examples/README.md), sysfs:<directory>, ipmi:[<device>],
                          enclosure:[<directory>], ... or several separated by ';'; when unset,
                          the first line of /etc/kesta/instrumentation.conf, else auto
  KESTA_DISCOVERY_ROOT    a folder that auto puts in front of /dev and /sys (to look at a copy)
  KESTA_SYSTEM_NAME       the system name in the SystemName keys and host names of the paths
                          (default: this host's fully qualified name)
  VNLOG_SINK              where the provider's log goes: file:<path>, stderr, syslog or none
                          (default syslog)
  VNLOG_LEVEL             the log threshold: lines of this level or above are written
                          (default 6000)
  KESTA_LANGUAGE          the language of the Caption property: en, de or fr (default: from
                          LC_ALL, LC_MESSAGES or LANG, else en)

Output:
  standard output  MOF instances, each preceded by its object path as a // comment, or one
                   object path per line; with --json one JSON document
  standard error   "status: CMPI_RC_OK" or "status: <code>: <message>", then "note:" lines
                   about anything a user might misread (e.g. GetInstance answered with nothing)

Exit codes:
  0  the status is CMPI_RC_OK
  1  the status is an error, or no provider serves the class
  2  the command line cannot be used (unknown option, malformed path, ...); nothing was loaded
  3  the provider library or one of its MIs cannot be loaded
)";

void replaceAll(std::string& text, std::string_view from, std::string_view to) {
  for (std::size_t at = text.find(from); at != std::string::npos;
       at = text.find(from, at + to.size())) {
    text.replace(at, from.size(), to);
  }
}

}  // namespace

std::string helpText() {
  std::string text(kHelp);
  replaceAll(text, "@LIBRARY@", providerLibraryName());
  replaceAll(text, "@INSTALLED@", BLUELIGHT_CLI_INSTALLED_LIBRARY);
  return text;
}

std::string versionText() {
  return std::string("bluelight-cli ") + BLUELIGHT_CLI_VERSION + " (loads " +
         providerLibraryName() + ")\n";
}

}  // namespace bluelight::cli
