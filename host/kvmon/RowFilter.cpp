// Reading filter terms in the two notations and matching rows by their bus.
#include "host/kvmon/RowFilter.h"

#include <algorithm>
#include <cctype>

namespace kvmon {
namespace {

constexpr uint32_t kStandardMask = 0x7FF;
constexpr uint32_t kExtendedMask = 0x1FFFFFFF;
constexpr size_t kStandardDigits = 3;

// 1 to 8 hex digits; false otherwise.
bool ReadHex(const std::string& text, uint32_t& value) {
  if (text.empty() || text.size() > 8) return false;
  value = 0;
  for (const char c : text) {
    if (!std::isxdigit(static_cast<unsigned char>(c))) return false;
    const int digit = std::isdigit(static_cast<unsigned char>(c))
                          ? c - '0'
                          : std::tolower(static_cast<unsigned char>(c)) - 'a' + 10;
    value = value << 4 | static_cast<uint32_t>(digit);
  }
  return true;
}

// Decimal slot (1 to 4 digits) and an optional channel letter.
bool ReadSlot(const std::string& text, uint32_t& slot, int& channel) {
  size_t digits = 0;
  while (digits < text.size() && std::isdigit(static_cast<unsigned char>(text[digits]))) ++digits;
  if (digits == 0 || digits > 4 || digits + 1 < text.size()) return false;
  slot = static_cast<uint32_t>(std::stoul(text.substr(0, digits)));
  channel = -1;
  if (digits == text.size()) return true;
  const char letter = static_cast<char>(std::toupper(static_cast<unsigned char>(text[digits])));
  if (letter != 'A' && letter != 'B') return false;
  channel = letter == 'A' ? 0 : 1;
  return true;
}

}  // namespace

bool RowFilter::readTerm(const std::string& text, Term& term) {
  std::string body = text;
  term.exclude = !body.empty() && body[0] == '~';
  if (term.exclude) body.erase(0, 1);
  const size_t colon = body.find(':');
  const std::string value = body.substr(0, colon);
  term.hasIdentifier = ReadHex(value, term.identifier);
  term.extended = value.size() > kStandardDigits;
  term.mask = term.extended ? kExtendedMask : kStandardMask;
  if (colon != std::string::npos) {
    term.hasIdentifier = term.hasIdentifier && ReadHex(body.substr(colon + 1), term.mask);
  } else {
    term.hasSlot = ReadSlot(value, term.slot, term.channel);
  }
  if (term.hasIdentifier && term.identifier > (term.extended ? kExtendedMask : kStandardMask))
    term.hasIdentifier = false;
  return term.hasIdentifier || term.hasSlot;
}

std::optional<RowFilter> RowFilter::parse(const std::string& text, std::string& error) {
  RowFilter filter;
  filter.text_ = text;
  size_t start = 0;
  while (start <= text.size()) {
    const size_t comma = std::min(text.find(',', start), text.size());
    const std::string item = text.substr(start, comma - start);
    Term term;
    if (!readTerm(item, term)) {
      error = "'" + item +
              "' is no identifier (hex: 100, 18FEF100, 100:7F0) or FlexRay slot (decimal: 40, "
              "40A)";
      return std::nullopt;
    }
    filter.terms_.push_back(term);
    start = comma + 1;
  }
  return filter;
}

bool RowFilter::matches(const Term& term, Bus bus, const kvhost::IdentifierRecord& record) {
  switch (bus) {
    case Bus::kFlexRay:
      return term.hasSlot && record.identifier == term.slot &&
             (term.channel < 0 || term.channel == record.channel);
    case Bus::kLin:
      return term.hasIdentifier && (record.identifier & term.mask) == (term.identifier & term.mask);
    case Bus::kCan:
    case Bus::kNone:
      break;
  }
  return term.hasIdentifier && IsExtended(bus, record) == term.extended &&
         (PlainIdentifier(bus, record) & term.mask) == (term.identifier & term.mask);
}

bool RowFilter::accepts(Bus bus, const kvhost::IdentifierRecord& record) const {
  bool anyInclude = false;
  bool included = false;
  for (const Term& term : terms_) {
    const bool match = matches(term, bus, record);
    if (term.exclude && match) return false;
    if (!term.exclude) {
      anyInclude = true;
      included = included || match;
    }
  }
  return !anyInclude || included;
}

}  // namespace kvmon
