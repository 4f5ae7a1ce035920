// Why a snapshot text is refused. parseNodeSnapshot reads snapshots with simdjson, which only
// tells that a text is wrong; a refused text is read a second time here, one character at a
// time, to name the first thing wrong in it and where: a snapshot's author needs "nodes[3].type
// is not a whole number from 0 to 4294967295" or the line and column of a stray brace. Only
// refused texts come here, so nothing is tuned for speed. The rules are the reader's: the tests
// and the fuzzer check that this finds a problem in exactly the texts the reader refuses.
#include "instrumentation/json/SnapshotDiagnosis.h"

#include <algorithm>
#include <cstdint>
#include <limits>
#include <optional>
#include <string>
#include <vector>

#include "instrumentation/SourceError.h"

#include "text/Text.h"

namespace Kesta {
namespace platform {

namespace {

constexpr std::uint64_t kLargestNumber = std::numeric_limits<std::uint32_t>::max();
constexpr const char* kNotANumber = " is not a whole number from 0 to 4294967295";

// The property number a key stands for: decimal digits, no sign, no blanks, no leading zeros
// (so that "1" and "01" cannot name the same property twice), at most 4294967295.
std::optional<unsigned int> propertyNumber(std::string_view key) {
  if (key.empty() || key.size() > 10 || (key.size() > 1 && key.front() == '0')) {
    return std::nullopt;
  }
  std::uint64_t value = 0;
  for (const char c : key) {
    if (c < '0' || c > '9') {
      return std::nullopt;
    }
    value = value * 10 + static_cast<std::uint64_t>(c - '0');
  }
  if (value > kLargestNumber) {
    return std::nullopt;
  }
  return static_cast<unsigned int>(value);
}

bool isDigit(char c) { return c >= '0' && c <= '9'; }

// A strict JSON parser (RFC 8259: no comments, no trailing commas, UTF-8 only, no lone
// surrogates) that knows the snapshot's shape. The first problem throws SourceError at once.
class SnapshotDiagnosis {
 public:
  explicit SnapshotDiagnosis(std::string_view text) : text_(text) {}

  void check() {
    // A byte order mark is tolerated, as editors on some systems write one.
    if (text_.substr(0, 3) == "\xEF\xBB\xBF") {
      position_ = 3;
    }
    skipBlanks();
    if (kindAhead() != Kind::kObject) {
      fail("the top level is not an object");
    }
    parseTop();
    skipBlanks();
    if (position_ != text_.size()) {
      syntaxError("text after the top-level object");
    }
  }

 private:
  enum class Kind { kObject, kArray, kString, kNumber, kLiteral };
  enum class Number { kWhole, kNegative, kFraction, kTooLarge };
  enum Member : unsigned {
    kOther = 0,
    kType = 1U << 0,
    kPath = 1U << 1,
    kDescription = 1U << 2,
    kStatus = 1U << 3,
    kProperties = 1U << 4,
  };

  [[noreturn]] static void fail(const std::string& reason) { throw SourceError(reason); }

  // A syntax error at the current position; without `problem` it names the character there.
  [[noreturn]] void syntaxError(std::string problem = std::string()) const {
    std::size_t line = 1;
    std::size_t column = 1;
    for (std::size_t i = 0; i < position_; ++i) {
      if (text_[i] == '\n') {
        ++line;
        column = 1;
      } else {
        ++column;
      }
    }
    if (problem.empty()) {
      problem = atEnd() ? "unexpected end of text"
                        : "unexpected character '" + printable(text_.substr(position_, 1)) + "'";
    }
    fail("it is not valid JSON: " + problem + " at line " + std::to_string(line) + ", column " +
         std::to_string(column));
  }

  bool atEnd() const { return position_ >= text_.size(); }
  char ahead() const { return text_[position_]; }

  void skipBlanks() {
    while (!atEnd()) {
      const char c = ahead();
      if (c != ' ' && c != '\n' && c != '\r' && c != '\t') {
        return;
      }
      ++position_;
    }
  }

