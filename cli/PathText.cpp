#include "PathText.h"

#include <cctype>
#include <cerrno>
#include <charconv>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <optional>
#include <string>

#include "TextForms.h"
#include "UsageError.h"
#include "text/Text.h"

namespace bluelight::cli {

using cmpihost::ObjectPathValue;
using cmpihost::Value;

namespace {

bool isLetter(char c) { return std::isalpha(static_cast<unsigned char>(c)) != 0; }
bool isDigit(char c) { return std::isdigit(static_cast<unsigned char>(c)) != 0; }
bool isHexDigit(char c) { return std::isxdigit(static_cast<unsigned char>(c)) != 0; }
bool isNameChar(char c) { return isLetter(c) || isDigit(c) || c == '_'; }
bool isBlank(char c) { return c == ' ' || c == '\t'; }

// How a character is named in a message: quoted when it can be read, else by its code.
std::string describe(char c) {
  const auto byte = static_cast<unsigned char>(c);
  if (byte >= 0x20 && byte < 0x7f) return quote(std::string(1, c));
  char text[24];
  std::snprintf(text, sizeof text, "the byte 0x%02X", byte);
  return text;
}

unsigned int hexValue(char c) {
  if (isDigit(c)) return static_cast<unsigned int>(c - '0');
  return static_cast<unsigned int>(std::tolower(static_cast<unsigned char>(c)) - 'a' + 10);
}

// Whole numbers become sint64 (uint64 when only that holds them), other numbers real64.
std::optional<Value> numberValue(std::string_view token, bool& outOfRange) {
  outOfRange = false;
  std::string_view digits = token;
  if (!digits.empty() && (digits.front() == '+' || digits.front() == '-')) digits.remove_prefix(1);
  if (digits.empty()) return std::nullopt;
  bool whole = true;
  bool anyDigit = false;
  for (const char c : digits) {
    if (isDigit(c)) {
      anyDigit = true;
    } else if (c == '.' || c == 'e' || c == 'E' || c == '+' || c == '-') {
      whole = false;
    } else {
      return std::nullopt;
    }
  }
  if (!anyDigit) return std::nullopt;
  if (whole) {
    // from_chars takes no plus sign.
    const std::string_view signless = token.front() == '+' ? token.substr(1) : token;
    std::int64_t number = 0;
    auto [end, error] = std::from_chars(signless.data(), signless.data() + signless.size(), number);
    if (error == std::errc() && end == signless.data() + signless.size()) {
      return Value::sint64(number);
    }
    if (error == std::errc::result_out_of_range && signless.front() != '-') {
      std::uint64_t large = 0;
      auto [largeEnd, largeError] =
          std::from_chars(signless.data(), signless.data() + signless.size(), large);
      if (largeError == std::errc() && largeEnd == signless.data() + signless.size()) {
        return Value::uint64(large);
      }
    }
    outOfRange = true;
    return std::nullopt;
  }
  const std::string copy(token);
  char* end = nullptr;
  errno = 0;
  const double real = std::strtod(copy.c_str(), &end);
  if (end != copy.c_str() + copy.size()) return std::nullopt;
  if (errno == ERANGE) {
    outOfRange = true;
    return std::nullopt;
  }
  return Value::real64(real);
}

// Reads one path; every failure throws UsageError with the reason and the place.
class PathReader {
 public:
  explicit PathReader(std::string_view text) : text_(text) {}

  ObjectPathValue read() {
    skipBlanks();
    if (atEnd()) fail("the path is empty", std::nullopt);
    ObjectPathValue path;
    readHost(path);
    readNamespaceAndClass(path);
    skipBlanks();
    if (atEnd()) return path;
    if (peek() != '.') {
      fail("expected \".\" and the keys after the class name, found " + describe(peek()), pos_);
    }
    ++pos_;
    readKeys(path);
    return path;
  }

 private:
  bool atEnd() const { return pos_ >= text_.size(); }
  char peek() const { return text_[pos_]; }
  void skipBlanks() {
    while (!atEnd() && isBlank(peek())) ++pos_;
  }

  [[noreturn]] void fail(const std::string& reason, std::optional<std::size_t> at) const {
    std::string message = "malformed object path " + quote(text_) + ": " + reason;
    if (at) message += " (character " + std::to_string(*at + 1) + ")";
    throw UsageError(message);
  }

  void readHost(ObjectPathValue& path) {
    if (text_.substr(pos_, 2) != "//") return;
    const std::size_t start = pos_ + 2;
    const std::size_t slash = text_.find('/', start);
    if (slash == std::string_view::npos || slash == start) {
      fail("\"//\" must be followed by a host name and \"/\"", pos_);
    }
    path.setHost(std::string(text_.substr(start, slash - start)));
    pos_ = slash + 1;
  }

