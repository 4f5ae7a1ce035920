// The part of the platform's common helpers that needs no CMPI type: the system name and the
// blank stripping. The platform's own code (logger, sources, locale) and the command-line tool
// include this header; only code that handles CMPI objects includes KestaCommon.h.
#ifndef KESTA_PLATFORM_COMMONBASE_H
#define KESTA_PLATFORM_COMMONBASE_H

#include <string>

namespace Kesta {

// The name of this system, used as the host name of every object path and as the SystemName key
// of the lights:
//   1. the environment variable KESTA_SYSTEM_NAME, when it is set and not empty (read each call);
//   2. else the fully qualified name of the host (canonical name of gethostname()), resolved once
//      per process and then remembered;
//   3. else gethostname() itself.
std::string getSystemName();

// `text` without its surrounding blanks (spaces, tabs, carriage returns, newlines, vertical tabs
// and form feeds).
std::string stripSpaces(std::string text);

}  // namespace Kesta

#endif  // KESTA_PLATFORM_COMMONBASE_H
