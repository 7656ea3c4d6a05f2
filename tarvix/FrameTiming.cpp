// Bit lengths and bus times of simulated frames.
#include "tarvix/FrameTiming.h"

#include "driver/FrameTypes.h"

namespace tarvix {
namespace {

// The state of the stuff-bit rule between bits: the level of the current run (2 before the first
// bit) and its length so far (1-4; 0 before the first bit).
struct RunState {
  uint8_t last = 2;
  uint8_t run = 0;
};

// One bit through the rule: after five equal bits the transmitter inserts one of the opposite
// level, which itself starts a new run. Returns the stuff bits inserted (0 or 1).
constexpr uint32_t StuffStep(RunState& s, uint32_t bit) {
  if (bit != s.last) {
    s.last = static_cast<uint8_t>(bit);
    s.run = 1;
    return 0;
  }
  if (++s.run < 5) return 0;
  s.last = static_cast<uint8_t>(bit ^ 1u);
  s.run = 1;
  return 1;
}

// The CRC-15 register after one more bit.
constexpr uint32_t Crc15Step(uint32_t crc, uint32_t bit) {
  const uint32_t next = ((crc >> 14) & 1u) ^ bit;
  crc = (crc << 1) & 0x7FFFu;
  return next ? crc ^ 0x4599u : crc;
}

// What a whole byte does to each run state: stuff bits inserted and the state after it.
struct ByteStep {
  uint8_t stuff;
  RunState after;
};
constexpr int kRunStates = 3 * 5;  // last 0, 1, 2 by run 0-4
constexpr int RunIndex(RunState s) { return s.last * 5 + s.run; }

struct ByteTables {
  ByteStep stuff[kRunStates][256];
  uint16_t crc[256];  // CRC-15 of eight zero bits from a register holding the byte in bits 14-7
};

constexpr ByteTables MakeByteTables() {
  ByteTables t{};
  for (int last = 0; last < 3; ++last) {
    for (int run = 0; run < 5; ++run) {
      for (uint32_t byte = 0; byte < 256; ++byte) {
        RunState s{static_cast<uint8_t>(last), static_cast<uint8_t>(run)};
        uint32_t stuff = 0;
        for (int i = 7; i >= 0; --i) stuff += StuffStep(s, (byte >> i) & 1u);
        t.stuff[last * 5 + run][byte] = ByteStep{static_cast<uint8_t>(stuff), s};
      }
    }
  }
  for (uint32_t byte = 0; byte < 256; ++byte) {
    uint32_t crc = byte << 7;
    for (int i = 0; i < 8; ++i) crc = Crc15Step(crc, 0);
    t.crc[byte] = static_cast<uint16_t>(crc);
  }
  return t;
}

constexpr ByteTables kByteTables = MakeByteTables();

// Collects the bits of a frame's stuffed region, most significant first, and counts the stuff
// bits a transmitter inserts and the CRC-15 over them. ByteWise takes whole bytes through the
// tables above; the bit-by-bit form is the reference they are checked against.
template <bool ByteWise>
class StuffCounter {
 public:
  void add(uint32_t value, int bits) {
    if constexpr (ByteWise) {
      for (; bits >= 8; bits -= 8) addByte((value >> (bits - 8)) & 0xFFu);
    }
    for (int i = bits - 1; i >= 0; --i) addBit((value >> i) & 1u);
  }
  uint32_t stuffBits() const { return stuff_; }
  uint32_t crc15() const { return crc_; }

