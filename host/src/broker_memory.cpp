// CMPIBrokerMemFT: broker-managed memory and early freeing. Everything here works on the scope
// of the current request (or the broker's own), so memory a provider forgets is still freed when
// the request ends.
#include <cstring>
#include <limits>

#include "broker_core.h"
#include "objects.h"
#include "table_support.h"
#include "text.h"

namespace cmpihost::detail {

GcMark::GcMark(ObjectScope& scope, std::uint64_t sequence)
    : ManagedObject(scope), sequence_(sequence) {
  core().rememberMark(this);
}

GcMark::~GcMark() { core().forgetMark(this); }

namespace {

using Args = std::vector<std::string>;
constexpr const char* kTable = "CMPIBrokerMemFT";

CMPIGcStat* mark(const CMPIBroker* broker, CMPIStatus* rc) {
  BrokerCore* core = enterBroker(broker, kTable, "mark", [](Args&) {});
  if (core == nullptr) {
    setRc(rc, invalidBroker());
    return nullptr;
  }
  ObjectScope& scope = core->targetScope();
  // The mark is the first object of the region it opens, so release() frees it along with it.
  GcMark* gcMark = scope.make<GcMark>(scope.nextSequence());
  setRc(rc, okStatus());
  return gcMark;
}

CMPIStatus release(const CMPIBroker* broker, const CMPIGcStat* gc) {
  BrokerCore* core = enterBroker(broker, kTable, "release", [&](Args& args) {
    args.push_back(gc != nullptr ? "mark" : "NULL");
  });
  if (core == nullptr) return invalidBroker();
  if (gc == nullptr || !core->isMark(gc)) {
    return failure(core, CMPI_RC_ERR_INVALID_PARAMETER,
                   std::string(kTable) + ".release: not a mark of this broker");
  }
  const auto* gcMark = static_cast<const GcMark*>(gc);
  gcMark->scope().destroyFrom(gcMark->sequence());
  return okStatus();
}

void* cmpiMalloc(const CMPIBroker* broker, size_t size) {
  BrokerCore* core = enterBroker(broker, kTable, "cmpiMalloc",
                                 [&](Args& args) { args.push_back(std::to_string(size)); });
  return core != nullptr ? core->targetScope().allocate(size, false) : nullptr;
}

void* cmpiCalloc(const CMPIBroker* broker, size_t count, size_t size) {
  BrokerCore* core = enterBroker(broker, kTable, "cmpiCalloc", [&](Args& args) {
    args.push_back(std::to_string(count));
    args.push_back(std::to_string(size));
  });
  if (core == nullptr) return nullptr;
  if (size != 0 && count > std::numeric_limits<size_t>::max() / size) return nullptr;
  return core->targetScope().allocate(count * size, true);
}

void* cmpiRealloc(const CMPIBroker* broker, void* address, size_t size) {
  BrokerCore* core = enterBroker(broker, kTable, "cmpiRealloc",
                                 [&](Args& args) { args.push_back(std::to_string(size)); });
  if (core == nullptr) return nullptr;
  if (address == nullptr) return core->targetScope().allocate(size, false);
  bool found = false;
  void* moved = core->targetScope().reallocate(address, size, found);
  if (!found) moved = core->rootScope().reallocate(address, size, found);
  return moved;
}

char* cmpiStrDup(const CMPIBroker* broker, const char* text) {
  BrokerCore* core = enterBroker(broker, kTable, "cmpiStrDup",
                                 [&](Args& args) { args.push_back(textOrNull(text)); });
  if (core == nullptr || text == nullptr) return nullptr;
  const std::size_t size = std::strlen(text) + 1;
  auto* copy = static_cast<char*>(core->targetScope().allocate(size, false));
  if (copy != nullptr) std::memcpy(copy, text, size);
  return copy;
}

void cmpiFree(const CMPIBroker* broker, void* address) {
  BrokerCore* core = enterBroker(broker, kTable, "cmpiFree", [](Args&) {});
  if (core == nullptr || address == nullptr) return;
  // Memory from outside the request (the broker's own) may be freed inside it too.
  if (!core->targetScope().freeMemory(address)) core->rootScope().freeMemory(address);
}

// The free* functions are CMRelease by another name; they report nothing.
template <class Self>
void freeObject(const CMPIBroker* broker, const char* function, typename Self::CmpiType* object) {
  BrokerCore* core = enterBroker(broker, kTable, function,
                                 [&](Args& args) { args.push_back(describeObject(object)); });
  if (core == nullptr) return;
  Self* self = Self::from(object);
  if (self != nullptr && self->hasHandle()) self->scope().destroy(self);
}

void freeInstance(const CMPIBroker* broker, CMPIInstance* instance) {
  freeObject<InstanceObject>(broker, "freeInstance", instance);
}
void freeObjectPath(const CMPIBroker* broker, CMPIObjectPath* path) {
  freeObject<ObjectPathObject>(broker, "freeObjectPath", path);
}
void freeArgs(const CMPIBroker* broker, CMPIArgs* args) {
  freeObject<ArgsObject>(broker, "freeArgs", args);
}
void freeString(const CMPIBroker* broker, CMPIString* string) {
  freeObject<StringObject>(broker, "freeString", string);
}
void freeArray(const CMPIBroker* broker, CMPIArray* array) {
  freeObject<ArrayObject>(broker, "freeArray", array);
}
void freeDateTime(const CMPIBroker* broker, CMPIDateTime* dateTime) {
  freeObject<DateTimeObject>(broker, "freeDateTime", dateTime);
}
// The host makes no select expressions, so there is never one of ours to free.
void freeSelectExp(const CMPIBroker* broker, CMPISelectExp* /*expression*/) {
  enterBroker(broker, kTable, "freeSelectExp", [](Args&) {});
}

}  // namespace

CMPIBrokerMemFT makeMemoryTable(int version) {
  CMPIBrokerMemFT table = {version,     mark,       release,   cmpiMalloc,   cmpiCalloc,
                           cmpiRealloc, cmpiStrDup, cmpiFree,  freeInstance, freeObjectPath,
                           freeArgs,    freeString, freeArray, freeDateTime, freeSelectExp};
  return table;
}

}  // namespace cmpihost::detail
