#include <cmpihost/broker.h>
#include <cmpihost/convert.h>

#include "broker_core.h"
#include "objects.h"
#include "value_bridge.h"

namespace cmpihost {

using detail::ArrayObject;
using detail::InstanceObject;
using detail::ObjectPathObject;
using detail::StringObject;

// Objects of this host are read directly; objects of another broker through their tables, with
// every slot checked before it is called.

std::optional<std::string> toText(const CMPIString* string) {
  if (string == nullptr || string->hdl == nullptr) return std::nullopt;
  if (string->ft == StringObject::table()) {
    // One of ours: read directly; a copy of the struct is not an object of ours and unreadable.
    const StringObject* ours = StringObject::from(string);
    if (ours == nullptr) return std::nullopt;
    return std::string(ours->text());
  }
  const char* chars = nullptr;
  if (string->ft != nullptr && string->ft->getCharPtr != nullptr) {
    CMPIStatus rc{CMPI_RC_OK, nullptr};
    chars = string->ft->getCharPtr(string, &rc);
  } else {
    chars = static_cast<const char*>(string->hdl);
  }
  if (chars == nullptr) return std::nullopt;
  return std::string(chars);
}

std::optional<ObjectPathValue> toObjectPathValue(const CMPIObjectPath* path) {
  if (path == nullptr || path->hdl == nullptr) return std::nullopt;
  if (path->ft == ObjectPathObject::table()) {
    ObjectPathObject* ours = ObjectPathObject::from(path);
    if (ours == nullptr) return std::nullopt;
    return ours->path();
  }
  const CMPIObjectPathFT* ft = path->ft;
  if (ft == nullptr) return std::nullopt;
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  ObjectPathValue value;
  if (ft->getNameSpace != nullptr) {
    value.setNameSpace(toText(ft->getNameSpace(path, &rc)).value_or(std::string()));
  }
  if (ft->getHostname != nullptr) {
    value.setHost(toText(ft->getHostname(path, &rc)).value_or(std::string()));
  }
  if (ft->getClassName != nullptr) {
    value.setClassName(toText(ft->getClassName(path, &rc)).value_or(std::string()));
  }
  if (ft->getKeyCount != nullptr && ft->getKeyAt != nullptr) {
    const CMPICount count = ft->getKeyCount(path, &rc);
    for (CMPICount i = 0; i < count; ++i) {
      CMPIString* name = nullptr;
      const CMPIData data = ft->getKeyAt(path, i, &name, &rc);
      value.addKey(toText(name).value_or(std::string()), toValue(data));
    }
  }
  return value;
}

std::optional<InstanceValue> toInstanceValue(const CMPIInstance* instance) {
  if (instance == nullptr || instance->hdl == nullptr) return std::nullopt;
  if (instance->ft == InstanceObject::table()) {
    const InstanceObject* ours = InstanceObject::from(instance);
    if (ours == nullptr) return std::nullopt;
    return ours->snapshot();
  }
  const CMPIInstanceFT* ft = instance->ft;
  if (ft == nullptr) return std::nullopt;
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  InstanceValue value;
  if (ft->getObjectPath != nullptr) {
    if (std::optional<ObjectPathValue> path = toObjectPathValue(ft->getObjectPath(instance, &rc))) {
      value.setPath(std::move(*path));
    }
  }
  if (ft->getPropertyCount != nullptr && ft->getPropertyAt != nullptr) {
    const CMPICount count = ft->getPropertyCount(instance, &rc);
    for (CMPICount i = 0; i < count; ++i) {
      CMPIString* name = nullptr;
      const CMPIData data = ft->getPropertyAt(instance, i, &name, &rc);
      value.set(toText(name).value_or(std::string()), toValue(data));
    }
  }
  return value;
}

std::optional<Value> toArrayValue(const CMPIArray* array) {
  if (array == nullptr || array->hdl == nullptr) return std::nullopt;
  if (array->ft == ArrayObject::table()) {
    const ArrayObject* ours = ArrayObject::from(array);
    if (ours == nullptr) return std::nullopt;
    return ours->toValue();
  }
  const CMPIArrayFT* ft = array->ft;
  if (ft == nullptr || ft->getSize == nullptr || ft->getSimpleType == nullptr ||
      ft->getElementAt == nullptr) {
    return std::nullopt;
  }
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  const CMPICount size = ft->getSize(array, &rc);
  const CMPIType elementType = ft->getSimpleType(array, &rc);
  std::vector<Value> elements;
  elements.reserve(size);
  for (CMPICount i = 0; i < size; ++i) elements.push_back(toValue(ft->getElementAt(array, i, &rc)));
  return Value::array(elementType, std::move(elements));
}

Value toValue(const CMPIData& data) {
  const CMPIType type = data.type;
  if ((data.state & (CMPI_nullValue | CMPI_notFound | CMPI_badValue)) != 0) {
    return Value::null(type);
  }
  if ((type & CMPI_ARRAY) != 0) {
    return toArrayValue(data.value.array).value_or(Value::null(type));
  }
  switch (type) {
    case CMPI_chars:
      return Value(static_cast<const char*>(data.value.chars));
    case CMPI_string: {
      std::optional<std::string> text = toText(data.value.string);
      return text ? Value::string(std::move(*text)) : Value::null(CMPI_string);
    }
    case CMPI_ref: {
      std::optional<ObjectPathValue> path = toObjectPathValue(data.value.ref);
      return path ? Value::reference(std::move(*path)) : Value::null(CMPI_ref);
    }
    case CMPI_instance: {
      std::optional<InstanceValue> instance = toInstanceValue(data.value.inst);
      return instance ? Value::instance(std::move(*instance)) : Value::null(CMPI_instance);
    }
    case CMPI_dateTime: {
      std::string text = detail::dateTimeText(data.value.dateTime);
      return text.empty() ? Value::null(CMPI_dateTime) : Value::dateTime(std::move(text));
    }
    default:
      break;
  }
  // Scalars: read them the way setters are read, which knows every scalar type.
  const detail::ReadValue scalar = detail::readValue(&data.value, type);
  return scalar.ok() ? scalar.value : Value::null(type);
}

Value toValue(const CMPIValue* value, CMPIType type) {
  if (value == nullptr) return Value::null(type);
  const detail::ReadValue read = detail::readValue(value, type);
  return read.ok() ? read.value : Value::null(type);
}

StatusValue toStatusValue(const CMPIStatus& status) {
  return StatusValue(status.rc, toText(status.msg));
}

// ---- Objects from values --------------------------------------------------------------------

CMPIString* makeString(Broker& broker, std::string_view text) {
  return broker.core().targetScope().make<StringObject>(std::string(text))->cmpi();
}

CMPIObjectPath* makeObjectPath(Broker& broker, const ObjectPathValue& path) {
  return broker.core().targetScope().make<ObjectPathObject>(path)->cmpi();
}

CMPIInstance* makeInstance(Broker& broker, const InstanceValue& instance) {
  return broker.core().targetScope().make<InstanceObject>(instance)->cmpi();
}

CMPIArray* makeArray(Broker& broker, const Value& array) {
  if (!array.isArray() || array.isNull()) return nullptr;
  return broker.core().targetScope().make<ArrayObject>(array)->cmpi();
}

CMPIData makeData(Broker& broker, const Value& value) {
  return detail::toData(value, broker.core().targetScope());
}

}  // namespace cmpihost
