// A text setting that one thread may replace while another reads it.
#pragma once

#include <mutex>
#include <string>
#include <string_view>

namespace nKV_DLL300 {

// Readers get a copy, so a replacement never tears a text that is being used.
class GuardedText {
 public:
  GuardedText() = default;
  explicit GuardedText(std::string_view initial) : text_(initial) {}
  GuardedText(const GuardedText&) = delete;
  GuardedText& operator=(const GuardedText&) = delete;

  void set(std::string_view text) {
    std::lock_guard<std::mutex> lock(mutex_);
    text_.assign(text.data(), text.size());
  }
  std::string get() const {
    std::lock_guard<std::mutex> lock(mutex_);
    return text_;
  }
  bool empty() const {
    std::lock_guard<std::mutex> lock(mutex_);
    return text_.empty();
  }
  bool contains(std::string_view part) const {
    std::lock_guard<std::mutex> lock(mutex_);
    return text_.find(part) != std::string::npos;
  }

 private:
  mutable std::mutex mutex_;
  std::string text_;  // guarded by mutex_
};

}  // namespace nKV_DLL300
