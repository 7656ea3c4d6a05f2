// The one service of the module: listener, service thread, driver values, eight host slots.
#pragma once

#include <array>
#include <atomic>
#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "hostlink/HardwareRecord.h"
#include "hostlink/HostConnection.h"
#include "hostlink/ServiceStatistics.h"
#include "platform/net/Socket.h"
#include "protocol/DriverSystem.h"
#include "qvapal/tThreadController.h"

namespace nKV_DLL300 {

class CPollTCPThread;

constexpr size_t kConnectionSlots = 8;
constexpr uint32_t kModuleStartDelayMs = 10000;

// How a service starts. The module always uses the defaults with the linked driver; tests
// shorten the delay and the heartbeat time and let the system choose the port.
struct ServiceOptions {
  uint32_t startDelayMs = kModuleStartDelayMs;
  // A host that sends no CMD_HEARTBEAT for longer than this is ended.
  uint32_t heartbeatLimitMs = kDefaultHeartbeatLimitMs;
  // Replaces the configuration file when set (its text is read like the file's value).
  std::optional<std::string> portText;
  DriverSystem* driver = nullptr;  // required; not owned, must outlive the service
  // Send buffer of accepted sockets in bytes; 0 keeps the system's default.
  int32_t socketSendBufferBytes = 0;
};

// One slot of the connection table: free (invalid socket, no connection) or occupied.
// socket and connection are the service thread's.
struct ConnectionSlot {
  platform::net::SocketHandle socket = platform::net::kInvalidSocket;
  std::unique_ptr<HostConnection> connection;
  // The connection as other threads (tests, diagnostics) may see it: published once it is built,
  // withdrawn (exchanged for null) before it is destroyed. Any thread; a reader keeps using it only
  // while it knows by other means that the host is still connected, and hands its reads over
  // before the host leaves by a read-modify-write of this pointer, which the withdrawal acquires.
  std::atomic<HostConnection*> published{nullptr};
};

// Construction starts the service thread. After construction every field below is the service
// thread's, except where a comment says otherwise.
class ServiceContext {
 public:
  explicit ServiceContext(ServiceOptions options);
  // Shuts down in order (see shutdown).
  ~ServiceContext();
  ServiceContext(const ServiceContext&) = delete;
  ServiceContext& operator=(const ServiceContext&) = delete;

  // Ends the service for unloading: stops the loop, waits for the service thread, stops every
  // session, closes the connections and the listener. Idempotent; any thread but the service
  // thread.
  void shutdown();

  // The port the listener is bound to, or -1 before it listens (or after a failed set-up).
  // Any thread.
  int32_t listeningPort() const { return boundPort.load(); }
  // Any thread.
  const ServiceStatistics& statistics() const { return stats; }
  // True once the configuration was read and the listener set up (successfully or not).
  // Any thread.
  bool isSetUp() const { return setUpComplete.load(); }

  std::atomic<platform::net::SocketHandle> listenSocket{platform::net::kInvalidSocket};
  std::unique_ptr<nQVAPAL000::tThreadController> threadController;  // constructing thread
  std::unique_ptr<CPollTCPThread> serviceThread;                    // constructing thread
  std::atomic<bool> running{true};                                  // any thread
  uint32_t driverVersion[kDriverVersionCount] = {};
  std::vector<HardwareRecord> hardwareTable;  // rebuilt at every accept; copied to each host
  std::array<ConnectionSlot, kConnectionSlots> connections;
  const ServiceOptions options;
  ServiceStatistics stats;                 // atomics, any thread
  std::atomic<int32_t> boundPort{-1};      // any thread
  std::atomic<bool> setUpComplete{false};  // any thread: configuration and listener done
  std::atomic<bool> shutDown_{false};      // any thread: shutdown ran
};

// The start-up and loop of the service thread: wait, configuration, listener, version values,
// then passes of the connection loop every 10 ms while running.
void RunService(ServiceContext& context);

}  // namespace nKV_DLL300
