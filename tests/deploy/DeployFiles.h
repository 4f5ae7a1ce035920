// Reading the deployment's files the way the object managers and the dynamic loader see them:
// the generated registrations of both object managers, the class MOF, the built libraries and
// their exported symbols. Paths come from the build (bluelight_deploy_layout).
#ifndef BLUELIGHT_TESTS_DEPLOY_DEPLOYFILES_H
#define BLUELIGHT_TESTS_DEPLOY_DEPLOYFILES_H

#include <set>
#include <string>
#include <vector>

#include "MofReader.h"

namespace deploy {

// One class as a registration declares it.
struct Registration {
  std::string className;
  std::string provider;
  std::string location;         // the library name the object manager opens as lib<location>.so
  std::set<std::string> kinds;  // "instance", "association"
  std::set<std::string> namespaces;  // e.g. "root/cimv2"
  std::string file;                  // where it was read, for messages

  // Everything but `file`, for comparing the two object managers' registrations.
  std::string summary() const;
};

// One row of the provider table, deploy/providers.txt, as it is written there.
struct TableRow {
  std::string className;
  std::string provider;
  std::set<std::string> kinds;  // "instance", "association"
  std::string library;          // the CMake target, which is also the registered location
  std::set<std::string> namespaces;
  std::string symbol;  // the name of the C++ constant holding the class name
  int line = 0;        // where it stands in the table, for messages

  // The same form as Registration::summary(), to compare a row with what was generated from it.
  std::string summary() const;
};

// The rows of the provider table, in its order. Throws std::runtime_error naming the line when a
// row does not have the table's six columns.
std::vector<TableRow> providerTable();

// The registrations of every generated sfcb .reg file, in file order.
std::vector<Registration> sfcbRegistrations();
// The same from every generated OpenPegasus registration MOF; the module, provider and
// capability instances are cross-checked while reading (a capability naming a missing module or
// provider throws std::runtime_error).
std::vector<Registration> pegasusRegistrations();
// One sfcb .reg file's text parsed (exposed for the reader's own tests).
std::vector<Registration> parseSfcbRegistration(const std::string& text, const std::string& file);

// The generated registration files of each kind.
std::vector<std::string> sfcbFiles();
std::vector<std::string> pegasusFiles();

// The class MOF.
const mof::Document& classMof();

// The provider libraries the build installs, as target names ("bluelightprofileprovider", ...).
std::vector<std::string> providerLibraries();
// The build-tree path that an object manager would open for `location`: <lib>/lib<location>.so.
std::string libraryPathFor(const std::string& location);

// The defined dynamic symbols of a shared library, as `nm -D --defined-only` lists them (names
// without version suffixes).
std::set<std::string> definedDynamicSymbols(const std::string& libraryPath);
// Symbols every shared library may define that are none of ours.
bool isLinkerSymbol(const std::string& name);
// The MI factory names a registration promises: <provider>_Create_InstanceMI and/or
// <provider>_Create_AssociationMI.
std::set<std::string> factorySymbols(const Registration& registration);
// True for a name of the form <provider>_Create_<kind>MI.
bool isFactorySymbol(const std::string& name);

// Runs a shell command and returns its standard output; `status` gets the exit status.
std::string runCommand(const std::string& command, int* status = nullptr);
// `text` in single quotes for the shell.
std::string shellQuote(const std::string& text);
// The whole content of a file; throws std::runtime_error when it cannot be read.
std::string readText(const std::string& path);
// Splits a list written with commas.
std::vector<std::string> splitList(const std::string& text);

}  // namespace deploy

#endif  // BLUELIGHT_TESTS_DEPLOY_DEPLOYFILES_H
