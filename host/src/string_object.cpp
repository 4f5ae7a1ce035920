// CMPIString: the handle points at the NUL-terminated characters, so that CMGetCharPtr (which
// reads the handle directly) and getCharPtr agree.
#include <cstring>

#include "objects.h"
#include "table_support.h"

namespace cmpihost::detail {

namespace {

CMPIStatus stringRelease(CMPIString* string) { return releaseObject<StringObject>(string); }

CMPIString* stringClone(const CMPIString* string, CMPIStatus* rc) {
  return cloneObject<StringObject>(string, rc);
}

char* stringGetCharPtr(const CMPIString* string, CMPIStatus* rc) {
  const auto call = enter<StringObject>(string, "getCharPtr");
  if (!call.usable()) {
    setRc(rc, invalidHandle(call.core, StringObject::kTableName, "getCharPtr"));
    return nullptr;
  }
  setRc(rc, okStatus());
  return static_cast<char*>(call.self->cmpi()->hdl);
}

CMPIStringFT stringTable = {CMPICurrentVersion, stringRelease, stringClone, stringGetCharPtr};

}  // namespace

CMPIStringFT* StringObject::table() { return &stringTable; }

StringObject::StringObject(ObjectScope& scope, std::string_view text)
    : Encapsulated(scope), length_(text.size()), buffer_(new char[kPrefix + text.size() + 1]) {
  StringObject* self = this;
  std::memcpy(buffer_.get(), &self, kPrefix);
  std::memcpy(buffer_.get() + kPrefix, text.data(), text.size());
  buffer_[kPrefix + text.size()] = '\0';
  setHandle(buffer_.get() + kPrefix);
}

StringObject* StringObject::ownerOfHandle(void* handle) {
  StringObject* owner = nullptr;
  std::memcpy(&owner, static_cast<char*>(handle) - kPrefix, kPrefix);
  return owner;
}

}  // namespace cmpihost::detail
