// CMPIEnumeration: what the enumeration up-calls return. Items are kept as values; getNext makes
// the object for the item in the current scope.
#include <cmpihost/status.h>

#include "objects.h"
#include "table_support.h"
#include "value_bridge.h"

namespace cmpihost::detail {

namespace {

constexpr const char* kTable = EnumerationObject::kTableName;

CMPIStatus enumerationRelease(CMPIEnumeration* enumeration) {
  return releaseObject<EnumerationObject>(enumeration);
}

CMPIEnumeration* enumerationClone(const CMPIEnumeration* enumeration, CMPIStatus* rc) {
  return cloneObject<EnumerationObject>(enumeration, rc);
}

CMPIData enumerationGetNext(const CMPIEnumeration* enumeration, CMPIStatus* rc) {
  const auto call = enter<EnumerationObject>(enumeration, "getNext");
  if (!call.usable()) {
    setRc(rc, invalidHandle(call.core, kTable, "getNext"));
    return nullData();
  }
  const Value* item = call.self->next();
  if (item == nullptr) {
    setRc(rc, failure(call.core, CMPI_RC_ERR_NOT_FOUND,
                      std::string(kTable) + ".getNext: the enumeration has no more elements"));
    return nullData(call.self->itemType(), CMPI_notFound);
  }
  setRc(rc, okStatus());
  return toData(*item, call.core->targetScope());
}

CMPIBoolean enumerationHasNext(const CMPIEnumeration* enumeration, CMPIStatus* rc) {
  const auto call = enter<EnumerationObject>(enumeration, "hasNext");
  if (!call.usable()) {
    setRc(rc, invalidHandle(call.core, kTable, "hasNext"));
    return 0;
  }
  setRc(rc, okStatus());
  return call.self->hasNext() ? 1 : 0;
}

CMPIArray* enumerationToArray(const CMPIEnumeration* enumeration, CMPIStatus* rc) {
  const auto call = enter<EnumerationObject>(enumeration, "toArray");
  if (!call.usable()) {
    setRc(rc, invalidHandle(call.core, kTable, "toArray"));
    return nullptr;
  }
  setRc(rc, okStatus());
  // All items, also those already read with getNext, as object managers do.
  const Value array = Value::array(call.self->itemType(), call.self->items());
  return call.core->targetScope().make<ArrayObject>(array)->cmpi();
}

CMPIEnumerationFT enumerationTable = {CMPICurrentVersion, enumerationRelease, enumerationClone,
                                      enumerationGetNext, enumerationHasNext, enumerationToArray};

}  // namespace

CMPIEnumerationFT* EnumerationObject::table() { return &enumerationTable; }

EnumerationObject::EnumerationObject(ObjectScope& scope, CMPIType itemType,
                                     std::vector<Value> items)
    : Encapsulated(scope), itemType_(itemType), items_(std::move(items)) {}

const Value* EnumerationObject::next() {
  if (next_ >= items_.size()) return nullptr;
  return &items_[next_++];
}

EnumerationObject* EnumerationObject::cloneInto(ObjectScope& scope) const {
  EnumerationObject* copy = scope.make<EnumerationObject>(itemType_, items_);
  copy->next_ = next_;
  return copy;
}

}  // namespace cmpihost::detail
