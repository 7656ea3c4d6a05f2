// Test helper: kvmon as a child process, its output read through pipes or a pseudo-terminal.
#pragma once

#include <sys/types.h>

#include <chrono>
#include <functional>
#include <string>
#include <vector>

namespace kvtest {

// One run of a program. The destructor kills a child that is still running.
class KvmonProcess {
 public:
  // Starts `program` with `args`, standard output and error on pipes.
  static KvmonProcess WithPipes(const std::string& program, const std::vector<std::string>& args);
  // Starts `program` on a pseudo-terminal of `columns` x `rows` (standard output and error both).
  static KvmonProcess OnTerminal(const std::string& program, const std::vector<std::string>& args,
                                 int columns, int rows);

  KvmonProcess(KvmonProcess&& other) noexcept;
  KvmonProcess& operator=(KvmonProcess&&) = delete;
  ~KvmonProcess();

  bool started() const { return pid_ > 0; }
  // Reads output until `done(out)` holds or `timeout` passed; returns done's last value.
  bool ReadUntil(const std::function<bool(const std::string&)>& done,
                 std::chrono::milliseconds timeout);
  // Sends `signal` to the child.
  void Signal(int signal);
  // Writes `bytes` to the terminal (as typed keys).
  void Type(const std::string& bytes);
  // Reads everything until the child ends or `timeout` passed; its exit code, or -1.
  int WaitForExit(std::chrono::milliseconds timeout);

  const std::string& out() const { return out_; }
  const std::string& err() const { return err_; }

 private:
  KvmonProcess() = default;
  // Reads what is there within `ms`; false when every stream is at its end.
  bool Pump(int ms);

  pid_t pid_ = -1;
  int outFd_ = -1;
  int errFd_ = -1;
  int exitCode_ = -1;
  bool exited_ = false;
  std::string out_;
  std::string err_;
};

// Lines of `text` (without their line ends).
std::vector<std::string> SplitLines(const std::string& text);

}  // namespace kvtest