  void readNamespaceAndClass(ObjectPathValue& path) {
    const std::size_t start = pos_;
    while (!atEnd() && (isNameChar(peek()) || peek() == '/')) ++pos_;
    const std::string_view run = text_.substr(start, pos_ - start);
    if (!atEnd() && peek() == ':') {
      checkNamespace(run, start);
      path.setNameSpace(std::string(run));
      ++pos_;
      const std::size_t classStart = pos_;
      while (!atEnd() && isNameChar(peek())) ++pos_;
      checkClassName(text_.substr(classStart, pos_ - classStart), classStart);
      path.setClassName(std::string(text_.substr(classStart, pos_ - classStart)));
      return;
    }
    if (run.find('/') != std::string_view::npos) {
      fail("the namespace " + quote(run) + " must be followed by \":\" and the class name", start);
    }
    checkClassName(run, start);
    path.setClassName(std::string(run));
  }

  void checkNamespace(std::string_view nameSpace, std::size_t at) const {
    if (nameSpace.empty()) fail("the namespace before \":\" is empty", at);
    std::size_t partStart = 0;
    while (true) {
      const std::size_t slash = nameSpace.find('/', partStart);
      const std::size_t partEnd = slash == std::string_view::npos ? nameSpace.size() : slash;
      if (partEnd == partStart) {
        fail("the namespace " + quote(nameSpace) + " has an empty part", at + partStart);
      }
      if (slash == std::string_view::npos) return;
      partStart = slash + 1;
    }
  }

  void checkClassName(std::string_view name, std::size_t at) const {
    if (name.empty()) {
      fail(atEnd() ? std::string("the class name is missing")
                   : "expected a class name, found " + describe(text_[at]),
           at);
    }
    if (!isCimName(name)) {
      fail(quote(name) + " is not a class name (it must start with a letter or \"_\")", at);
    }
  }

  void readKeys(ObjectPathValue& path) {
    const char* separator = "\".\"";
    while (true) {
      skipBlanks();
      const std::size_t nameStart = pos_;
      while (!atEnd() && isNameChar(peek())) ++pos_;
      const std::string name(text_.substr(nameStart, pos_ - nameStart));
      if (name.empty()) {
        fail(std::string("a key name is missing after ") + separator, nameStart);
      }
      if (!isCimName(name)) {
        fail(quote(name) + " is not a key name (it must start with a letter or \"_\")", nameStart);
      }
      skipBlanks();
      if (atEnd() || peek() != '=') fail("expected \"=\" after the key name " + name, pos_);
      ++pos_;
      skipBlanks();
      if (atEnd() || peek() == ',') fail("the value of key " + name + " is missing", pos_);
      Value value = peek() == '"' ? readQuoted(name) : readBare(name);
      if (path.findKey(name) != nullptr) fail("key " + name + " is given twice", nameStart);
      path.addKey(name, std::move(value));
      skipBlanks();
      if (atEnd()) return;
      if (peek() != ',') {
        fail("expected \",\" before the next key, found " + describe(peek()), pos_);
      }
      ++pos_;
      separator = "\",\"";
    }
  }

  Value readQuoted(const std::string& key) {
    const std::size_t start = pos_;
    ++pos_;
    std::string text;
    while (true) {
      if (atEnd()) fail("the quoted value of key " + key + " has no closing quote", start);
      const char c = text_[pos_++];
      if (c == '"') break;
      // A C string ends at a NUL, so no CIM value can hold one (the same rule as for \x0).
      if (c == '\0') fail("a NUL character cannot be part of a value", pos_ - 1);
      if (c != '\\') {
        text += c;
        continue;
      }
      if (atEnd()) fail("the quoted value of key " + key + " has no closing quote", start);
      const std::size_t escapeAt = pos_ - 1;
      const char escaped = text_[pos_++];
      switch (escaped) {
        case '"':
        case '\\':
        case '\'':
          text += escaped;
          break;
        case 'n':
          text += '\n';
          break;
        case 't':
          text += '\t';
          break;
        case 'r':
          text += '\r';
          break;
        case 'b':
          text += '\b';
          break;
        case 'f':
          text += '\f';
          break;
        case 'x':
        case 'X':
          text += readHexEscape(key, escapeAt);
          break;
        default:
          fail("unknown escape \\" + std::string(1, escaped) + " in the value of key " + key +
                   " (write \\\\ for a backslash)",
               escapeAt);
      }
    }
    // A quoted complete path with keys is a reference; anything else stays a string.
    try {
      ObjectPathValue nested = PathReader(text).read();
      if (!nested.keys().empty()) return Value::reference(std::move(nested));
    } catch (const UsageError&) {
    }
    return Value::string(std::move(text));
  }

