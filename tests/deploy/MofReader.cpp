#include "MofReader.h"

#include <cctype>
#include <fstream>
#include <set>
#include <sstream>

namespace mof {

namespace {

enum class TokenKind { Identifier, String, Number, Punct, End };

struct Token {
  TokenKind kind = TokenKind::End;
  std::string text;
  int line = 0;
};

// The data types of MOF; anything else before a property name must be a class (a reference).
const std::set<std::string> kDataTypes = {"boolean", "char16", "datetime", "real32", "real64",
                                          "sint8",   "sint16", "sint32",   "sint64", "string",
                                          "uint8",   "uint16", "uint32",   "uint64", "object"};

std::string lower(std::string_view text) {
  std::string result(text);
  for (char& c : result) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
  return result;
}

class Lexer {
 public:
  explicit Lexer(std::string_view text) : text_(text) {}

  std::vector<Token> tokens() {
    std::vector<Token> result;
    for (;;) {
      skipBlanks();
      if (pos_ >= text_.size()) break;
      const char c = text_[pos_];
      if (c == '#') {
        // #pragma lines carry no declarations the tests look at.
        while (pos_ < text_.size() && text_[pos_] != '\n') ++pos_;
        continue;
      }
      if (c == '"') {
        result.push_back(stringToken());
      } else if (c == '\'') {
        result.push_back(charToken());
      } else if (std::isalpha(static_cast<unsigned char>(c)) || c == '_') {
        const std::size_t start = pos_;
        while (pos_ < text_.size() &&
               (std::isalnum(static_cast<unsigned char>(text_[pos_])) || text_[pos_] == '_')) {
          ++pos_;
        }
        result.push_back(
            {TokenKind::Identifier, std::string(text_.substr(start, pos_ - start)), line_});
      } else if (std::isdigit(static_cast<unsigned char>(c)) || c == '-' || c == '+' || c == '.') {
        const std::size_t start = pos_++;
        while (pos_ < text_.size() &&
               (std::isalnum(static_cast<unsigned char>(text_[pos_])) || text_[pos_] == '.' ||
                text_[pos_] == '+' || text_[pos_] == '-')) {
          ++pos_;
        }
        result.push_back(
            {TokenKind::Number, std::string(text_.substr(start, pos_ - start)), line_});
      } else if (std::string_view("{}[]();:,=$").find(c) != std::string_view::npos) {
        result.push_back({TokenKind::Punct, std::string(1, c), line_});
        ++pos_;
      } else {
        throw MofError("line " + std::to_string(line_) + ": unexpected character '" +
                       std::string(1, c) + "'");
      }
    }
    result.push_back({TokenKind::End, "", line_});
    return result;
  }

 private:
  void skipBlanks() {
    while (pos_ < text_.size()) {
      const char c = text_[pos_];
      if (c == '\n') {
        ++line_;
        ++pos_;
      } else if (std::isspace(static_cast<unsigned char>(c))) {
        ++pos_;
      } else if (text_.substr(pos_, 2) == "//") {
        while (pos_ < text_.size() && text_[pos_] != '\n') ++pos_;
      } else if (text_.substr(pos_, 2) == "/*") {
        const std::size_t end = text_.find("*/", pos_ + 2);
        if (end == std::string_view::npos) {
          throw MofError("line " + std::to_string(line_) + ": comment without end");
        }
        for (std::size_t i = pos_; i < end; ++i) {
          if (text_[i] == '\n') ++line_;
        }
        pos_ = end + 2;
      } else {
        break;
      }
    }
  }

  char escaped() {
    if (pos_ >= text_.size()) throw MofError("line " + std::to_string(line_) + ": bad escape");
    const char c = text_[pos_++];
    switch (c) {
      case 'n':
        return '\n';
      case 't':
        return '\t';
      case 'r':
        return '\r';
      case 'b':
        return '\b';
      case 'f':
        return '\f';
      default:
        return c;  // \" \\ \'
    }
  }

  Token stringToken() {
    const int startLine = line_;
    ++pos_;
    std::string value;
    for (;;) {
      if (pos_ >= text_.size() || text_[pos_] == '\n') {
        throw MofError("line " + std::to_string(startLine) + ": string without end");
      }
      const char c = text_[pos_++];
      if (c == '"') break;
      value += c == '\\' ? escaped() : c;
    }
    return {TokenKind::String, value, startLine};
  }