  // The kind of the value that starts here (blanks already skipped); a syntax error when no
  // value can start here.
  Kind kindAhead() const {
    if (atEnd()) {
      syntaxError();
    }
    const char c = ahead();
    if (c == '{') {
      return Kind::kObject;
    }
    if (c == '[') {
      return Kind::kArray;
    }
    if (c == '"') {
      return Kind::kString;
    }
    if (c == '-' || isDigit(c)) {
      return Kind::kNumber;
    }
    if (c == 't' || c == 'f' || c == 'n') {
      return Kind::kLiteral;
    }
    syntaxError();
  }

  void expect(char c) {
    skipBlanks();
    if (atEnd() || ahead() != c) {
      syntaxError();
    }
    ++position_;
  }

  // Steps into an object or array (standing on its opening character); true when it is empty
  // and has been left again already.
  bool enterEmpty(char close) {
    ++position_;
    skipBlanks();
    if (!atEnd() && ahead() == close) {
      ++position_;
      return true;
    }
    return false;
  }

  // After a member or element: true when a comma announces another, false when `close` ends
  // the container.
  bool another(char close) {
    skipBlanks();
    if (!atEnd()) {
      if (ahead() == ',') {
        ++position_;
        return true;
      }
      if (ahead() == close) {
        ++position_;
        return false;
      }
    }
    syntaxError();
  }

  // Reads a member name and the colon after it.
  std::string_view memberName() {
    skipBlanks();
    if (atEnd() || ahead() != '"') {
      syntaxError();
    }
    const std::string_view name = readString(nameBuffer_);
    expect(':');
    skipBlanks();
    return name;
  }

  // Reads the string starting here. Plain ASCII is returned as a view of the text; a string with
  // escapes or other characters is decoded into `buffer`.
  std::string_view readString(std::string& buffer) {
    ++position_;
    const std::size_t start = position_;
    while (!atEnd()) {
      const auto c = static_cast<unsigned char>(ahead());
      if (c == '"') {
        return text_.substr(start, position_++ - start);
      }
      if (c == '\\' || c < 0x20 || c >= 0x80) {
        break;
      }
      ++position_;
    }
    buffer.assign(text_.data() + start, position_ - start);
    while (!atEnd()) {
      const auto c = static_cast<unsigned char>(ahead());
      if (c == '"') {
        ++position_;
        return buffer;
      }
      if (c < 0x20) {
        syntaxError("control character inside a string");
      }
      if (c == '\\') {
        readEscape(buffer);
      } else if (c < 0x80) {
        buffer.push_back(static_cast<char>(c));
        ++position_;
      } else {
        const std::size_t length = utf8SequenceLength(text_.substr(position_));
        if (length == 0) {
          syntaxError("text that is not UTF-8");
        }
        buffer.append(text_.data() + position_, length);
        position_ += length;
      }
    }
    syntaxError("unterminated string");
  }

  char32_t readHex4() {
    if (text_.size() - position_ < 4) {
      syntaxError("incomplete \\u escape");
    }
    char32_t value = 0;
    for (int i = 0; i < 4; ++i, ++position_) {
      const char c = ahead();
      value <<= 4;
      if (isDigit(c)) {
        value |= static_cast<char32_t>(c - '0');
      } else if (c >= 'a' && c <= 'f') {
        value |= static_cast<char32_t>(c - 'a' + 10);
      } else if (c >= 'A' && c <= 'F') {
        value |= static_cast<char32_t>(c - 'A' + 10);
      } else {
        syntaxError("invalid \\u escape");
      }
    }
    return value;
  }

  void readEscape(std::string& buffer) {
    ++position_;
    if (atEnd()) {
      syntaxError("unterminated string");
    }
    const char c = ahead();
    ++position_;
    switch (c) {
      case '"':
      case '\\':
      case '/':
        buffer.push_back(c);
        return;
      case 'b':
        buffer.push_back('\b');
        return;
      case 'f':
        buffer.push_back('\f');
        return;
      case 'n':
        buffer.push_back('\n');
        return;
      case 'r':
        buffer.push_back('\r');
        return;
      case 't':
        buffer.push_back('\t');
        return;
      case 'u':
        break;
      default:
        --position_;
        syntaxError("invalid escape");
    }
    char32_t codePoint = readHex4();
    if (codePoint >= 0xD800 && codePoint <= 0xDBFF) {
      // A high surrogate must be followed by an escaped low one; together they are one character.
      if (text_.substr(position_, 2) != "\\u") {
        syntaxError("\\u escape of a lone surrogate");
      }
      position_ += 2;
      const char32_t low = readHex4();
      if (low < 0xDC00 || low > 0xDFFF) {
        syntaxError("\\u escape of a lone surrogate");
      }
      codePoint = 0x10000 + ((codePoint - 0xD800) << 10) + (low - 0xDC00);
    } else if (codePoint >= 0xDC00 && codePoint <= 0xDFFF) {
      syntaxError("\\u escape of a lone surrogate");
    }
    appendUtf8(buffer, codePoint);
  }

