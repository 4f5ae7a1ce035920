// The platform's common helpers that the module calls: the CMPI-free ones (KestaCommonBase.h)
// and the comparison of two object paths.
#ifndef KESTA_PLATFORM_COMMON_H
#define KESTA_PLATFORM_COMMON_H

#include <cmpidt.h>
#include <cmpift.h>

#include "KestaCommonBase.h"

namespace Kesta {

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

}  // namespace Kesta

#endif  // KESTA_PLATFORM_COMMON_H