  Token charToken() {
    ++pos_;
    std::string value;
    if (pos_ < text_.size() && text_[pos_] == '\\') {
      ++pos_;
      value += escaped();
    } else if (pos_ < text_.size()) {
      value += text_[pos_++];
    }
    if (pos_ >= text_.size() || text_[pos_] != '\'') {
      throw MofError("line " + std::to_string(line_) + ": bad character literal");
    }
    ++pos_;
    return {TokenKind::String, value, line_};
  }

  std::string_view text_;
  std::size_t pos_ = 0;
  int line_ = 1;
};

class Parser {
 public:
  explicit Parser(std::vector<Token> tokens) : tokens_(std::move(tokens)) {}

  Document document() {
    Document doc;
    while (peek().kind != TokenKind::End) {
      std::vector<Qualifier> qualifiers;
      if (isPunct("[")) qualifiers = qualifierList();
      const Token& keyword = peek();
      if (keyword.kind == TokenKind::Identifier && lower(keyword.text) == "class") {
        doc.classes.push_back(classDeclaration(std::move(qualifiers)));
      } else if (keyword.kind == TokenKind::Identifier && lower(keyword.text) == "instance") {
        doc.instances.push_back(instanceDeclaration());
      } else {
        fail("expected a class or instance declaration");
      }
    }
    return doc;
  }

 private:
  const Token& peek(std::size_t ahead = 0) const {
    const std::size_t index = std::min(pos_ + ahead, tokens_.size() - 1);
    return tokens_[index];
  }
  Token next() {
    Token token = peek();
    if (pos_ < tokens_.size() - 1) ++pos_;
    return token;
  }
  bool isPunct(const char* text, std::size_t ahead = 0) const {
    return peek(ahead).kind == TokenKind::Punct && peek(ahead).text == text;
  }
  [[noreturn]] void fail(const std::string& what) const {
    const Token& at = peek();
    throw MofError("line " + std::to_string(at.line) + ": " + what + " (at \"" + at.text + "\")");
  }
  void expectPunct(const char* text) {
    if (!isPunct(text)) fail(std::string("expected '") + text + "'");
    next();
  }
  std::string identifier() {
    if (peek().kind != TokenKind::Identifier) fail("expected a name");
    return next().text;
  }
  void expectKeyword(const char* keyword) {
    if (peek().kind != TokenKind::Identifier || lower(peek().text) != keyword) {
      fail(std::string("expected \"") + keyword + "\"");
    }
    next();
  }

  // One scalar: a string (adjacent strings joined), a number, or an identifier (true, false).
  std::string scalar() {
    const Token& token = peek();
    if (token.kind == TokenKind::String) {
      std::string joined;
      while (peek().kind == TokenKind::String) joined += next().text;
      return joined;
    }
    if (token.kind == TokenKind::Number || token.kind == TokenKind::Identifier) {
      return next().text;
    }
    fail("expected a value");
  }

  Value value() {
    Value result;
    if (isPunct("{")) {
      next();
      result.array = true;
      if (!isPunct("}")) {
        result.items.push_back(scalar());
        while (isPunct(",")) {
          next();
          result.items.push_back(scalar());
        }
      }
      expectPunct("}");
      return result;
    }
    if (peek().kind == TokenKind::Identifier && lower(peek().text) == "null") {
      next();
      result.null = true;
      return result;
    }
    result.items.push_back(scalar());
    return result;
  }

  std::vector<Qualifier> qualifierList() {
    std::vector<Qualifier> qualifiers;
    expectPunct("[");
    for (;;) {
      Qualifier qualifier;
      qualifier.name = identifier();
      if (isPunct("(")) {
        next();
        qualifier.value = value();
        expectPunct(")");
      } else if (isPunct("{")) {
        qualifier.value = value();
      } else {
        qualifier.value.items.emplace_back("true");
      }
      if (isPunct(":")) {  // flavours
        next();
        identifier();
        while (peek().kind == TokenKind::Identifier) next();
      }
      qualifiers.push_back(std::move(qualifier));
      if (isPunct(",")) {
        next();
        continue;
      }
      break;
    }
    expectPunct("]");
    return qualifiers;
  }

  Class classDeclaration(std::vector<Qualifier> qualifiers) {
    Class result;
    result.line = peek().line;
    expectKeyword("class");
    result.name = identifier();
    result.qualifiers = std::move(qualifiers);
    if (isPunct(":")) {
      next();
      result.superclass = identifier();
    }
    expectPunct("{");
    while (!isPunct("}")) {
      std::vector<Qualifier> featureQualifiers;
      if (isPunct("[")) featureQualifiers = qualifierList();
      feature(result, std::move(featureQualifiers));
    }
    expectPunct("}");
    expectPunct(";");
    return result;
  }