  // Reads a number in JSON's grammar; `value` holds it when the result is kWhole.
  Number readNumber(std::uint64_t& value) {
    const bool negative = ahead() == '-';
    if (negative) {
      ++position_;
    }
    if (atEnd() || !isDigit(ahead())) {
      syntaxError("invalid number");
    }
    value = 0;
    bool tooLarge = false;
    if (ahead() == '0') {
      ++position_;
    } else {
      for (; !atEnd() && isDigit(ahead()); ++position_) {
        const auto digit = static_cast<std::uint64_t>(ahead() - '0');
        tooLarge = tooLarge || value > (std::numeric_limits<std::uint64_t>::max() - digit) / 10;
        value = value * 10 + digit;
      }
    }
    bool fraction = false;
    if (!atEnd() && ahead() == '.') {
      fraction = true;
      ++position_;
      skipDigits();
    }
    if (!atEnd() && (ahead() == 'e' || ahead() == 'E')) {
      fraction = true;
      ++position_;
      if (!atEnd() && (ahead() == '+' || ahead() == '-')) {
        ++position_;
      }
      skipDigits();
    }
    if (fraction) {
      return Number::kFraction;
    }
    if (tooLarge) {
      return Number::kTooLarge;
    }
    // "-0" is still zero.
    return negative && value != 0 ? Number::kNegative : Number::kWhole;
  }

  // At least one digit, as after a decimal point or in an exponent.
  void skipDigits() {
    if (atEnd() || !isDigit(ahead())) {
      syntaxError("invalid number");
    }
    while (!atEnd() && isDigit(ahead())) {
      ++position_;
    }
  }

  void readLiteral() {
    for (const std::string_view word : {"true", "false", "null"}) {
      if (text_.substr(position_, word.size()) == word) {
        position_ += word.size();
        return;
      }
    }
    syntaxError();
  }

  // Skips one value of any kind, nested to any depth without recursion, checking its syntax.
  void skipValue() {
    std::string open;  // one letter per container not yet closed: 'o'bject or 'a'rray
    std::uint64_t ignored = 0;
    for (;;) {
      skipBlanks();
      switch (kindAhead()) {
        case Kind::kObject:
          if (!enterEmpty('}')) {
            open.push_back('o');
            memberName();
            continue;
          }
          break;
        case Kind::kArray:
          if (!enterEmpty(']')) {
            open.push_back('a');
            continue;
          }
          break;
        case Kind::kString:
          readString(skipBuffer_);
          break;
        case Kind::kNumber:
          readNumber(ignored);
          break;
        case Kind::kLiteral:
          readLiteral();
          break;
      }
      // A value has ended: close the containers that end with it.
      for (;;) {
        if (open.empty()) {
          return;
        }
        const bool object = open.back() == 'o';
        if (another(object ? '}' : ']')) {
          if (object) {
            memberName();
          }
          break;
        }
        open.pop_back();
      }
    }
  }

  // A value of the wrong kind: its syntax is checked first, so that broken JSON is reported as
  // such, then the shape error is.
  template <typename Place>
  [[noreturn]] void wrongKind(const Place& place, const char* expectation) {
    skipValue();
    fail(place() + expectation);
  }

  template <typename Place>
  void readWholeNumber(const Place& place) {
    if (kindAhead() != Kind::kNumber) {
      wrongKind(place, kNotANumber);
    }
    std::uint64_t value = 0;
    if (readNumber(value) != Number::kWhole || value > kLargestNumber) {
      fail(place() + kNotANumber);
    }
  }

  template <typename Place>
  void readText(const Place& place) {
    if (kindAhead() != Kind::kString) {
      wrongKind(place, " is not a string");
    }
    const std::string_view text = readString(valueBuffer_);
    // The text ends up in C strings (CMPI_chars), which would silently cut it at a NUL.
    if (text.find('\0') != std::string_view::npos) {
      fail(place() + " contains the character U+0000");
    }
  }

