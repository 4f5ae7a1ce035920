// CMPIDateTime: a point in time (microseconds since 1970, UTC) or an interval.
#include "datetime.h"
#include "objects.h"
#include "table_support.h"

namespace cmpihost::detail {

namespace {

constexpr const char* kTable = DateTimeObject::kTableName;

CMPIStatus dateTimeRelease(CMPIDateTime* dateTime) {
  return releaseObject<DateTimeObject>(dateTime);
}

CMPIDateTime* dateTimeClone(const CMPIDateTime* dateTime, CMPIStatus* rc) {
  return cloneObject<DateTimeObject>(dateTime, rc);
}

CMPIUint64 dateTimeGetBinaryFormat(const CMPIDateTime* dateTime, CMPIStatus* rc) {
  const auto call = enter<DateTimeObject>(dateTime, "getBinaryFormat");
  if (!call.usable()) {
    setRc(rc, invalidHandle(call.core, kTable, "getBinaryFormat"));
    return 0;
  }
  setRc(rc, okStatus());
  return call.self->micros();
}

CMPIString* dateTimeGetStringFormat(const CMPIDateTime* dateTime, CMPIStatus* rc) {
  const auto call = enter<DateTimeObject>(dateTime, "getStringFormat");
  if (!call.usable()) {
    setRc(rc, invalidHandle(call.core, kTable, "getStringFormat"));
    return nullptr;
  }
  setRc(rc, okStatus());
  return call.core->targetScope().make<StringObject>(call.self->text())->cmpi();
}

CMPIBoolean dateTimeIsInterval(const CMPIDateTime* dateTime, CMPIStatus* rc) {
  const auto call = enter<DateTimeObject>(dateTime, "isInterval");
  if (!call.usable()) {
    setRc(rc, invalidHandle(call.core, kTable, "isInterval"));
    return 0;
  }
  setRc(rc, okStatus());
  return call.self->interval() ? 1 : 0;
}

CMPIDateTimeFT dateTimeTable = {CMPICurrentVersion,      dateTimeRelease,
                                dateTimeClone,           dateTimeGetBinaryFormat,
                                dateTimeGetStringFormat, dateTimeIsInterval};

}  // namespace

CMPIDateTimeFT* DateTimeObject::table() { return &dateTimeTable; }

DateTimeObject::DateTimeObject(ObjectScope& scope, CMPIUint64 micros, bool interval)
    : Encapsulated(scope), micros_(micros), interval_(interval) {}

std::string DateTimeObject::text() const { return formatCimDateTime(micros_, interval_); }

}  // namespace cmpihost::detail
