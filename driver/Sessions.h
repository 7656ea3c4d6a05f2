// Session modes, start/stop scopes, wait conditions, database object classes and built-in names.
#pragma once

#include <cstdint>

namespace driver {

// kxCreateSession modes.
inline constexpr uint32_t kModeReceiveStream = 6;
inline constexpr uint32_t kModeOutputQueued = 10;       // each written frame is sent once, in order
inline constexpr uint32_t kModeOutputSinglePoint = 11;  // the latest written frame; cyclic repeat

// kxStart / kxStop scopes.
inline constexpr uint32_t kScopeNormal = 0;         // session and its interface
inline constexpr uint32_t kScopeSessionOnly = 1;    // the session only
inline constexpr uint32_t kScopeInterfaceOnly = 2;  // the interface only: stop it to configure it

// kxWait conditions.
inline constexpr uint32_t kWaitTransmitComplete = 0x8001;
inline constexpr uint32_t kWaitInterfaceCommunicating = 0x8002;

// kxdbCreateObject classes.
inline constexpr uint32_t kClassCluster = 0x10000;
inline constexpr uint32_t kClassFrame = 0x20000;

// kxdbCloseDatabase.
inline constexpr uint32_t kCloseThisReference = 0;
inline constexpr uint32_t kCloseAll = 1;

// Built-in database names.
inline constexpr const char* kDatabaseCan = ":can:";
inline constexpr const char* kDatabaseCanFd = ":can_fd:";
inline constexpr const char* kDatabaseCanFdBrs = ":can_fd_brs:";
inline constexpr const char* kDatabaseCanJ1939 = ":can_j1939:";
inline constexpr const char* kDatabaseMemory = ":memory:";
inline constexpr const char* kDatabaseSubordinate = ":subordinate:";
inline constexpr const char* kDatabaseSubordinateJ1939 = ":subordinate_j1939:";

// Interface names may carry a suffix after this character ("CAN1@qv_corle_tarvix"); the driver
// looks interfaces up by the part before it.
inline constexpr char kInterfaceSuffixSeparator = '@';

}  // namespace driver
