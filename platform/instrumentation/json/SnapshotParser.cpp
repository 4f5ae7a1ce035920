// The snapshot is read on every CIM operation. simdjson finds the structure of the whole text
// in one vectorised pass (checking its UTF-8, its control characters and that every string is
// closed on the way); its On-Demand API then walks the tokens in order, straight into the node
// records. Everything On-Demand leaves unchecked is checked here, so that the rules are strict
// RFC 8259 plus the snapshot's shape: numbers are read from their raw text by JSON's grammar,
// strings are unescaped (which checks the escapes) unless they have none, members with other
// names are walked to the end of their value without recursion, a member given twice is
// refused. For Walk/4096's tree (4,608 nodes) and a tree of 65,537 nodes this took about three
// quarters of the time of the hand-written parser it replaced (docs/PERFORMANCE.md).
//
// The reader only tells whether a text is refused; SnapshotDiagnosis then reads a refused text
// again to say what is wrong and where.
//
// On-Demand's development checks (on in unoptimised builds) would limit nesting to the parser's
// depth; ignored members may nest deeper.
#define SIMDJSON_DEVELOPMENT_CHECKS 0
#include "instrumentation/json/SnapshotParser.h"

#include <simdjson.h>

#include <cstdint>
#include <cstring>
#include <memory>
#include <mutex>
#include <string>
#include <utility>

#include "instrumentation/json/SnapshotDiagnosis.h"

namespace Kesta {
namespace platform {

namespace {

namespace od = simdjson::ondemand;

constexpr std::uint64_t kLargestNumber = 4294967295u;
// The shortest node that can be written, {"type":0,"path":"","description":""}, is 37 bytes;
// sizing the node vector from the text length avoids most of its reallocations.
constexpr std::size_t kBytesPerNodeEstimate = 96;
// simdjson's parser and the padded copy of the text are kept between calls: making them anew
// for every call costs page faults that, on a tree of 65,537 nodes, took as long as the parse
// (docs/PERFORMANCE.md). They serve texts up to this size; a larger text gets buffers of its own
// for the call, so that one huge snapshot does not hold its memory for the life of the process.
constexpr std::size_t kLargestKeptText = std::size_t{16} * 1024 * 1024;

// Thrown on the first broken rule. The reader does not say what is wrong: SnapshotDiagnosis
// does that for the texts it refuses. `error` is simdjson's error, if it was one.
struct Refused {
  simdjson::error_code error = simdjson::SUCCESS;
};

[[noreturn]] void refuse(simdjson::error_code error = simdjson::SUCCESS) { throw Refused{error}; }

template <typename T>
T take(simdjson::simdjson_result<T>&& result) {
  T value;
  const simdjson::error_code error = std::move(result).get(value);
  if (error != simdjson::SUCCESS) {
    refuse(error);
  }
  return value;
}

bool isBlank(char c) { return c == ' ' || c == '\n' || c == '\r' || c == '\t'; }
bool isDigit(char c) { return c >= '0' && c <= '9'; }

// A number token as On-Demand gives it (the blanks up to the next token included): whether it
// is a whole number from 0 to 4294967295, with its value in `out`. A token outside JSON's
// grammar for numbers refuses the text.
bool wholeNumber(std::string_view token, unsigned int& out) {
  while (!token.empty() && isBlank(token.back())) {
    token.remove_suffix(1);
  }
  std::size_t i = 0;
  const bool negative = !token.empty() && token[0] == '-';
  if (negative) {
    ++i;
  }
  if (i == token.size() || !isDigit(token[i])) {
    refuse();
  }
  std::uint64_t value = 0;
  bool tooLarge = false;
  if (token[i] == '0') {
    ++i;
  } else {
    for (; i < token.size() && isDigit(token[i]); ++i) {
      if (!tooLarge) {
        value = value * 10 + static_cast<std::uint64_t>(token[i] - '0');
        tooLarge = value > kLargestNumber;
      }
    }
  }
  bool fraction = false;
  const auto digits = [&] {
    if (i == token.size() || !isDigit(token[i])) {
      refuse();
    }
    while (i < token.size() && isDigit(token[i])) {
      ++i;
    }
  };
  if (i < token.size() && token[i] == '.') {
    fraction = true;
    ++i;
    digits();
  }
  if (i < token.size() && (token[i] == 'e' || token[i] == 'E')) {
    fraction = true;
    ++i;
    if (i < token.size() && (token[i] == '+' || token[i] == '-')) {
      ++i;
    }
    digits();
  }
  if (i != token.size()) {
    refuse();
  }
  // "-0" is still zero.
  if (fraction || tooLarge || (negative && value != 0)) {
    return false;
  }
  out = static_cast<unsigned int>(value);
  return true;
}

// The text of a string that stands at `start` (just after its opening quote) when it has no
// escapes: stage 1 has made sure that it is closed and holds no control characters.
bool plainString(const char* start, std::string_view& text) {
  const char* end = start;
  while (*end != '"' && *end != '\\') {
    ++end;
  }
  if (*end != '"') {
    return false;
  }
  text = std::string_view(start, static_cast<std::size_t>(end - start));
  return true;
}

class Reader {
 public:
  explicit Reader(const od::parser& parser) : parser_(parser) {}