  std::string where() const { return "nodes[" + std::to_string(nodeCount_) + "]"; }

  void parseTop() {
    bool sawNodes = false;
    if (!enterEmpty('}')) {
      do {
        if (memberName() != "nodes") {
          skipValue();
          continue;
        }
        if (sawNodes) {
          fail("\"nodes\" is given twice");
        }
        sawNodes = true;
        parseNodes();
      } while (another('}'));
    }
    if (!sawNodes) {
      fail("there is no \"nodes\" array");
    }
  }

  void parseNodes() {
    if (kindAhead() != Kind::kArray) {
      wrongKind([] { return std::string("\"nodes\""); }, " is not an array");
    }
    if (enterEmpty(']')) {
      return;
    }
    do {
      skipBlanks();
      if (kindAhead() != Kind::kObject) {
        wrongKind([this] { return where(); }, " is not an object");
      }
      parseNode();
    } while (another(']'));
  }

  static Member memberOf(std::string_view name) {
    if (name == "type") {
      return kType;
    }
    if (name == "path") {
      return kPath;
    }
    if (name == "description") {
      return kDescription;
    }
    if (name == "status") {
      return kStatus;
    }
    if (name == "properties") {
      return kProperties;
    }
    return kOther;
  }

  static std::string textOf(Member member) {
    switch (member) {
      case kType:
        return "type";
      case kPath:
        return "path";
      case kDescription:
        return "description";
      case kStatus:
        return "status";
      case kProperties:
        return "properties";
      case kOther:
        break;
    }
    return std::string();
  }

  void parseNode() {
    std::vector<unsigned int> propertyNumbers;
    unsigned seen = 0;
    if (!enterEmpty('}')) {
      do {
        const std::string_view name = memberName();
        const Member member = memberOf(name);
        // Named from the member, not from `name`: an escaped name lives in a buffer that
        // skipping a nested value may reuse.
        const auto place = [this, member] { return where() + "." + textOf(member); };
        if ((seen & member) != 0) {
          fail(place() + " is given twice");
        }
        seen |= member;
        switch (member) {
          case kType:
          case kStatus:
            readWholeNumber(place);
            break;
          case kPath:
          case kDescription:
            readText(place);
            break;
          case kProperties:
            parseProperties(propertyNumbers);
            break;
          case kOther:
            // Members of other names may carry whatever a snapshot writer adds.
            skipValue();
            break;
        }
      } while (another('}'));
    }
    if ((seen & kType) == 0) {
      fail(where() + " has no \"type\"");
    }
    if ((seen & kPath) == 0) {
      fail(where() + " has no \"path\"");
    }
    if ((seen & kDescription) == 0) {
      fail(where() + " has no \"description\"");
    }
    ++nodeCount_;
  }

  void parseProperties(std::vector<unsigned int>& numbers) {
    if (kindAhead() != Kind::kObject) {
      wrongKind([this] { return where() + ".properties"; }, " is not an object");
    }
    if (enterEmpty('}')) {
      return;
    }
    do {
      const std::string_view name = memberName();
      const std::optional<unsigned int> number = propertyNumber(name);
      if (!number) {
        fail(where() + ".properties has the key \"" + printable(name) +
             "\", which is not a property number");
      }
      const auto place = [this, &number] {
        return where() + ".properties." + std::to_string(*number);
      };
      if (std::find(numbers.begin(), numbers.end(), *number) != numbers.end()) {
        fail(place() + " is given twice");
      }
      numbers.push_back(*number);
      readWholeNumber(place);
    } while (another('}'));
  }

  std::string_view text_;
  std::size_t position_ = 0;
  std::size_t nodeCount_ = 0;
  // Reused for strings that need decoding, so that only their first use allocates.
  std::string nameBuffer_;
  std::string valueBuffer_;
  std::string skipBuffer_;
};

}  // namespace

std::string snapshotProblem(std::string_view json) {
  try {
    SnapshotDiagnosis(json).check();
  } catch (const SourceError& error) {
    return error.what();
  }
  return std::string();
}

}  // namespace platform
}  // namespace Kesta
