#include "value_bridge.h"

#include <cmpihost/convert.h>
#include <cmpihost/status.h>

#include "datetime.h"
#include "objects.h"

namespace cmpihost::detail {

namespace {

CMPIType normalized(CMPIType type) {
  if (type == CMPI_chars) return CMPI_string;
  if (type == CMPI_charsA) return CMPI_stringA;
  return type;
}

ReadValue failed(CMPIrc rc, std::string error) {
  ReadValue result;
  result.rc = rc;
  result.error = std::move(error);
  return result;
}

ReadValue read(Value value) {
  ReadValue result;
  result.value = std::move(value);
  return result;
}

// The encapsulated member of a CMPIValue: null pointer and null handle are errors.
template <class CType>
const char* checkObject(const CType* object) {
  if (object == nullptr) return "the value holds a NULL object";
  if (object->hdl == nullptr) return "the value holds an object with a null handle";
  return nullptr;
}

ReadValue readArray(const CMPIArray* array, CMPIType type) {
  if (array == nullptr) return failed(CMPI_RC_ERR_INVALID_PARAMETER, "the array is NULL");
  if (array->hdl == nullptr) {
    return failed(CMPI_RC_ERR_INVALID_HANDLE, "the array has a null handle");
  }
  std::optional<Value> value = toArrayValue(array);
  if (!value) return failed(CMPI_RC_ERR_INVALID_HANDLE, "the array cannot be read");
  const CMPIType wanted = normalized(static_cast<CMPIType>(type & ~CMPI_ARRAY));
  // A bare CMPI_ARRAY accepts an array of any element type.
  if (wanted != CMPI_null && value->elementType() != wanted) {
    return failed(CMPI_RC_ERR_TYPE_MISMATCH, "an array of " + typeName(value->elementType()) +
                                                 " was passed as " + typeName(type));
  }
  return read(std::move(*value));
}

}  // namespace

ReadValue readValue(const CMPIValue* value, CMPIType type) {
  if (type == CMPI_null) return read(Value::null());
  if (value == nullptr) return failed(CMPI_RC_ERR_INVALID_PARAMETER, "the value is NULL");
  if ((type & CMPI_ARRAY) != 0) return readArray(value->array, type);

  switch (type) {
    case CMPI_chars:
      return read(Value::string(reinterpret_cast<const char*>(value)));
    case CMPI_boolean:
      return read(Value::boolean(value->boolean != 0));
    case CMPI_char16:
      return read(Value::char16(value->char16));
    case CMPI_uint8:
      return read(Value::uint8(value->uint8));
    case CMPI_uint16:
      return read(Value::uint16(value->uint16));
    case CMPI_uint32:
      return read(Value::uint32(value->uint32));
    case CMPI_uint64:
      return read(Value::uint64(value->uint64));
    case CMPI_sint8:
      return read(Value::sint8(value->sint8));
    case CMPI_sint16:
      return read(Value::sint16(value->sint16));
    case CMPI_sint32:
      return read(Value::sint32(value->sint32));
    case CMPI_sint64:
      return read(Value::sint64(value->sint64));
    case CMPI_real32:
      return read(Value::real32(value->real32));
    case CMPI_real64:
      return read(Value::real64(value->real64));
    case CMPI_string: {
      if (const char* problem = checkObject(value->string)) {
        return failed(
            value->string == nullptr ? CMPI_RC_ERR_INVALID_PARAMETER : CMPI_RC_ERR_INVALID_HANDLE,
            problem);
      }
      std::optional<std::string> text = toText(value->string);
      return text ? read(Value::string(std::move(*text))) : read(Value::null(CMPI_string));
    }
    case CMPI_ref: {
      if (const char* problem = checkObject(value->ref)) {
        return failed(
            value->ref == nullptr ? CMPI_RC_ERR_INVALID_PARAMETER : CMPI_RC_ERR_INVALID_HANDLE,
            problem);
      }
      std::optional<ObjectPathValue> path = toObjectPathValue(value->ref);
      if (!path) return failed(CMPI_RC_ERR_INVALID_HANDLE, "the object path cannot be read");
      return read(Value::reference(std::move(*path)));
    }
    case CMPI_instance: {
      if (const char* problem = checkObject(value->inst)) {
        return failed(
            value->inst == nullptr ? CMPI_RC_ERR_INVALID_PARAMETER : CMPI_RC_ERR_INVALID_HANDLE,
            problem);
      }
      std::optional<InstanceValue> instance = toInstanceValue(value->inst);
      if (!instance) return failed(CMPI_RC_ERR_INVALID_HANDLE, "the instance cannot be read");
      return read(Value::instance(std::move(*instance)));
    }
    case CMPI_dateTime: {
      if (const char* problem = checkObject(value->dateTime)) {
        return failed(
            value->dateTime == nullptr ? CMPI_RC_ERR_INVALID_PARAMETER : CMPI_RC_ERR_INVALID_HANDLE,
            problem);
      }
      std::string text = dateTimeText(value->dateTime);
      if (text.empty()) return failed(CMPI_RC_ERR_INVALID_HANDLE, "the date/time cannot be read");
      return read(Value::dateTime(std::move(text)));
    }
    default:
      return failed(CMPI_RC_ERR_INVALID_DATA_TYPE,
                    "values of type " + typeName(type) + " are not supported");
  }
}

CMPIData toData(const Value& value, ObjectScope& scope, CMPIValueState state) {
  CMPIData data{};
  data.type = value.type();
  data.state = state;
  data.value.uint64 = 0;
  if (value.isNull()) {
    data.state = static_cast<CMPIValueState>(data.state | CMPI_nullValue);
    return data;
  }
  if (value.isArray()) {
    data.value.array = scope.make<ArrayObject>(value)->cmpi();
    return data;
  }
  switch (value.type()) {
    case CMPI_boolean:
      data.value.boolean = value.asBoolean() ? 1 : 0;
      break;
    case CMPI_char16:
      data.value.char16 = static_cast<CMPIChar16>(value.asUnsigned());
      break;
    case CMPI_uint8:
      data.value.uint8 = static_cast<CMPIUint8>(value.asUnsigned());
      break;
    case CMPI_uint16:
      data.value.uint16 = static_cast<CMPIUint16>(value.asUnsigned());
      break;
    case CMPI_uint32:
      data.value.uint32 = static_cast<CMPIUint32>(value.asUnsigned());
      break;
    case CMPI_uint64:
      data.value.uint64 = value.asUnsigned();
      break;
    case CMPI_sint8:
      data.value.sint8 = static_cast<CMPISint8>(value.asSigned());
      break;
    case CMPI_sint16:
      data.value.sint16 = static_cast<CMPISint16>(value.asSigned());
      break;
    case CMPI_sint32:
      data.value.sint32 = static_cast<CMPISint32>(value.asSigned());
      break;
    case CMPI_sint64:
      data.value.sint64 = value.asSigned();
      break;
    case CMPI_real32:
      data.value.real32 = static_cast<CMPIReal32>(value.asReal());
      break;
    case CMPI_real64:
      data.value.real64 = value.asReal();
      break;
    case CMPI_string:
      data.value.string = scope.make<StringObject>(value.asString())->cmpi();
      break;
    case CMPI_ref:
      data.value.ref = scope.make<ObjectPathObject>(value.asReference())->cmpi();
      break;
    case CMPI_instance:
      data.value.inst = scope.make<InstanceObject>(value.asInstance())->cmpi();
      break;
    case CMPI_dateTime: {
      const std::optional<DateTimeParts> parts = parseCimDateTime(value.asString());
      if (!parts) {
        data.state = static_cast<CMPIValueState>(data.state | CMPI_nullValue | CMPI_badValue);
        break;
      }
      data.value.dateTime = scope.make<DateTimeObject>(parts->micros, parts->interval)->cmpi();
      break;
    }
    default:
      data.state = static_cast<CMPIValueState>(data.state | CMPI_nullValue);
      break;
  }
  return data;
}

std::string dateTimeText(const CMPIDateTime* dateTime) {
  if (dateTime == nullptr || dateTime->hdl == nullptr) return std::string();
  if (dateTime->ft == DateTimeObject::table()) {
    const DateTimeObject* ours = DateTimeObject::from(dateTime);
    return ours != nullptr ? ours->text() : std::string();
  }
  if (dateTime->ft == nullptr || dateTime->ft->getStringFormat == nullptr) return std::string();
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  const CMPIString* text = dateTime->ft->getStringFormat(dateTime, &rc);
  return toText(text).value_or(std::string());
}

}  // namespace cmpihost::detail
