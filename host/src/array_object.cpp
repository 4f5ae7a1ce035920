// CMPIArray: a fixed number of elements of one type, all null until set.
#include <cmpihost/status.h>

#include "objects.h"
#include "table_support.h"
#include "value_bridge.h"

namespace cmpihost::detail {

namespace {

CMPIType storedElementType(CMPIType type) {
  // Providers may pass the array type (with CMPI_ARRAY) or the element type; both mean the
  // element type here. chars are stored as strings, like everywhere in the host.
  const auto element = static_cast<CMPIType>(type & ~CMPI_ARRAY);
  return element == CMPI_chars ? CMPIType{CMPI_string} : element;
}

std::string indexText(CMPICount index, std::size_t size) {
  return "index " + std::to_string(index) + " is out of range (size " + std::to_string(size) + ")";
}

CMPIStatus arrayRelease(CMPIArray* array) { return releaseObject<ArrayObject>(array); }

CMPIArray* arrayClone(const CMPIArray* array, CMPIStatus* rc) {
  return cloneObject<ArrayObject>(array, rc);
}

CMPICount arrayGetSize(const CMPIArray* array, CMPIStatus* rc) {
  const auto call = enter<ArrayObject>(array, "getSize");
  if (!call.usable()) {
    setRc(rc, invalidHandle(call.core, ArrayObject::kTableName, "getSize"));
    return 0;
  }
  setRc(rc, okStatus());
  return static_cast<CMPICount>(call.self->elements().size());
}

CMPIType arrayGetSimpleType(const CMPIArray* array, CMPIStatus* rc) {
  const auto call = enter<ArrayObject>(array, "getSimpleType");
  if (!call.usable()) {
    setRc(rc, invalidHandle(call.core, ArrayObject::kTableName, "getSimpleType"));
    return CMPI_null;
  }
  setRc(rc, okStatus());
  return call.self->elementType();
}

CMPIData arrayGetElementAt(const CMPIArray* array, CMPICount index, CMPIStatus* rc) {
  const auto call = enter<ArrayObject>(array, "getElementAt", [&](std::vector<std::string>& args) {
    args.push_back(std::to_string(index));
  });
  if (!call.usable()) {
    setRc(rc, invalidHandle(call.core, ArrayObject::kTableName, "getElementAt"));
    return nullData();
  }
  std::vector<Value>& elements = call.self->elements();
  if (index >= elements.size()) {
    setRc(rc, failure(call.core, CMPI_RC_ERR_NO_SUCH_PROPERTY,
                      "CMPIArrayFT.getElementAt: " + indexText(index, elements.size())));
    return nullData(call.self->elementType(), CMPI_notFound);
  }
  setRc(rc, okStatus());
  return toData(elements[index], call.core->targetScope());
}

CMPIStatus arraySetElementAt(CMPIArray* array, CMPICount index, const CMPIValue* value,
                             CMPIType type) {
  const auto call = enter<ArrayObject>(array, "setElementAt", [&](std::vector<std::string>& args) {
    args.push_back(std::to_string(index));
    args.push_back(describeValue(value, type));
    args.push_back(typeName(type));
  });
  if (!call.usable()) return invalidHandle(call.core, ArrayObject::kTableName, "setElementAt");
  std::vector<Value>& elements = call.self->elements();
  if (index >= elements.size()) {
    return failure(call.core, CMPI_RC_ERR_NO_SUCH_PROPERTY,
                   "CMPIArrayFT.setElementAt: " + indexText(index, elements.size()));
  }
  if (type == CMPI_null) {
    elements[index] = Value::null(call.self->elementType());
    return okStatus();
  }
  if (storedElementType(type) != call.self->elementType() || (type & CMPI_ARRAY) != 0) {
    return failure(call.core, CMPI_RC_ERR_TYPE_MISMATCH,
                   "CMPIArrayFT.setElementAt: a " + typeName(type) + " value in an array of " +
                       typeName(call.self->elementType()));
  }
  ReadValue read = readValue(value, type);
  if (!read.ok()) return failure(call.core, read.rc, "CMPIArrayFT.setElementAt: " + read.error);
  elements[index] = std::move(read.value);
  return okStatus();
}

CMPIArrayFT arrayTable = {CMPICurrentVersion, arrayRelease,      arrayClone,       arrayGetSize,
                          arrayGetSimpleType, arrayGetElementAt, arraySetElementAt};

}  // namespace

CMPIArrayFT* ArrayObject::table() { return &arrayTable; }

ArrayObject::ArrayObject(ObjectScope& scope, CMPIType elementType, std::size_t size)
    : Encapsulated(scope), elementType_(storedElementType(elementType)) {
  elements_.assign(size, Value::null(elementType_));
}

ArrayObject::ArrayObject(ObjectScope& scope, const Value& array)
    : Encapsulated(scope), elementType_(storedElementType(array.elementType())) {
  if (array.isArray() && !array.isNull()) elements_ = array.elements();
}

}  // namespace cmpihost::detail
