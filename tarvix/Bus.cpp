// A simulated bus: delivery to sessions and the capture file.
#include "tarvix/Bus.h"

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <cstdint>
#include <cstring>

#include "tarvix/CandumpLog.h"
#include "tarvix/Session.h"

namespace tarvix {

Bus::Bus(BusConfig config, int64_t epochNs) : config_(std::move(config)), epochNs_(epochNs) {}

Bus::~Bus() {
  if (captureFile_ != nullptr) std::fclose(captureFile_);
}

bool Bus::openCapture(std::string& error) {
  if (config_.capture.empty()) return true;
  captureFile_ = std::fopen(config_.capture.c_str(), "w");
  if (captureFile_ == nullptr) {
    error = "bus \"" + config_.name + "\": cannot write capture file \"" + config_.capture +
            "\": " + std::strerror(errno);
    return false;
  }
  return true;
}

void Bus::waitForChange(std::unique_lock<std::mutex>& lock, int64_t untilNs) {
  const auto until = std::chrono::steady_clock::time_point(std::chrono::nanoseconds(untilNs));
  if (untilNs == INT64_MAX) {
    changed_.wait(lock);
  } else {
    changed_.wait_until(lock, until);
  }
}

void Bus::attach(Session* session) { sessions_.push_back(session); }

void Bus::detach(Session* session) {
  sessions_.erase(std::remove(sessions_.begin(), sessions_.end(), session), sessions_.end());
}

bool Bus::anyListener() const {
  if (captureFile_ != nullptr) return true;
  return std::any_of(sessions_.begin(), sessions_.end(),
                     [](const Session* s) { return s->listening(); });
}

void Bus::advance(int64_t nowNs) {
  if (anyListener()) {
    simulate(nowNs);
  } else {
    skip(nowNs);
  }
  if (captureFile_ != nullptr) std::fflush(captureFile_);
}

void Bus::carry(const SimFrame& frame) {
  for (Session* s : sessions_) s->offer(frame, config_);
  if (captureFile_ != nullptr) capture(frame);
}

void Bus::capture(const SimFrame& frame) {
  const std::string line = FormatCandumpLine(frame, config_.name);
  std::fputs(line.c_str(), captureFile_);
}

}  // namespace tarvix
