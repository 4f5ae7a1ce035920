// Between the value model and the CMPI forms of values: what setters receive and what getters
// return.
#pragma once

#include <cmpift.h>
#include <cmpihost/value.h>

#include <string>

#include "object_scope.h"

namespace cmpihost::detail {

/// A value read from a setter's arguments, or why it could not be read.
struct ReadValue {
  Value value;
  CMPIrc rc = CMPI_RC_OK;
  std::string error;  // empty when rc is OK

  bool ok() const { return rc == CMPI_RC_OK; }
};

/// Reads a value in the setter convention (for CMPI_chars `value` is the char*, otherwise it
/// points at a CMPIValue) and copies it: strings are copied, references, instances and arrays
/// deep-copied. A null `value` (or a null pointer inside it, such as value->ref) is
/// CMPI_RC_ERR_INVALID_PARAMETER, an object with a null handle CMPI_RC_ERR_INVALID_HANDLE, an
/// array whose element type differs from `type`'s CMPI_RC_ERR_TYPE_MISMATCH, and a type the host
/// does not store (args, filters, enumerations, classes, pointers) CMPI_RC_ERR_INVALID_DATA_TYPE.
/// CMPI_null stores a null value whatever `value` is.
ReadValue readValue(const CMPIValue* value, CMPIType type);

/// The value as CMPIData; strings, paths, instances, arrays and date/times become new objects in
/// `scope`. `state` is or-ed into the data's state (for CMPI_keyValue).
CMPIData toData(const Value& value, ObjectScope& scope, CMPIValueState state = CMPI_goodValue);

/// The 25-character text of a date/time of any broker; empty when it cannot be read.
std::string dateTimeText(const CMPIDateTime* dateTime);

}  // namespace cmpihost::detail