  std::vector<InstrumentationNode> read(od::document& document, std::size_t size) {
    nodes_.reserve(size / kBytesPerNodeEstimate);
    bool sawNodes = false;
    od::object top = take(document.get_object());
    for (auto member : top) {
      od::field field = take(std::move(member));
      if (!field.key().unsafe_is_equal("nodes") && take(field.unescaped_key()) != "nodes") {
        skip(field.value());
        continue;
      }
      if (sawNodes) {
        refuse();
      }
      sawNodes = true;
      readNodes(field.value());
    }
    if (!sawNodes) {
      refuse();
    }
    // Nothing may follow the top-level object.
    const char* location = nullptr;
    if (document.current_location().get(location) != simdjson::OUT_OF_BOUNDS) {
      refuse();
    }
    return std::move(nodes_);
  }

 private:
  enum Member : unsigned {
    kOther = 0,
    kType = 1U << 0,
    kPath = 1U << 1,
    kDescription = 1U << 2,
    kStatus = 1U << 3,
    kProperties = 1U << 4,
  };

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

  // The member a key names. The common names are compared with the raw key, closing quote
  // included (the padding makes reading past a short key safe); any other key is unescaped,
  // which also checks its escapes.
  static Member memberOf(od::field& field) {
    const char* raw = field.key().raw();
    switch (raw[0]) {
      case 't':
        if (std::memcmp(raw, "type\"", 5) == 0) {
          return kType;
        }
        break;
      case 'p':
        if (std::memcmp(raw, "path\"", 5) == 0) {
          return kPath;
        }
        if (std::memcmp(raw, "properties\"", 11) == 0) {
          return kProperties;
        }
        break;
      case 'd':
        if (std::memcmp(raw, "description\"", 12) == 0) {
          return kDescription;
        }
        break;
      case 's':
        if (std::memcmp(raw, "status\"", 7) == 0) {
          return kStatus;
        }
        break;
      default:
        break;
    }
    return memberOf(take(field.unescaped_key()));
  }

  void readNodes(od::value& value) {
    od::array array;
    if (value.get_array().get(array) != simdjson::SUCCESS) {
      skip(value);
      refuse();
    }
    for (auto element : array) {
      // take() wants the result as an rvalue; this one is trivially copyable, so the move is a
      // copy.
      od::value node = take(std::move(element));  // NOLINT(performance-move-const-arg)
      od::object object;
      if (node.get_object().get(object) != simdjson::SUCCESS) {
        skip(node);
        refuse();
      }
      readNode(object);
    }
  }

