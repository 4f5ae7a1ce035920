// The --json output: one document per run.
//
//   {
//     "operation": "EnumerateInstances",
//     "target": "root/cimv2:KESTA_BlueLight",
//     "status": {"code": 0, "name": "CMPI_RC_OK", "message": null},
//     "providers": [
//       {"provider": "BlueLightProfileProvider", "mi": "instance",
//        "status": {"code": 0, "name": "CMPI_RC_OK", "message": null},
//        "results": 2, "doneCalls": 1}
//     ],
//     "instances": [
//       {"path": "//host/root/cimv2:KESTA_BlueLight.CreationClassName=\"KESTA_BlueLight\",...",
//        "class": "KESTA_BlueLight",
//        "properties": {"CreationClassName": "KESTA_BlueLight", ..., "OperationalStatus": [2, 11]},
//        "types": {"CreationClassName": "string", ..., "OperationalStatus": "uint16[]"}}
//     ],
//     "paths": [],
//     "notes": []
//   }
//
// Members always appear, in this order. "instances" is filled by the operations that return
// instances, "paths" by those that return names; both are empty when the status is an error.
// Properties keep the order the provider set them in. Values: integers as numbers, reals as
// numbers (null when not finite), booleans as booleans, strings, date/times and char16 as
// strings, references as their path text, embedded instances as objects like the entries of
// "instances", arrays as arrays, NULL as null. "types" gives each property's CIM type ("string",
// "boolean", "uint16", "real64", "datetime", "char16", "reference", "instance", with "[]" for
// arrays), which the JSON value alone cannot tell.
#pragma once

#include <cmpihost/status.h>
#include <cmpihost/value.h>

#include <nlohmann/json.hpp>
#include <string>

#include "Report.h"

namespace bluelight::cli {

using Json = nlohmann::ordered_json;

/// The CIM type name of a value, e.g. "uint16", "string[]", "reference".
std::string cimTypeName(const cmpihost::Value& value);

Json jsonValue(const cmpihost::Value& value);
Json jsonStatus(const cmpihost::StatusValue& status);
Json jsonInstance(const cmpihost::InstanceValue& instance);
Json jsonReport(const Report& report);

}  // namespace bluelight::cli
