// How the module tells the object manager about a failure or a notable event: in the status it
// returns and through the broker's trace facility. The factory and the four providers report
// alike through these two.
#ifndef KESTA_BROKERREPORT_H
#define KESTA_BROKERREPORT_H

#include <cmpidt.h>
#include <cmpift.h>
#include <cmpimacs.h>

#include "BlueLightNames.h"

namespace Kesta {
namespace BlueLightProvider {
namespace {

// Sends `text` to the broker's trace at `level` (kBrokerTraceInfo or kBrokerTraceWarning) from
// `component`, ignoring the outcome. Without a broker there is no trace.
inline void traceToBroker(const CMPIBroker* broker, int level, const char* component,
                          const char* text) {
  if (broker != nullptr) CMTraceMessage(broker, level, component, text, nullptr);
}

// Reports a failure: `status`, when there is one, becomes CMPI_RC_ERR_FAILED with `statusText`
// as its message, and `traceText` goes to the broker's trace as a warning from `component`. The
// two texts of one failure often differ on purpose. Without a broker there is neither a message
// nor a trace.
inline void reportFailure(const CMPIBroker* broker, const char* component, CMPIStatus* status,
                          const char* statusText, const char* traceText) {
  if (status != nullptr) {
    status->rc = CMPI_RC_ERR_FAILED;
    status->msg = broker != nullptr ? CMNewString(broker, statusText, nullptr) : nullptr;
  }
  traceToBroker(broker, kBrokerTraceWarning, component, traceText);
}

}  // namespace
}  // namespace BlueLightProvider
}  // namespace Kesta

#endif  // KESTA_BROKERREPORT_H
