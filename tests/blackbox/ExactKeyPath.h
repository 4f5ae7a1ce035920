// An object path whose keys are looked up by their exact name, for the tests that check how the
// providers find a key whose name a client spelled differently.
#ifndef BLUELIGHT_TESTS_EXACTKEYPATH_H
#define BLUELIGHT_TESTS_EXACTKEYPATH_H

#include <cmpift.h>
#include <cmpimacs.h>

#include <cstring>

namespace blackbox {

// An object path that looks its keys up by exact name, as some object managers do, while the
// keys themselves are those of a path of the host. Only what the provider and the path
// comparison call is forwarded.
class ExactKeyPath {
 public:
  explicit ExactKeyPath(CMPIObjectPath* inner) : inner_(inner) {
    ft_.ftVersion = inner->ft->ftVersion;
    ft_.getNameSpace = [](const CMPIObjectPath* op, CMPIStatus* rc) {
      return CMGetNameSpace(innerOf(op), rc);
    };
    ft_.getHostname = [](const CMPIObjectPath* op, CMPIStatus* rc) {
      return CMGetHostname(innerOf(op), rc);
    };
    ft_.getClassName = [](const CMPIObjectPath* op, CMPIStatus* rc) {
      return CMGetClassName(innerOf(op), rc);
    };
    ft_.getKeyCount = [](const CMPIObjectPath* op, CMPIStatus* rc) {
      return CMGetKeyCount(innerOf(op), rc);
    };
    ft_.getKeyAt = [](const CMPIObjectPath* op, CMPICount index, CMPIString** name,
                      CMPIStatus* rc) { return CMGetKeyAt(innerOf(op), index, name, rc); };
    ft_.getKey = [](const CMPIObjectPath* op, const char* name, CMPIStatus* rc) {
      const CMPICount count = CMGetKeyCount(innerOf(op), nullptr);
      for (CMPICount index = 0; index < count; ++index) {
        CMPIString* keyName = nullptr;
        CMPIData data = CMGetKeyAt(innerOf(op), index, &keyName, nullptr);
        if (keyName != nullptr && std::strcmp(CMGetCharsPtr(keyName, nullptr), name) == 0) {
          if (rc != nullptr) *rc = CMPIStatus{CMPI_RC_OK, nullptr};
          return data;
        }
      }
      if (rc != nullptr) *rc = CMPIStatus{CMPI_RC_ERR_NOT_FOUND, nullptr};
      CMPIData missing{};
      missing.type = CMPI_null;
      missing.state = CMPI_notFound;
      return missing;
    };
    path_.hdl = this;
    path_.ft = &ft_;
  }
  ExactKeyPath(const ExactKeyPath&) = delete;
  ExactKeyPath& operator=(const ExactKeyPath&) = delete;
  ~ExactKeyPath() = default;

  CMPIObjectPath* cmpi() { return &path_; }

 private:
  static CMPIObjectPath* innerOf(const CMPIObjectPath* op) {
    return static_cast<ExactKeyPath*>(op->hdl)->inner_;
  }

  CMPIObjectPath path_{};
  CMPIObjectPathFT ft_{};
  CMPIObjectPath* inner_;
};

}  // namespace blackbox

#endif  // BLUELIGHT_TESTS_EXACTKEYPATH_H
