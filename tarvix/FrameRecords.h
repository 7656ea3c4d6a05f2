// The frame records an output session is written: the raw layout, checked against the session's
// database frames.
#pragma once

#include <cstdint>
#include <utility>
#include <vector>

#include "tarvix/SessionSetup.h"
#include "tarvix/SimFrame.h"

namespace tarvix {

using FrameRecord = std::pair<SimFrame, const FrameDefinition*>;

// Parses `size` bytes of raw frame records written to an output session of `setup`. Each record
// becomes the frame to send (identifier, type and length from its database frame and its
// header) with the database frame it belongs to (a pointer into setup.frames). The record's
// identifier selects the frame when the session has several. Returns kInvalidFrame for a
// malformed or empty write, kFrameNotFound for a record that names no frame of the session.
int32_t ParseFrameRecords(const SessionSetup& setup, const uint8_t* data, uint32_t size,
                          std::vector<FrameRecord>& out);

}  // namespace tarvix
