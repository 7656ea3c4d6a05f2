// Test helper: the built vora.dll installed on a temporary drive, and the one channel of a type 2
// log.
#pragma once

#include <gtest/gtest.h>

#include <filesystem>
#include <optional>
#include <string>
#include <vector>

#include "host/voradump/VoraReader.h"
#include "tests/support/ServiceFixture.h"

namespace kvtest {

inline constexpr char kVoraBelowDrive[] = "Program Files\\Quovera\\Shared\\vora\\vora.dll";

// Copies `library` (the built vora.dll by default) to `belowDrive`. The old file is removed first,
// so the loader sees a new file and not a cached one.
inline void InstallLibrary(const TemporaryDrive& drive,
                           const std::string& belowDrive = kVoraBelowDrive,
                           const char* library = VORA_DLL_PATH) {
  const std::filesystem::path target = drive.Native(belowDrive);
  std::filesystem::create_directories(target.parent_path());
  std::filesystem::remove(target);
  std::filesystem::copy_file(library, target);
}

// What a reader finds in the only channel of a file.
struct ChannelContents {
  voradump::Channel channel;
  std::vector<uint8_t> bytes;
};

inline std::optional<ChannelContents> OnlyChannel(const std::filesystem::path& file) {
  std::string error;
  std::unique_ptr<voradump::VoraReader> reader = voradump::VoraReader::Open(file.string(), error);
  if (!reader) {
    ADD_FAILURE() << file << ": " << error;
    return std::nullopt;
  }
  const std::vector<voradump::Group> groups = reader->Groups();
  if (groups.size() != 1 || groups[0].channels.size() != 1) {
    ADD_FAILURE() << file << ": not one group with one channel";
    return std::nullopt;
  }
  ChannelContents contents{groups[0].channels[0], {}};
  EXPECT_EQ(reader->ReadBytes(contents.channel, contents.bytes), "");
  return contents;
}

// The three properties every type 2 channel carries.
inline void ExpectFrameProperties(const voradump::Channel& channel, int64_t protocol) {
  EXPECT_EQ(channel.IntegerProperty("QV_network_frame_byte_order"), 0);
  EXPECT_EQ(channel.IntegerProperty("QV_network_frame_version"), 512);
  EXPECT_EQ(channel.IntegerProperty("QV_network_protocol"), protocol);
}

}  // namespace kvtest