  void readNode(od::object& object) {
    InstrumentationNode node;
    unsigned seen = 0;
    for (auto member : object) {
      od::field field = take(std::move(member));
      const Member name = memberOf(field);
      if ((seen & name) != 0) {
        refuse();
      }
      seen |= name;
      od::value& value = field.value();
      switch (name) {
        case kType:
          readWholeNumber(value, node.type);
          break;
        case kStatus:
          readWholeNumber(value, node.status);
          break;
        case kPath:
          readText(value, node.path);
          break;
        case kDescription:
          readText(value, node.description);
          break;
        case kProperties:
          readProperties(value, node);
          break;
        case kOther:
          skip(value);
          break;
      }
    }
    if ((seen & (kType | kPath | kDescription)) != (kType | kPath | kDescription)) {
      refuse();
    }
    nodes_.push_back(std::move(node));
  }

  void readWholeNumber(od::value& value, unsigned int& out) {
    const std::string_view token = value.raw_json_token();
    const char* digit = token.data();
    // The common case, a plain number without sign, fraction or exponent, in one loop.
    if (*digit >= '1' && *digit <= '9') {
      std::uint64_t number = 0;
      while (isDigit(*digit) && number <= kLargestNumber) {
        number = number * 10 + static_cast<std::uint64_t>(*digit++ - '0');
      }
      const char after = *digit;
      if (number <= kLargestNumber && !isDigit(after) && after != '.' && after != 'e' &&
          after != 'E' && (digit == token.data() + token.size() || isBlank(after))) {
        out = static_cast<unsigned int>(number);
        return;
      }
    }
    if (token[0] != '-' && !isDigit(token[0])) {
      skip(value);
      refuse();
    }
    if (!wholeNumber(token, out)) {
      refuse();
    }
  }

  void readText(od::value& value, std::string& out) {
    // The token runs from the opening quote to the next token, so it bounds the decoded text.
    const std::string_view token = value.raw_json_token();
    od::raw_json_string raw;
    // Taken, not only looked at: a string left in place followed by a colon would be taken
    // for a member name when the object moves on.
    if (value.get_raw_json_string().get(raw) != simdjson::SUCCESS) {
      skip(value);
      refuse();
    }
    std::string_view text;
    if (!plainString(raw.raw(), text)) {
      scratch_.resize(token.size() + simdjson::SIMDJSON_PADDING);
      auto* end = reinterpret_cast<std::uint8_t*>(&scratch_[0]);
      text = take(parser_.unescape(raw, end));
      // The text ends up in C strings, which would silently cut it at a NUL.
      if (std::memchr(text.data(), '\0', text.size()) != nullptr) {
        refuse();
      }
    }
    out.assign(text.data(), text.size());
  }

  void readProperties(od::value& value, InstrumentationNode& node) {
    od::object object;
    if (value.get_object().get(object) != simdjson::SUCCESS) {
      skip(value);
      refuse();
    }
    for (auto member : object) {
      od::field field = take(std::move(member));
      std::string_view key;
      if (!plainString(field.key().raw(), key)) {
        key = take(field.unescaped_key());
      }
      // Decimal digits, no sign, no blanks, no leading zeros, at most 4294967295.
      if (key.empty() || key.size() > 10 || (key.size() > 1 && key[0] == '0')) {
        refuse();
      }
      std::uint64_t number = 0;
      for (const char c : key) {
        if (!isDigit(c)) {
          refuse();
        }
        number = number * 10 + static_cast<std::uint64_t>(c - '0');
      }
      if (number > kLargestNumber || node.property(static_cast<unsigned int>(number))) {
        refuse();
      }
      unsigned int propertyValue = 0;
      readWholeNumber(field.value(), propertyValue);
      node.properties.push_back({static_cast<unsigned int>(number), propertyValue});
    }
  }

  // One container being walked by skip().
  struct Open {
    bool object = false;
    bool started = false;
    od::object_iterator members;
    od::array_iterator elements;
  };

