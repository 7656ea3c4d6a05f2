// Test helper: live sessions with a log over TCP against the simulated hardware, and their files.
#pragma once

#include <gtest/gtest.h>

#include <filesystem>
#include <string>
#include <vector>

#include "logging/BinaryRecordReader.h"
#include "tests/session/CanSessionFixture.h"

namespace kvtest {

inline constexpr char kLogDirectory[] = "QV-RT\\tarvix\\kelvane\\";

class LogRunTest : public CanSessionTest {
 protected:
  // Connects a host, sends `properties` (each answered; error texts kept) and starts a session.
  kvhost::HostClient Configured(const std::vector<std::string>& properties,
                                std::vector<std::string>& errors) {
    kvhost::HostClient host = ConnectHost();
    for (const std::string& property : properties) {
      std::optional<kvhost::HostMessage> reply = Command(host, property);
      EXPECT_TRUE(reply) << property;
      if (reply && reply->header.type == kvhost::kErrorText) {
        errors.push_back(reply->text());
        // A name answered like an empty one is acknowledged after the error.
        if (property.starts_with("SET_PROP_LOGFILE_NAME=")) {
          EXPECT_TRUE(NextMessage(host, IsText));
        }
      }
    }
    // The new session's log may report a failure before the start is acknowledged: no reply.
    EXPECT_TRUE(host.Send("CMD_SESSION_START"));
    std::optional<kvhost::HostMessage> started = NextMessage(
        host,
        [&](const kvhost::HostMessage& m) {
          const bool logError =
              m.header.type == kvhost::kErrorText && m.text().starts_with("<ERROR:LOG FILE");
          if (logError) errors.push_back(m.text());
          return !logError &&
                 (m.header.type == kvhost::kText || m.header.type == kvhost::kErrorText);
        },
        kReplyDeadline);
    EXPECT_TRUE(started && started->text() == "<ACK: CMD_SESSION_START>\n")
        << (started ? started->text() : "no reply");
    return host;
  }

  // Waits for `periods` non-empty identifier-record messages of `recordType`, keeping error texts.
  void WaitForRecords(kvhost::HostClient& host, uint8_t recordType,
                      std::vector<std::string>& errors, int periods = 2) {
    for (int seen = 0; seen < periods;) {
      std::optional<kvhost::HostMessage> m = NextMessage(host, [&](const kvhost::HostMessage& m) {
        if (m.header.type == kvhost::kErrorText) errors.push_back(m.text());
        return m.header.type == recordType;
      });
      if (!m) {
        ADD_FAILURE() << "no identifier records";
        return;
      }
      if (!m->payload.empty()) ++seen;
    }
  }

  void Terminate(kvhost::HostClient& host) {
    EXPECT_TRUE(host.Send("CMD_SESSION_TERMINATE"));
    EXPECT_TRUE(host.WaitForClose(kConditionDeadline));
  }

  // One logging session run until `periods` record messages arrived; the error texts it received.
  std::vector<std::string> Run(const std::vector<std::string>& properties, uint8_t recordType,
                               int periods = 2) {
    std::vector<std::string> errors;
    kvhost::HostClient host = Configured(properties, errors);
    WaitForRecords(host, recordType, errors, periods);
    Terminate(host);
    return errors;
  }

  std::filesystem::path LogPath(const std::string& name) const {
    return drive_.Native(kLogDirectory + name);
  }
  std::string LogFile(const std::string& name) {
    std::optional<std::string> contents = drive_.ReadFile(kLogDirectory + name);
    EXPECT_TRUE(contents) << name;
    return contents.value_or("");
  }

  static bool IsText(const kvhost::HostMessage& m) { return m.header.type == kvhost::kText; }
};

// The whole records of `bytes` (views into it) and the count of bytes after them.
inline std::vector<driver::RawFrameView> ReadRecords(const uint8_t* bytes, size_t size,
                                                     nKV_DLL300::BinaryRecordLayout layout,
                                                     size_t* remaining = nullptr) {
  nKV_DLL300::BinaryRecordReader reader(bytes, size, layout);
  std::vector<driver::RawFrameView> records;
  for (driver::RawFrameView view; reader.next(view);) records.push_back(view);
  if (remaining != nullptr) *remaining = reader.remaining();
  return records;
}
// The records of a binary log file, after its 12-byte header.
inline std::vector<driver::RawFrameView> ReadRecords(const std::string& file,
                                                     nKV_DLL300::BinaryRecordLayout layout,
                                                     size_t* remaining = nullptr) {
  if (file.size() < 12) return {};
  return ReadRecords(reinterpret_cast<const uint8_t*>(file.data()) + 12, file.size() - 12, layout,
                     remaining);
}

}  // namespace kvtest
