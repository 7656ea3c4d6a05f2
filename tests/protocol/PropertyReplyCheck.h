// Comparing a received reply with its expected bytes, type and header fields.
#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <optional>
#include <string>

#include "host/HostMessage.h"

namespace kvtest {

// The exact payload bytes of a reply; an error text travels as type 5, any other as type 3.
struct ExpectedReply {
  ExpectedReply(std::string reply)
      : type(reply.rfind("<ERROR", 0) == 0 ? kvhost::kErrorText : kvhost::kText),
        text(std::move(reply)) {}
  ExpectedReply(const char* reply) : ExpectedReply(std::string(reply)) {}
  uint8_t type;
  std::string text;
};

// What header bytes 12 to 19 must carry: zeros, or a session's identifier count and status.
struct SessionShown {
  uint32_t idCount = 0;
  int32_t lastStatus = 0;
};

constexpr uint8_t kHeaderConstant[4] = {0x00, 0x0F, 0x00, 0x00};

// Checks every byte that a property reply defines; `context` names the case in failures.
inline void ExpectReply(const std::optional<kvhost::HostMessage>& message,
                        const ExpectedReply& expected, uint32_t sequence, SessionShown shown,
                        const std::string& context) {
  ASSERT_TRUE(message.has_value()) << context << ": no reply, expected " << expected.text;
  EXPECT_EQ(message->text(), expected.text) << context;
  EXPECT_EQ(message->header.type, expected.type) << context << ": " << expected.text;
  EXPECT_EQ(message->header.sequence, sequence) << context << ": " << expected.text;
  EXPECT_EQ(message->header.payloadLength, expected.text.size()) << context;
  for (uint8_t pad : message->header.padding) EXPECT_EQ(pad, 0) << context;
  EXPECT_EQ(message->header.idCount, shown.idCount) << context << ": " << expected.text;
  EXPECT_EQ(message->header.lastStatus, shown.lastStatus) << context << ": " << expected.text;
  for (size_t i = 0; i < 4; ++i) EXPECT_EQ(message->header.constant[i], kHeaderConstant[i]);
}

}  // namespace kvtest