  void feature(Class& owner, std::vector<Qualifier> qualifiers) {
    const std::string typeName = identifier();
    Property property;
    property.qualifiers = std::move(qualifiers);
    if (peek().kind == TokenKind::Identifier && lower(peek().text) == "ref") {
      next();
      property.reference = true;
      property.type = typeName;
    } else if (kDataTypes.count(lower(typeName)) != 0) {
      property.type = lower(typeName);
    } else {
      fail("unknown data type \"" + typeName + "\"");
    }
    property.name = identifier();
    if (isPunct("(")) {  // a method: its parameters are not looked at
      int depth = 0;
      do {
        if (isPunct("(")) ++depth;
        if (isPunct(")")) --depth;
        if (peek().kind == TokenKind::End) fail("method without end");
        next();
      } while (depth > 0);
      expectPunct(";");
      owner.methods.push_back(property.name);
      return;
    }
    if (isPunct("[")) {
      next();
      if (peek().kind == TokenKind::Number) next();
      expectPunct("]");
      property.array = true;
    }
    if (isPunct("=")) {
      next();
      value();
    }
    expectPunct(";");
    if (owner.property(property.name) != nullptr) {
      fail("property " + property.name + " declared twice in " + owner.name);
    }
    owner.properties.push_back(std::move(property));
  }

  Instance instanceDeclaration() {
    Instance result;
    result.line = peek().line;
    expectKeyword("instance");
    expectKeyword("of");
    result.className = identifier();
    expectPunct("{");
    while (!isPunct("}")) {
      std::string name = identifier();
      expectPunct("=");
      Value v = value();
      expectPunct(";");
      if (result.value(name) != nullptr) fail("property " + name + " set twice");
      result.values.emplace_back(std::move(name), std::move(v));
    }
    expectPunct("}");
    expectPunct(";");
    return result;
  }

  std::vector<Token> tokens_;
  std::size_t pos_ = 0;
};

template <typename T>
const Qualifier* findQualifier(const T& owner, std::string_view name) {
  for (const Qualifier& qualifier : owner.qualifiers) {
    if (sameName(qualifier.name, name)) return &qualifier;
  }
  return nullptr;
}

}  // namespace

bool sameName(std::string_view a, std::string_view b) { return lower(a) == lower(b); }

const std::string& Value::scalar() const {
  if (null || array || items.size() != 1) throw MofError("expected a single value");
  return items.front();
}

const Qualifier* Property::qualifier(std::string_view name) const {
  return findQualifier(*this, name);
}

std::string Property::typeText() const {
  if (reference) return "REF " + type;
  return array ? type + "[]" : type;
}

const Qualifier* Class::qualifier(std::string_view name) const {
  return findQualifier(*this, name);
}

const Property* Class::property(std::string_view name) const {
  for (const Property& property : properties) {
    if (sameName(property.name, name)) return &property;
  }
  return nullptr;
}

const Value* Instance::value(std::string_view name) const {
  for (const auto& entry : values) {
    if (sameName(entry.first, name)) return &entry.second;
  }
  return nullptr;
}

const std::string& Instance::text(std::string_view name) const {
  const Value* found = value(name);
  if (found == nullptr) {
    throw MofError("instance of " + className + " (line " + std::to_string(line) + ") has no " +
                   std::string(name));
  }
  return found->scalar();
}

const Class* Document::findClass(std::string_view name) const {
  for (const Class& c : classes) {
    if (sameName(c.name, name)) return &c;
  }
  return nullptr;
}

std::vector<const Instance*> Document::instancesOf(std::string_view className) const {
  std::vector<const Instance*> found;
  for (const Instance& instance : instances) {
    if (sameName(instance.className, className)) found.push_back(&instance);
  }
  return found;
}

Document parse(std::string_view text) { return Parser(Lexer(text).tokens()).document(); }

Document parseFile(const std::string& path) {
  std::ifstream in(path);
  if (!in) throw MofError("cannot read " + path);
  std::ostringstream text;
  text << in.rdbuf();
  try {
    return parse(text.str());
  } catch (const MofError& error) {
    throw MofError(path + ": " + error.what());
  }
}

}  // namespace mof
