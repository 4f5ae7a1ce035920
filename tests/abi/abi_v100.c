/*
 * A provider built for a 1.0 broker (CMPI_VERSION=100) gets the 1.0 layout: the 2.0 members are
 * all appended at the ends of their structs, so leaving them out shortens exactly five structs and
 * moves nothing. Checked here at compile time; the program itself only reports success.
 */
#define CMPI_VERSION 100

#include <stddef.h>
#include <stdio.h>

#include "cmpift.h"

#if defined(CMPI_VER_200) || !defined(CMPI_VER_100)
#error "CMPI_VERSION=100 selects level 1.0 only"
#endif
#ifdef ABI_OWN_HEADERS
/* Our headers keep the older levels on, so the pre-1.0 helpers remain usable. */
#if !defined(CMPI_VER_90) || !defined(CMPI_VER_86) || !defined(CMPI_VER_80) || \
    !defined(CMGetMessage)
#error "CMPI_VERSION=100 keeps the pre-1.0 levels"
#endif
#endif
#if defined(CMPI_MB_Supports_MemEnhancements) || defined(CMPI_MB_Supports_Extended_Error) || \
    defined(CMReturnError) || defined(CMNewCMPIError) || defined(CMSetPropertyWithOrigin)
#error "2.0-only names leaked into a 1.0 build"
#endif

_Static_assert(CMPICurrentVersion == 100, "CMPICurrentVersion of a 1.0 build");
_Static_assert(sizeof(CMPIBrokerEncFT) == 136, "CMPIBrokerEncFT without the 2.0 slots");
_Static_assert(sizeof(CMPIBroker) == 32, "CMPIBroker without mft");
_Static_assert(sizeof(CMPIResultFT) == 56, "CMPIResultFT without returnError");
_Static_assert(sizeof(CMPIInstanceFT) == 80, "CMPIInstanceFT without setPropertyWithOrigin");
_Static_assert(sizeof(CMPIPropertyMIFT) == 40, "CMPIPropertyMIFT without setPropertyWithOrigin");
/* Everything before the removed members stays where it was. */
_Static_assert(offsetof(CMPIBrokerEncFT, trace) == 128, "CMPIBrokerEncFT.trace");
_Static_assert(offsetof(CMPIBroker, xft) == 24, "CMPIBroker.xft");
_Static_assert(offsetof(CMPIResultFT, returnDone) == 48, "CMPIResultFT.returnDone");
_Static_assert(offsetof(CMPIInstanceFT, setObjectPath) == 72, "CMPIInstanceFT.setObjectPath");
_Static_assert(offsetof(CMPIPropertyMIFT, getProperty) == 32, "CMPIPropertyMIFT.getProperty");
_Static_assert(sizeof(CMPIPredOp) == 4, "CMPIPredOp keeps its size");
_Static_assert(sizeof(CMPIData) == 24 && sizeof(CMPIStatus) == 16, "value types unchanged");

int main(void) {
  printf("CMPI 1.0 layout check: 13 facts, all passed at compile time\n");
  return 0;
}
