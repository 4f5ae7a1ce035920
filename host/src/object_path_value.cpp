#include <cmpihost/value.h>

#include <algorithm>
#include <cctype>
#include <cerrno>
#include <cstdlib>
#include <utility>

#include "text.h"

namespace cmpihost {

ObjectPathValue::ObjectPathValue(std::string nameSpace, std::string className)
    : nameSpace_(std::move(nameSpace)), className_(std::move(className)) {}

ObjectPathValue& ObjectPathValue::setNameSpace(std::string nameSpace) {
  nameSpace_ = std::move(nameSpace);
  return *this;
}

ObjectPathValue& ObjectPathValue::setHost(std::string host) {
  host_ = std::move(host);
  return *this;
}

ObjectPathValue& ObjectPathValue::setClassName(std::string className) {
  className_ = std::move(className);
  return *this;
}

ObjectPathValue& ObjectPathValue::addKey(std::string name, Value value) {
  for (KeyBinding& key : keys_) {
    if (equalsIgnoringCase(key.name, name)) {
      key.value = std::move(value);
      return *this;
    }
  }
  keys_.push_back(KeyBinding{std::move(name), std::move(value)});
  return *this;
}

bool ObjectPathValue::removeKey(std::string_view name) {
  const auto it = std::find_if(keys_.begin(), keys_.end(), [&](const KeyBinding& key) {
    return equalsIgnoringCase(key.name, name);
  });
  if (it == keys_.end()) return false;
  keys_.erase(it);
  return true;
}

ObjectPathValue& ObjectPathValue::clearKeys() {
  keys_.clear();
  return *this;
}

const Value* ObjectPathValue::findKey(std::string_view name) const {
  for (const KeyBinding& key : keys_) {
    if (equalsIgnoringCase(key.name, name)) return &key.value;
  }
  return nullptr;
}

namespace {

std::string keyValueText(const Value& value) {
  if (value.isNull() || value.isArray()) return value.toString();
  switch (value.type()) {
    case CMPI_string:
    case CMPI_dateTime:
      return detail::quoted(value.asString());
    case CMPI_ref:
      return detail::quoted(value.asReference().toString());
    default:
      return value.toString();
  }
}

}  // namespace

std::string ObjectPathValue::toString(PathText form) const {
  std::string text;
  if (form == PathText::Full && !host_.empty()) text += "//" + host_ + "/";
  if (form != PathText::ClassAndKeys && !nameSpace_.empty()) text += nameSpace_ + ":";
  text += className_;
  bool first = true;
  for (const KeyBinding& key : keys_) {
    text += first ? "." : ",";
    first = false;
    text += key.name + "=" + keyValueText(key.value);
  }
  return text;
}

// ---- Reading the text form -----------------------------------------------------------------

namespace {

bool isNameChar(char c) { return std::isalnum(static_cast<unsigned char>(c)) || c == '_'; }

bool isName(std::string_view text) {
  return !text.empty() && std::all_of(text.begin(), text.end(), isNameChar);
}

bool isNameSpace(std::string_view text) {
  return !text.empty() &&
         std::all_of(text.begin(), text.end(), [](char c) { return isNameChar(c) || c == '/'; });
}

// Reads a quoted value starting at text[pos] == '"'; leaves pos after the closing quote.
std::optional<std::string> readQuoted(std::string_view text, std::size_t& pos) {
  std::string out;
  ++pos;
  while (pos < text.size()) {
    const char c = text[pos++];
    if (c == '"') return out;
    if (c != '\\') {
      out += c;
      continue;
    }
    if (pos >= text.size()) return std::nullopt;
    const char escaped = text[pos++];
    switch (escaped) {
      case 'n':
        out += '\n';
        break;
      case 't':
        out += '\t';
        break;
      case 'r':
        out += '\r';
        break;
      case 'x': {
        if (pos + 2 > text.size()) return std::nullopt;
        const std::string hex(text.substr(pos, 2));
        char* end = nullptr;
        const long code = std::strtol(hex.c_str(), &end, 16);
        if (end != hex.c_str() + 2) return std::nullopt;
        out += static_cast<char>(code);
        pos += 2;
        break;
      }
      default:
        out += escaped;
    }
  }
  return std::nullopt;  // no closing quote
}

std::optional<Value> readBareValue(std::string_view token) {
  if (token.empty()) return std::nullopt;
  if (equalsIgnoringCase(token, "true")) return Value::boolean(true);
  if (equalsIgnoringCase(token, "false")) return Value::boolean(false);
  if (token == "NULL") return Value::null();
  if (token.size() == 3 && token.front() == '\'' && token.back() == '\'') {
    return Value::char16(static_cast<unsigned char>(token[1]));
  }
  const std::string copy(token);
  errno = 0;
  char* end = nullptr;
  const long long integer = std::strtoll(copy.c_str(), &end, 10);
  if (end == copy.c_str() + copy.size() && errno == 0) return Value::sint64(integer);
  errno = 0;
  const double real = std::strtod(copy.c_str(), &end);
  if (end == copy.c_str() + copy.size() && errno == 0) return Value::real64(real);
  return std::nullopt;
}

}  // namespace

std::optional<ObjectPathValue> ObjectPathValue::parse(std::string_view text) {
  ObjectPathValue path;
  std::size_t pos = 0;
  if (text.substr(0, 2) == "//") {
    const std::size_t slash = text.find('/', 2);
    if (slash == std::string_view::npos || slash == 2) return std::nullopt;
    path.host_ = std::string(text.substr(2, slash - 2));
    pos = slash + 1;
  }
  const std::size_t dot = text.find('.', pos);
  const std::string_view head =
      text.substr(pos, dot == std::string_view::npos ? std::string_view::npos : dot - pos);
  const std::size_t colon = head.find(':');
  std::string_view className = head;
  if (colon != std::string_view::npos) {
    const std::string_view nameSpace = head.substr(0, colon);
    if (!isNameSpace(nameSpace)) return std::nullopt;
    path.nameSpace_ = std::string(nameSpace);
    className = head.substr(colon + 1);
  }
  if (!isName(className)) return std::nullopt;
  path.className_ = std::string(className);
  if (dot == std::string_view::npos) return path;

  pos = dot + 1;
  while (true) {
    const std::size_t equals = text.find('=', pos);
    if (equals == std::string_view::npos) return std::nullopt;
    const std::string_view name = text.substr(pos, equals - pos);
    if (!isName(name)) return std::nullopt;
    pos = equals + 1;
    if (pos >= text.size()) return std::nullopt;
    std::optional<Value> value;
    if (text[pos] == '"') {
      const std::optional<std::string> unquoted = readQuoted(text, pos);
      if (!unquoted) return std::nullopt;
      // A nested path with keys is a reference; anything else that was quoted is a string.
      std::optional<ObjectPathValue> nested = parse(*unquoted);
      if (nested && !nested->keys().empty()) {
        value = Value::reference(std::move(*nested));
      } else {
        value = Value::string(*unquoted);
      }
    } else {
      const std::size_t comma = text.find(',', pos);
      const std::size_t end = comma == std::string_view::npos ? text.size() : comma;
      value = readBareValue(text.substr(pos, end - pos));
      pos = end;
    }
    if (!value) return std::nullopt;
    path.addKey(std::string(name), std::move(*value));
    if (pos == text.size()) return path;
    if (text[pos] != ',') return std::nullopt;
    ++pos;
  }
}

bool ObjectPathValue::equivalent(const ObjectPathValue& other) const {
  if (!equalsIgnoringCase(nameSpace_, other.nameSpace_) ||
      !equalsIgnoringCase(className_, other.className_) || keys_.size() != other.keys_.size()) {
    return false;
  }
  for (const KeyBinding& key : keys_) {
    const Value* theirs = other.findKey(key.name);
    if (theirs == nullptr) return false;
    const bool bothReferences = key.value.type() == CMPI_ref && theirs->type() == CMPI_ref &&
                                !key.value.isNull() && !theirs->isNull();
    if (bothReferences) {
      if (!key.value.asReference().equivalent(theirs->asReference())) return false;
    } else if (key.value != *theirs) {
      return false;
    }
  }
  return true;
}

bool operator==(const ObjectPathValue& a, const ObjectPathValue& b) {
  return a.nameSpace_ == b.nameSpace_ && a.host_ == b.host_ && a.className_ == b.className_ &&
         a.keys_ == b.keys_;
}

std::ostream& operator<<(std::ostream& out, const ObjectPathValue& path) {
  return out << path.toString();
}

}  // namespace cmpihost
