// The platform's common helpers that the module calls.
#ifndef KESTA_PLATFORM_COMMON_H
#define KESTA_PLATFORM_COMMON_H

#include <cmpidt.h>
#include <cmpift.h>

#include <string>

namespace Kesta {

// The name of this system, used as the host name of every object path and as the SystemName key
// of the lights:
//   1. the environment variable KESTA_SYSTEM_NAME, when it is set and not empty (read each call);
//   2. else the fully qualified name of the host (canonical name of gethostname()), resolved once
//      per process and then remembered;
//   3. else gethostname() itself.
std::string getSystemName();

// True when the two object paths name the same instance:
//   - class names equal, ignoring case (CIM names are case-insensitive);
//   - the same set of keys, names compared ignoring case, order irrelevant;
//   - equal key values: strings exactly (CMPI_chars and CMPI_string alike), integers of any
//     width and signedness by numeric value, booleans by truth, references recursively by
//     these same rules;
//   - host names are never compared.
// `compareNamespaces` selects whether the namespaces must be equal too (ignoring case; an
// empty or missing namespace on either side of a reference nested in a key matches any).
// A null path equals nothing, not even another null path.
bool isObjPathsEqual(const CMPIObjectPath* first, const CMPIObjectPath* second,
                     bool compareNamespaces);

// `text` without its surrounding blanks (spaces, tabs, carriage returns, newlines, vertical tabs
// and form feeds).
std::string stripSpaces(std::string text);

}  // namespace Kesta

#endif  // KESTA_PLATFORM_COMMON_H
