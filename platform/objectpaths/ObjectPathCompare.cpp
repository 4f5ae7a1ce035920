// Object path equality as the module needs it: "do these two paths name the same instance?"
// Every call into a path may fail or hand back nothing; any such doubt answers "not equal".
#include <cmpidt.h>
#include <cmpift.h>
#include <cmpimacs.h>

#include <cstring>
#include <vector>

#include "KestaCommon.h"
#include "text/Text.h"

namespace Kesta {

namespace {

// References nested in keys are compared recursively; a path that (directly or through others)
// refers to itself must not recurse for ever.
constexpr int kMaxReferenceDepth = 8;
// Real paths have a handful of keys; the limit only bounds the work for a broken path.
constexpr CMPICount kMaxKeys = 256;

bool succeeded(const CMPIStatus& status) { return status.rc == CMPI_RC_OK; }

bool usable(const CMPIObjectPath* path) { return !CMIsNullObject(path) && path->ft != nullptr; }

// The characters of a CMPI string; null when there is no string, no text, or the call fails.
const char* charsOf(const CMPIString* text) {
  if (CMIsNullObject(text) || text->ft == nullptr || text->ft->getCharPtr == nullptr) {
    return nullptr;
  }
  CMPIStatus status = {CMPI_RC_OK, nullptr};
  const char* chars = CMGetCharsPtr(text, &status);
  return succeeded(status) ? chars : nullptr;
}

// A namespace as compared: `present` is false when the path has none (or an empty one).
struct Namespace {
  bool ok = false;
  bool present = false;
  const char* text = nullptr;
};

Namespace namespaceOf(const CMPIObjectPath* path) {
  Namespace result;
  if (path->ft->getNameSpace == nullptr) {
    return result;
  }
  CMPIStatus status = {CMPI_RC_OK, nullptr};
  const CMPIString* text = CMGetNameSpace(path, &status);
  if (!succeeded(status)) {
    return result;
  }
  result.ok = true;
  result.text = charsOf(text);
  result.present = result.text != nullptr && result.text[0] != '\0';
  return result;
}

bool namespacesMatch(const CMPIObjectPath* first, const CMPIObjectPath* second, bool nested) {
  const Namespace a = namespaceOf(first);
  const Namespace b = namespaceOf(second);
  if (!a.ok || !b.ok) {
    return false;
  }
  if (!a.present || !b.present) {
    // Inside a key a reference often carries no namespace, meaning "the same as the outer
    // path"; at the top level an empty namespace only equals another empty one.
    return nested || a.present == b.present;
  }
  return platform::equalsIgnoringCase(a.text, b.text);
}

bool classNamesMatch(const CMPIObjectPath* first, const CMPIObjectPath* second) {
  if (first->ft->getClassName == nullptr || second->ft->getClassName == nullptr) {
    return false;
  }
  CMPIStatus status = {CMPI_RC_OK, nullptr};
  const char* a = charsOf(CMGetClassName(first, &status));
  if (!succeeded(status) || a == nullptr) {
    return false;
  }
  status = {CMPI_RC_OK, nullptr};
  const char* b = charsOf(CMGetClassName(second, &status));
  if (!succeeded(status) || b == nullptr) {
    return false;
  }
  return platform::equalsIgnoringCase(a, b);
}

struct Key {
  const char* name;
  CMPIData value;
};

// All keys of `path` with their names, or false when any of them cannot be read or two names
// differ only in case (such a path names no instance unambiguously).
bool readKeys(const CMPIObjectPath* path, std::vector<Key>& keys) {
  if (path->ft->getKeyCount == nullptr || path->ft->getKeyAt == nullptr) {
    return false;
  }
  CMPIStatus status = {CMPI_RC_OK, nullptr};
  const CMPICount count = CMGetKeyCount(path, &status);
  if (!succeeded(status) || count > kMaxKeys) {
    return false;
  }
  keys.reserve(count);
  for (CMPICount index = 0; index < count; ++index) {
    CMPIString* name = nullptr;
    status = {CMPI_RC_OK, nullptr};
    const CMPIData value = CMGetKeyAt(path, index, &name, &status);
    const char* nameText = charsOf(name);
    if (!succeeded(status) || nameText == nullptr) {
      return false;
    }
    for (const Key& earlier : keys) {
      if (platform::equalsIgnoringCase(earlier.name, nameText)) {
        return false;
      }
    }
    keys.push_back({nameText, value});
  }
  return true;
}

enum class ValueKind { kString, kUnsigned, kSigned, kBoolean, kReference, kOther };

ValueKind kindOf(CMPIType type) {
  switch (type) {
    case CMPI_chars:
    case CMPI_string:
      return ValueKind::kString;
    case CMPI_uint8:
    case CMPI_uint16:
    case CMPI_uint32:
    case CMPI_uint64:
      return ValueKind::kUnsigned;
    case CMPI_sint8:
    case CMPI_sint16:
    case CMPI_sint32:
    case CMPI_sint64:
      return ValueKind::kSigned;
    case CMPI_boolean:
      return ValueKind::kBoolean;
    case CMPI_ref:
      return ValueKind::kReference;
    default:
      return ValueKind::kOther;
  }
}

const char* stringOf(const CMPIData& data) {
  return data.type == CMPI_chars ? data.value.chars : charsOf(data.value.string);
}

unsigned long long unsignedOf(const CMPIData& data) {
  switch (data.type) {
    case CMPI_uint8:
      return data.value.uint8;
    case CMPI_uint16:
      return data.value.uint16;
    case CMPI_uint32:
      return data.value.uint32;
    default:
      return data.value.uint64;
  }
}

long long signedOf(const CMPIData& data) {
  switch (data.type) {
    case CMPI_sint8:
      return data.value.sint8;
    case CMPI_sint16:
      return data.value.sint16;
    case CMPI_sint32:
      return data.value.sint32;
    default:
      return data.value.sint64;
  }
}

// Integers compare by value, whatever their width and signedness: uint8 5 equals sint64 5.
bool integersEqual(const CMPIData& first, const CMPIData& second) {
  const bool firstSigned = kindOf(first.type) == ValueKind::kSigned;
  const bool secondSigned = kindOf(second.type) == ValueKind::kSigned;
  if (firstSigned && secondSigned) {
    return signedOf(first) == signedOf(second);
  }
  if (!firstSigned && !secondSigned) {
    return unsignedOf(first) == unsignedOf(second);
  }
  const long long signedValue = firstSigned ? signedOf(first) : signedOf(second);
  const unsigned long long unsignedValue = firstSigned ? unsignedOf(second) : unsignedOf(first);
  return signedValue >= 0 && static_cast<unsigned long long>(signedValue) == unsignedValue;
}

bool pathsEqual(const CMPIObjectPath* first, const CMPIObjectPath* second, bool compareNamespaces,
                int depth);

bool valuesEqual(const CMPIData& first, const CMPIData& second, bool compareNamespaces, int depth) {
  constexpr CMPIValueState kNoValue = CMPI_nullValue | CMPI_notFound | CMPI_badValue;
  if ((first.state & kNoValue) != 0 || (second.state & kNoValue) != 0) {
    return false;
  }
  const ValueKind kind = kindOf(first.type);
  const ValueKind otherKind = kindOf(second.type);
  const bool bothIntegers = (kind == ValueKind::kSigned || kind == ValueKind::kUnsigned) &&
                            (otherKind == ValueKind::kSigned || otherKind == ValueKind::kUnsigned);
  if (bothIntegers) {
    return integersEqual(first, second);
  }
  if (kind != otherKind) {
    return false;
  }
  switch (kind) {
    case ValueKind::kString: {
      const char* a = stringOf(first);
      const char* b = stringOf(second);
      return a != nullptr && b != nullptr && std::strcmp(a, b) == 0;
    }
    case ValueKind::kBoolean:
      return (first.value.boolean != 0) == (second.value.boolean != 0);
    case ValueKind::kReference:
      return pathsEqual(first.value.ref, second.value.ref, compareNamespaces, depth + 1);
    default:
      return false;
  }
}

bool pathsEqual(const CMPIObjectPath* first, const CMPIObjectPath* second, bool compareNamespaces,
                int depth) {
  if (depth > kMaxReferenceDepth || !usable(first) || !usable(second)) {
    return false;
  }
  if (!classNamesMatch(first, second)) {
    return false;
  }
  if (compareNamespaces && !namespacesMatch(first, second, depth > 0)) {
    return false;
  }
  std::vector<Key> firstKeys;
  std::vector<Key> secondKeys;
  if (!readKeys(first, firstKeys) || !readKeys(second, secondKeys) ||
      firstKeys.size() != secondKeys.size()) {
    return false;
  }
  // Keys are matched by scanning both lists rather than with getKey, because a broker may look
  // names up case-sensitively while CIM names are not. Names are unique within each path and the
  // counts are equal, so finding every key of the first path in the second proves the two sets
  // of names equal.
  for (const Key& key : firstKeys) {
    const Key* match = nullptr;
    for (const Key& candidate : secondKeys) {
      if (platform::equalsIgnoringCase(key.name, candidate.name)) {
        match = &candidate;
        break;
      }
    }
    if (match == nullptr || !valuesEqual(key.value, match->value, compareNamespaces, depth)) {
      return false;
    }
  }
  return true;
}

}  // namespace

bool isObjPathsEqual(const CMPIObjectPath* first, const CMPIObjectPath* second,
                     bool compareNamespaces) {
  try {
    return pathsEqual(first, second, compareNamespaces, 0);
  } catch (...) {
    // Only the small key lists allocate; without memory nothing can be proven equal.
    return false;
  }
}

}  // namespace Kesta