 private:
  void addBit(uint32_t bit) {
    crc_ = Crc15Step(crc_, bit);
    stuff_ += StuffStep(state_, bit);
  }
  void addByte(uint32_t byte) {
    crc_ = ((crc_ << 8) & 0x7FFFu) ^ kByteTables.crc[((crc_ >> 7) ^ byte) & 0xFFu];
    const ByteStep& step = kByteTables.stuff[RunIndex(state_)][byte];
    stuff_ += step.stuff;
    state_ = step.after;
  }
  uint32_t crc_ = 0;
  RunState state_;
  uint32_t stuff_ = 0;
};

uint32_t FdDlc(uint32_t length) {
  static constexpr uint8_t kLengths[16] = {0, 1, 2, 3, 4, 5, 6, 7, 8, 12, 16, 20, 24, 32, 48, 64};
  for (uint32_t dlc = 0; dlc < 16; ++dlc) {
    if (kLengths[dlc] >= length) return dlc;
  }
  return 15;
}

template <class Counter>
void AddIdentifier(Counter& s, uint32_t identifier, bool extended, uint32_t rtrOrRrs) {
  if (extended) {
    const uint32_t id = identifier & driver::kExtendedIdMask;
    s.add(id >> 18, 11);
    s.add(0x3, 2);  // SRR and IDE, recessive
    s.add(id & 0x3FFFF, 18);
    s.add(rtrOrRrs, 1);
  } else {
    s.add(identifier & driver::kStandardIdMask, 11);
    s.add(rtrOrRrs, 1);
    s.add(0, 1);  // IDE
  }
}

template <bool ByteWise>
BitLength ClassicBitLength(const SimFrame& f) {
  const bool extended = (f.identifier & driver::kExtendedIdFlag) != 0;
  const bool remote = f.type == driver::kFrameCanRemote;
  const uint32_t length = f.length > 8 ? 8 : f.length;
  StuffCounter<ByteWise> s;
  s.add(0, 1);  // start of frame
  AddIdentifier(s, f.identifier, extended, remote ? 1 : 0);
  s.add(0, extended ? 2 : 1);  // reserved bits
  s.add(length, 4);
  if (!remote) {
    for (uint32_t i = 0; i < length; ++i) s.add(f.payload[i], 8);
  }
  const uint32_t crc = s.crc15();
  s.add(crc, 15);
  const uint32_t fieldBits = (extended ? 39 : 19) + (remote ? 0 : 8 * length) + 15;
  // CRC delimiter, ACK slot, ACK delimiter, end of frame (7), interframe space (3).
  return BitLength{fieldBits + s.stuffBits() + 13, 0};
}

template <bool ByteWise>
BitLength FdBitLength(const SimFrame& f) {
  const bool extended = (f.identifier & driver::kExtendedIdFlag) != 0;
  const bool brs = f.type == driver::kFrameCanFdBrsData;
  const uint32_t length = CanFdLength(f.length);
  StuffCounter<ByteWise> arbitration;
  arbitration.add(0, 1);
  AddIdentifier(arbitration, f.identifier, extended, 0);
  arbitration.add(0x2 | (brs ? 1u : 0u), 3);  // FDF, res, BRS
  StuffCounter<ByteWise> data;
  data.add(FdDlc(length), 5);  // ESI and DLC
  for (uint32_t i = 0; i < length; ++i) data.add(i < f.length ? f.payload[i] : 0, 8);
  // Arbitration phase and the nominal-rate tail (CRC delimiter to interframe space); data phase
  // with stuff count, CRC-17/21 and their fixed stuff bits.
  const uint32_t a = (extended ? 41 : 22) + 12 + arbitration.stuffBits();
  const uint32_t crcBits = length > 16 ? 29 : 24;
  const uint32_t d = 8 * length + crcBits + data.stuffBits();
  return brs ? BitLength{a, d} : BitLength{a + d, 0};
}

}  // namespace

uint32_t CanFdLength(uint32_t length) {
  static constexpr uint8_t kLengths[16] = {0, 1, 2, 3, 4, 5, 6, 7, 8, 12, 16, 20, 24, 32, 48, 64};
  return kLengths[FdDlc(length)];
}

template <bool ByteWise>
BitLength CanBitLengthBy(const SimFrame& f) {
  switch (f.type) {
    case driver::kFrameCanBusError:
      return BitLength{6 + 8 + 3, 0};  // error flag, error delimiter, interframe space
    case driver::kFrameCanFdData:
    case driver::kFrameCanFdBrsData:
      return FdBitLength<ByteWise>(f);
    default:
      return ClassicBitLength<ByteWise>(f);
  }
}

BitLength CanBitLength(const SimFrame& f) { return CanBitLengthBy<true>(f); }

BitLength CanBitLengthBitByBit(const SimFrame& f) { return CanBitLengthBy<false>(f); }

int64_t BitsToNs(uint64_t bits, uint64_t bitRate) {
  if (bitRate == 0) return 0;
  return static_cast<int64_t>((bits * 1000000000ULL + bitRate / 2) / bitRate);
}

int64_t CanFrameNs(const SimFrame& f, uint64_t bitRate, uint64_t dataBitRate) {
  const BitLength b = CanBitLength(f);
  return BitsToNs(b.nominalBits, bitRate) +
         BitsToNs(b.dataBits, dataBitRate ? dataBitRate : bitRate);
}

uint8_t LinProtectedId(uint8_t id) {
  const auto bit = [id](int n) { return (id >> n) & 1; };
  const int p0 = bit(0) ^ bit(1) ^ bit(2) ^ bit(4);
  const int p1 = !(bit(1) ^ bit(3) ^ bit(4) ^ bit(5));
  return static_cast<uint8_t>((id & 0x3F) | (p0 << 6) | (p1 << 7));
}

uint8_t LinChecksum(uint8_t id, const uint8_t* data, uint32_t length, bool enhanced) {
  uint32_t sum = enhanced ? LinProtectedId(id) : 0;
  for (uint32_t i = 0; i < length; ++i) {
    sum += data[i];
    if (sum > 0xFF) sum -= 0xFF;
  }
  return static_cast<uint8_t>(~sum & 0xFF);
}

uint32_t LinHeaderBits() { return 13 + 1 + 10 + 10; }

uint32_t LinResponseBits(uint32_t length) { return 10 * (length + 1); }

uint32_t FlexRayFrameBits(uint32_t length) {
  // Transmission start (9), frame start (1), header (5 bytes), payload, CRC (3 bytes) with two byte
  // start bits each, frame end (2).
  return 9 + 1 + 10 * (5 + length + 3) + 2;
}

}  // namespace tarvix
