// The text log lines of CAN, LIN and FlexRay frames, formatted without printf or allocation.
#include "logging/TextLogFormat.h"

#include <algorithm>

#include "logging/FileTime.h"
#include "logging/TextCells.h"

namespace nKV_DLL300 {
namespace {

using namespace textcells;

constexpr uint32_t kExtendedIdentifierFlag = 0x2000'0000;
constexpr uint8_t kLinTypeNoResponse = 0x42;
constexpr uint32_t kLinPayloadGroups = 8;

struct TypeText {
  const char* text;
  size_t length;
};

// Type cell of a CAN line, ended by the line feed.
TypeText CanTypeText(uint8_t type, bool extended) {
  switch (type) {
    case 0x01:
      return extended ? TypeText{"E/R\n", 4} : TypeText{"S/R\n", 4};
    case 0x10:
      return extended ? TypeText{"E/FD\n", 5} : TypeText{"FD\n", 3};
    case 0x18:
      return extended ? TypeText{"E/BRS\n", 6} : TypeText{"BRS\n", 4};
    default:
      return extended ? TypeText{"E\n", 2} : TypeText{"S\n", 2};
  }
}

// "\t%1d\t" with a length.
char* AppendLengthCell(char* p, uint32_t length) {
  *p++ = '\t';
  p = AppendDecimal(p, length);
  *p++ = '\t';
  return p;
}

// One "X"/"-" column of a FlexRay line, followed by `end` (a tab, or the line feed).
char* AppendMark(char* p, bool set, char end) {
  p[0] = set ? 'X' : '-';
  p[1] = end;
  return p + 2;
}

char FlexRayChannel(uint8_t flags) {
  if (flags & 0x10) return 'A';
  if (flags & 0x20) return 'B';
  return '-';
}

}  // namespace

char* AppendTimeCell(char* p, uint64_t fileTime) {
  CalendarTime t;
  if (!FileTimeToCalendarTime(fileTime, t)) return AppendText(p, "--:--:--,---\t", kTimeCellLength);
  p = AppendTwoDigits(p, t.hour);
  *p++ = ':';
  p = AppendTwoDigits(p, t.minute);
  *p++ = ':';
  p = AppendTwoDigits(p, t.second);
  *p++ = ',';
  p = AppendThreeDigits(p, t.milliseconds);
  *p++ = '\t';
  return p;
}

size_t FormatCanTextLine(char* out, size_t cap, const driver::RawFrameView& frame) {
  if (cap < CanTextLineMaxLength(frame.payloadLength)) return 0;
  const driver::RawFrameHeader& h = frame.header;
  const bool extended = (h.identifier & kExtendedIdentifierFlag) != 0;
  char* p = AppendTimeCell(out, h.timestamp);
  p = AppendHex(p, h.identifier & (extended ? 0x1FFF'FFFFu : 0x7FFu));
  *p++ = '\t';
  p = AppendPayloadGroups(p, frame.payload, frame.payloadLength);
  p = AppendLengthCell(p, driver::RawPayloadLength(h));
  const TypeText type = CanTypeText(h.type, extended);
  p = AppendText(p, type.text, type.length);
  return static_cast<size_t>(p - out);
}

size_t FormatLinTextLine(char* out, size_t cap, const driver::RawFrameView& frame,
                         uint8_t logChecksum) {
  if (cap < kLinTextLineMaxLength) return 0;
  const driver::RawFrameHeader& h = frame.header;
  const uint32_t shown = std::min(frame.payloadLength, kLinPayloadGroups);
  char* p = AppendTimeCell(out, h.timestamp);
  p = AppendHex(p, h.identifier);
  *p++ = '\t';
  p = AppendPayloadGroups(p, frame.payload, shown);
  // Short frames are padded with "00  " groups: the payload cell always holds eight groups.
  static constexpr uint8_t kZeros[kLinPayloadGroups] = {};
  p = AppendPayloadGroups(p, kZeros, kLinPayloadGroups - shown);
  p = AppendLengthCell(p, h.length);
  if (logChecksum != 0) {
    p = AppendHex2(p, h.info);
    *p++ = '\t';
  }
  p = h.type == kLinTypeNoResponse ? AppendText(p, "NR\n", 3) : AppendText(p, "S\n", 2);
  return static_cast<size_t>(p - out);
}

size_t FormatFlexRayTextLine(char* out, size_t cap, const driver::RawFrameView& frame) {
  const driver::RawFrameHeader& h = frame.header;
  const uint32_t shown = std::min<uint32_t>(frame.payloadLength, h.length);
  if (cap < FlexRayTextLineMaxLength(shown)) return 0;
  char* p = AppendTimeCell(out, h.timestamp);
  p = AppendHex(p, h.identifier & 0xFFFFu);
  *p++ = '\t';
  p = AppendPayloadGroups(p, frame.payload, shown);
  p = AppendLengthCell(p, h.length);
  p = AppendDecimal(p, h.info);
  *p++ = '\t';
  *p++ = FlexRayChannel(h.flags);
  *p++ = '\t';
  p = AppendMark(p, h.flags & 0x01, '\t');
  p = AppendMark(p, h.flags & 0x02, '\t');
  p = AppendMark(p, h.flags & 0x04, '\n');
  return static_cast<size_t>(p - out);
}

}  // namespace nKV_DLL300
