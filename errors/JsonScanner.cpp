// A small recursive-descent JSON scanner that only checks syntax and remembers positions.
#include "errors/JsonScanner.h"

namespace qverr {

namespace {

constexpr int kMaxDepth = 64;

class Scanner {
 public:
  explicit Scanner(std::string_view text) : text(text) {}

  std::optional<size_t> rootEnd() {
    skipBlanks();
    if (peek() != '{' || !object(0)) return std::nullopt;
    const size_t end = pos - 1;
    skipBlanks();
    if (pos != text.size()) return std::nullopt;
    return end;
  }

 private:
  char peek() const { return pos < text.size() ? text[pos] : '\0'; }
  bool atEnd() const { return pos >= text.size(); }
  bool accept(char c) {
    if (atEnd() || text[pos] != c) return false;
    ++pos;
    return true;
  }
  void skipBlanks() {
    while (!atEnd() &&
           (text[pos] == ' ' || text[pos] == '\t' || text[pos] == '\r' || text[pos] == '\n'))
      ++pos;
  }
  static bool isDigit(char c) { return c >= '0' && c <= '9'; }
  static bool isHex(char c) {
    return isDigit(c) || (c >= 'a' && c <= 'f') || (c >= 'A' && c <= 'F');
  }

  bool value(int depth) {
    skipBlanks();
    switch (peek()) {
      case '{':
        return object(depth + 1);
      case '[':
        return array(depth + 1);
      case '"':
        return string();
      case 't':
        return word("true");
      case 'f':
        return word("false");
      case 'n':
        return word("null");
      default:
        return number();
    }
  }

  bool object(int depth) {
    if (depth > kMaxDepth || !accept('{')) return false;
    skipBlanks();
    if (accept('}')) return true;
    do {
      skipBlanks();
      if (!string()) return false;
      skipBlanks();
      if (!accept(':') || !value(depth)) return false;
      skipBlanks();
    } while (accept(','));
    return accept('}');
  }

  bool array(int depth) {
    if (depth > kMaxDepth || !accept('[')) return false;
    skipBlanks();
    if (accept(']')) return true;
    do {
      if (!value(depth)) return false;
      skipBlanks();
    } while (accept(','));
    return accept(']');
  }

  bool string() {
    if (!accept('"')) return false;
    while (!atEnd()) {
      const auto c = static_cast<unsigned char>(text[pos++]);
      if (c == '"') return true;
      if (c < 0x20) return false;
      if (c == '\\' && !escape()) return false;
    }
    return false;
  }

  bool escape() {
    if (atEnd()) return false;
    const char c = text[pos++];
    if (c == 'u') {
      for (int i = 0; i < 4; ++i) {
        if (atEnd() || !isHex(text[pos++])) return false;
      }
      return true;
    }
    return std::string_view("\"\\/bfnrt").find(c) != std::string_view::npos;
  }

  bool digits() {
    const size_t start = pos;
    while (!atEnd() && isDigit(text[pos])) ++pos;
    return pos > start;
  }

  bool number() {
    accept('-');
    if (!digits()) return false;
    if (accept('.') && !digits()) return false;
    if (peek() == 'e' || peek() == 'E') {
      ++pos;
      if (!accept('+')) accept('-');
      if (!digits()) return false;
    }
    return true;
  }

  bool word(std::string_view expected) {
    if (text.substr(pos, expected.size()) != expected) return false;
    pos += expected.size();
    return true;
  }

  std::string_view text;
  size_t pos = 0;
};

}  // namespace

std::optional<size_t> findRootObjectEnd(std::string_view text) { return Scanner(text).rootEnd(); }

}  // namespace qverr