  // Walks a value that is not read, checking all of it, to any depth without recursion.
  void skip(od::value value) {
    const std::size_t outer = open_.size();
    for (;;) {
      switch (take(value.type())) {
        case od::json_type::object: {
          od::object object = take(value.get_object());
          open_.push_back(Open{true, false, take(object.begin()), {}});
          break;
        }
        case od::json_type::array: {
          od::array array = take(value.get_array());
          open_.push_back(Open{false, false, {}, take(array.begin())});
          break;
        }
        case od::json_type::string:
          take(value.get_string());
          break;
        case od::json_type::number: {
          unsigned int ignored = 0;
          wholeNumber(value.raw_json_token(), ignored);
          break;
        }
        case od::json_type::boolean:
          take(value.get_bool());
          break;
        case od::json_type::null:
          if (!take(value.is_null())) {
            refuse();
          }
          break;
      }
      // The next value: the next one in the innermost open container that has one.
      for (;;) {
        if (open_.size() == outer) {
          return;
        }
        Open& container = open_.back();
        if (container.object) {
          if (container.started) {
            ++container.members;
          }
          container.started = true;
          // simdjson's iterators compare with anything as "not yet at the end".
          if (!(container.members != container.members)) {  // NOLINT(misc-redundant-expression)
            open_.pop_back();
            continue;
          }
          od::field field = take(*container.members);
          take(field.unescaped_key());
          value = std::move(field).value();
        } else {
          if (container.started) {
            ++container.elements;
          }
          container.started = true;
          if (!(container.elements != container.elements)) {  // NOLINT(misc-redundant-expression)
            open_.pop_back();
            continue;
          }
          value = take(*container.elements);
        }
        break;
      }
    }
  }

  const od::parser& parser_;
  std::vector<InstrumentationNode> nodes_;
  std::vector<Open> open_;
  // Where strings with escapes are decoded.
  std::string scratch_;
};

// simdjson's parser and the padded copy of the text that it reads.
struct Workspace {
  od::parser parser;
  std::unique_ptr<char[]> copy;
  std::size_t copyCapacity = 0;

  simdjson::padded_string_view padded(std::string_view text) {
    const std::size_t needed = text.size() + simdjson::SIMDJSON_PADDING;
    if (copyCapacity < needed) {
      copy.reset(new char[needed]);
      copyCapacity = needed;
    }
    std::memcpy(copy.get(), text.data(), text.size());
    // The padding is only read past the end of the last token; zeros keep that well defined.
    std::memset(copy.get() + text.size(), 0, simdjson::SIMDJSON_PADDING);
    return simdjson::padded_string_view(copy.get(), text.size(), copyCapacity);
  }
};

std::mutex keptMutex;
Workspace kept;

}  // namespace

std::vector<InstrumentationNode> parseNodeSnapshot(std::string_view json) {
  std::string_view text = json;
  // A byte order mark is tolerated, as editors on some systems write one.
  if (text.substr(0, 3) == "\xEF\xBB\xBF") {
    text.remove_prefix(3);
  }
  // The kept parser serves one call at a time; a call that finds it busy, or a text too large
  // to keep buffers for, gets a parser of its own.
  std::unique_lock<std::mutex> lock(keptMutex, std::defer_lock);
  if (text.size() <= kLargestKeptText) {
    lock.try_lock();
  }
  std::unique_ptr<Workspace> own;
  if (!lock.owns_lock()) {
    own = std::make_unique<Workspace>();
  }
  Workspace& workspace = own ? *own : kept;
  simdjson::error_code error = simdjson::SUCCESS;
  try {
    od::document document;
    error = workspace.parser.iterate(workspace.padded(text)).get(document);
    if (error == simdjson::SUCCESS) {
      return Reader(workspace.parser).read(document, text.size());
    }
  } catch (const Refused& refused) {
    error = refused.error;
  }
  lock = std::unique_lock<std::mutex>();
  own.reset();
  const std::string problem = snapshotProblem(json);
  if (!problem.empty()) {
    throw SourceError(problem);
  }
  // The reader refused a text in which the diagnosis finds nothing wrong: simdjson could not
  // take it (its memory, say).
  throw SourceError(std::string("it could not be read: ") + (error != simdjson::SUCCESS
                                                                 ? simdjson::error_message(error)
                                                                 : "the reader refused it"));
}

}  // namespace platform
}  // namespace Kesta
