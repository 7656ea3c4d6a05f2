// The transmit-frame properties (SET_TX_PROP_*), which fill the frame of a CAN session.
#pragma once

#include "protocol/PropertyReply.h"

namespace nKV_DLL300 {

class CTransmitFrame;

// Installs the handlers of ids 24 to 30. Each acknowledges first (with the session in the
// header), then stores the value, unchecked, in the frame of the connection's CAN session; without
// a CAN session the message is dropped unanswered.
void AddTransmitPropertyHandlers(PropertyHandlerTable& table);

// The transmit frame of the connection's session when that session is a CAN one (whatever bus the
// port name names now), else null. Service thread.
CTransmitFrame* CanTransmitFrame(HostConnection& connection);

}  // namespace nKV_DLL300
