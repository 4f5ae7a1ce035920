// Status values and the names of CMPI codes.
//
// A CMPIStatus carries its message as a CMPIString that dies with the request that made it, so the
// host turns every status it reports into a StatusValue: a return code and an optional copy of the
// message text.
#pragma once

#include <cmpidt.h>

#include <optional>
#include <ostream>
#include <string>

namespace cmpihost {

/// A CMPIStatus as a plain value: the return code and the message text. `message` is nullopt when
/// the status carried no message (a null msg, or a message string whose handle is null).
struct StatusValue {
  CMPIrc rc = CMPI_RC_OK;
  std::optional<std::string> message;

  StatusValue() = default;
  // Implicit on purpose: StatusValue{CMPI_RC_ERR_FAILED, "text"} and plain codes read naturally.
  StatusValue(CMPIrc code,  // NOLINT(google-explicit-constructor)
              std::optional<std::string> text = std::nullopt);

  bool ok() const { return rc == CMPI_RC_OK; }

  /// "CMPI_RC_OK", or the code's name followed by ": " and the message when there is one.
  std::string toString() const;
};

bool operator==(const StatusValue& a, const StatusValue& b);
bool operator!=(const StatusValue& a, const StatusValue& b);
std::ostream& operator<<(std::ostream& out, const StatusValue& status);

/// The name of a return code as the headers spell it, e.g. "CMPI_RC_ERR_NOT_FOUND";
/// "CMPI_RC_<number>" for a code the headers do not define.
std::string rcName(CMPIrc rc);

/// The name of a type code as the headers spell it, e.g. "CMPI_uint16", "CMPI_refA"; for a code
/// the headers do not define, "CMPI_type_0x<hex>".
std::string typeName(CMPIType type);

}  // namespace cmpihost
