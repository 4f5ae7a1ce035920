// Conversions between live CMPI objects and the value model.
//
// The snapshot functions read objects of any broker through their function tables (objects of
// this host are read directly, without recording a call), never change them and never crash on a
// null pointer or a null handle: they return nullopt, or a null Value, instead. Nested objects
// that cannot be read (a reference with a null handle inside an array, say) become null values.
//
// The make functions create objects of this host from values. The objects belong to the request
// current on the calling thread (or to the broker when there is none), exactly like objects a
// provider creates; they are not recorded and faults do not apply to them.
#pragma once

#include <cmpift.h>
#include <cmpihost/status.h>
#include <cmpihost/value.h>

#include <optional>
#include <string>
#include <string_view>

namespace cmpihost {

class Broker;

// ---- Snapshots --------------------------------------------------------------------------------

/// The characters of a string; nullopt for a null pointer or a null handle.
std::optional<std::string> toText(const CMPIString* string);
/// The path's namespace, host, class and keys; nullopt for a null pointer or a null handle.
std::optional<ObjectPathValue> toObjectPathValue(const CMPIObjectPath* path);
/// The instance's properties in order and its object path (for instances of this host, the path
/// that CMPIInstanceFT.getObjectPath would return); nullopt for a null pointer or a null handle.
std::optional<InstanceValue> toInstanceValue(const CMPIInstance* instance);
/// An array value; nullopt for a null pointer or a null handle.
std::optional<Value> toArrayValue(const CMPIArray* array);
/// A CMPIData: a null value when its state says null, else its value.
Value toValue(const CMPIData& data);
/// A value in the form setters receive it: for CMPI_chars `value` is the char* itself, for every
/// other type it points at a CMPIValue. A null `value` gives a null Value of the type.
Value toValue(const CMPIValue* value, CMPIType type);
/// The status with a copy of its message text.
StatusValue toStatusValue(const CMPIStatus& status);

// ---- Objects from values ----------------------------------------------------------------------

CMPIString* makeString(Broker& broker, std::string_view text);
CMPIObjectPath* makeObjectPath(Broker& broker, const ObjectPathValue& path);
/// An instance with the value's path as its creation path and its properties, unfiltered.
CMPIInstance* makeInstance(Broker& broker, const InstanceValue& instance);
/// An array from an array value; null when `array` is not an array value.
CMPIArray* makeArray(Broker& broker, const Value& array);
/// A CMPIData whose strings, paths, instances, arrays and date/times are new objects.
CMPIData makeData(Broker& broker, const Value& value);

}  // namespace cmpihost