  std::string readHexEscape(const std::string& key, std::size_t escapeAt) {
    unsigned int codePoint = 0;
    std::size_t digits = 0;
    while (digits < 4 && !atEnd() && isHexDigit(peek())) {
      codePoint = codePoint * 16 + hexValue(peek());
      ++pos_;
      ++digits;
    }
    if (digits == 0) {
      fail("\\x must be followed by 1 to 4 hex digits in the value of key " + key, escapeAt);
    }
    if (codePoint == 0) fail("\\x0 (a NUL character) cannot be part of a value", escapeAt);
    // Four hex digits at most: one char16, a surrogate included, passed on as the user wrote it.
    std::string out;
    Kesta::platform::appendUtf8KeepingSurrogates(out, static_cast<char16_t>(codePoint));
    return out;
  }

  Value readBare(const std::string& key) {
    const std::size_t start = pos_;
    while (!atEnd() && peek() != ',') ++pos_;
    std::string_view token = text_.substr(start, pos_ - start);
    while (!token.empty() && isBlank(token.back())) token.remove_suffix(1);
    if (Kesta::platform::equalsIgnoringCase(token, "true")) return Value::boolean(true);
    if (Kesta::platform::equalsIgnoringCase(token, "false")) return Value::boolean(false);
    bool outOfRange = false;
    if (std::optional<Value> number = numberValue(token, outOfRange)) return *number;
    if (outOfRange) {
      fail("the value of key " + key + ", " + std::string(token) + ", is out of range", start);
    }
    fail("the value of key " + key + ", " + std::string(token) +
             ", is not quoted, not a number and not TRUE or FALSE; write strings in double "
             "quotes",
         start);
  }

  std::string_view text_;
  std::size_t pos_ = 0;
};

}  // namespace

bool isCimName(std::string_view text) {
  if (text.empty() || !(isLetter(text.front()) || text.front() == '_')) return false;
  for (const char c : text) {
    if (!isNameChar(c)) return false;
  }
  return true;
}

ObjectPathValue parseObjectPath(std::string_view text, const std::string& defaultNamespace) {
  ObjectPathValue path = PathReader(text).read();
  if (path.nameSpace().empty()) path.setNameSpace(defaultNamespace);
  return path;
}

ObjectPathValue parseClassPath(std::string_view text, const std::string& defaultNamespace) {
  ObjectPathValue path = parseObjectPath(text, defaultNamespace);
  if (!path.keys().empty()) {
    throw UsageError(quote(text) +
                     " is an object path with keys; a class name (optionally namespace:ClassName) "
                     "is expected here");
  }
  return path;
}

std::string formatKeyValue(const Value& value) {
  if (value.isNull()) return "NULL";
  if (value.isArray()) {
    std::string text = "{";
    const char* separator = "";
    for (const Value& element : value.elements()) {
      text += separator + formatKeyValue(element);
      separator = ", ";
    }
    return text + "}";
  }
  switch (value.type()) {
    case CMPI_string:
    case CMPI_dateTime:
      return quote(value.asString());
    case CMPI_ref:
      return quote(formatPath(value.asReference()));
    case CMPI_boolean:
      return value.asBoolean() ? "TRUE" : "FALSE";
    case CMPI_char16: {
      std::string text;
      Kesta::platform::appendUtf8KeepingSurrogates(text, static_cast<char16_t>(value.asUnsigned()));
      return quote(text);
    }
    case CMPI_uint8:
    case CMPI_uint16:
    case CMPI_uint32:
    case CMPI_uint64:
      return std::to_string(value.asUnsigned());
    case CMPI_sint8:
    case CMPI_sint16:
    case CMPI_sint32:
    case CMPI_sint64:
      return std::to_string(value.asSigned());
    case CMPI_real32:
      return realText(value.asReal(), true);
    case CMPI_real64:
      return realText(value.asReal(), false);
    default:
      return value.toString();
  }
}

std::string formatPath(const ObjectPathValue& path) {
  std::string text;
  if (!path.host().empty()) text += "//" + path.host() + "/";
  if (!path.nameSpace().empty()) text += path.nameSpace() + ":";
  text += path.className();
  const char* separator = ".";
  for (const cmpihost::KeyBinding& key : path.keys()) {
    text += separator + key.name + "=" + formatKeyValue(key.value);
    separator = ",";
  }
  return text;
}

}  // namespace bluelight::cli
