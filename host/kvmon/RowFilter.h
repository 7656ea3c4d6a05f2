// kvmon's identifier filter (-f): which rows of the live table and which record lines are shown.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "host/RecordDecoder.h"
#include "host/kvmon/FrameNames.h"

namespace kvmon {

// A comma-separated list of terms, each written as kvmon shows identifiers:
//   100  18FEF100       CAN or LIN identifier in hex; more than three digits: extended (CAN)
//   100:7F0             identifier and mask: shown when (id & mask) == (100 & mask)
//   40  40A  40B        FlexRay slot in decimal, optionally one channel
//   ~TERM               leave rows of TERM out
// A row is shown when it matches one of the other terms (or there are none) and no ~ term. A term
// is read by the bus of the row: "40" is identifier 0x40 on CAN and LIN, slot 40 on FlexRay.
// An empty filter shows every row. A value, immutable once parsed.
class RowFilter {
 public:
  RowFilter() = default;
  // nullopt with `error` in plain words when a term is neither form.
  static std::optional<RowFilter> parse(const std::string& text, std::string& error);

  bool accepts(Bus bus, const kvhost::IdentifierRecord& record) const;
  bool empty() const { return terms_.empty(); }
  const std::string& text() const { return text_; }

 private:
  struct Term {
    bool exclude = false;
    bool hasIdentifier = false;  // the hex reading
    uint32_t identifier = 0;
    uint32_t mask = 0;
    bool extended = false;
    bool hasSlot = false;  // the FlexRay reading
    uint32_t slot = 0;
    int channel = -1;  // 0 A, 1 B, -1 either
  };
  static bool readTerm(const std::string& text, Term& term);
  static bool matches(const Term& term, Bus bus, const kvhost::IdentifierRecord& record);

  std::vector<Term> terms_;
  std::string text_;
};

}  // namespace kvmon
