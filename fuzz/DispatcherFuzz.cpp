// libFuzzer target: arbitrary bytes as a host's message, through the receive, the dispatcher,
// the value readers and the configuration file's parser.
#include <sys/socket.h>
#include <unistd.h>

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

#include "hostlink/HostConnection.h"
#include "protocol/Dispatcher.h"
#include "protocol/ValueReaders.h"
#include "service/Configuration.h"

namespace {

// Reads and drops whatever the service answered, so the next input starts clean.
void Drain(int socket) {
  char sink[4096];
  while (recv(socket, sink, sizeof sink, MSG_DONTWAIT) > 0) {
  }
}

void FuzzReaders(std::string_view value) {
  (void)nKV_DLL300::ReadInteger(value);
  (void)nKV_DLL300::ReadByte(value);
  (void)nKV_DLL300::ReadUnsigned64(value, 7);
  (void)nKV_DLL300::ReadKey(value);
  (void)nKV_DLL300::ReadRate(value);
  (void)nKV_DLL300::ChoosePortText(std::string(value));
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  std::string_view bytes(reinterpret_cast<const char*>(data), size);
  FuzzReaders(bytes);
  if (size == 0) return 0;  // nothing to receive: the receive would only wait

  int pair[2];
  if (socketpair(AF_UNIX, SOCK_STREAM, 0, pair) != 0) return 0;
  if (send(pair[1], data, size, MSG_NOSIGNAL) != static_cast<ssize_t>(size)) {
    close(pair[0]);
    close(pair[1]);
    return 0;
  }
  {
    nKV_DLL300::HostConnection connection(pair[0], nKV_DLL300::ConnectionSetup{});
    // Every receive takes at most 256 bytes; handle all of the input as the loop would.
    for (size_t handled = 0; handled < size; handled += 256) {
      (void)nKV_DLL300::DispatchMessage(connection);
      Drain(pair[1]);
    }
  }  // closes pair[0]
  close(pair[1]);
  return 0;
}
