// Building the frame record of the transmit frame.
#include "transmit/TxFrameRecord.h"

#include <algorithm>

#include "driver/FrameTypes.h"

namespace nKV_DLL300 {

uint32_t BuildTxFrameRecord(const TxFrameFields& fields, TxFrameRecord& record) {
  record = TxFrameRecord{};
  const uint32_t length = std::min<uint32_t>(fields.payloadLength & 0xFFu, kTxMaxPayload);
  record.header.identifier = fields.identifier | (fields.extended ? driver::kExtendedIdFlag : 0u);
  record.header.type = fields.remote ? driver::kFrameCanRemote : driver::kFrameCanData;
  record.header.length = static_cast<uint8_t>(length);
  const size_t given =
      fields.payload != nullptr ? std::min<size_t>(fields.payload->size(), length) : 0;
  if (given > 0) std::copy_n(fields.payload->data(), given, record.payload);
  return driver::kRawFrameHeaderSize + driver::RawPayloadArea(length);
}

}  // namespace nKV_DLL300
