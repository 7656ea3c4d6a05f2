// Child processes for the kvmon tests: posix_spawn with pipes, forkpty for the terminal view.
#include "tests/kvmon/KvmonProcess.h"

#include <fcntl.h>
#include <poll.h>
#include <pty.h>
#include <signal.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>

extern char** environ;

namespace kvtest {
namespace {

std::vector<char*> Argv(const std::string& program, const std::vector<std::string>& args) {
  std::vector<char*> argv;
  argv.push_back(const_cast<char*>(program.c_str()));
  for (const auto& arg : args) argv.push_back(const_cast<char*>(arg.c_str()));
  argv.push_back(nullptr);
  return argv;
}

}  // namespace

KvmonProcess KvmonProcess::WithPipes(const std::string& program,
                                     const std::vector<std::string>& args) {
  KvmonProcess process;
  int out[2], err[2];
  if (pipe2(out, O_CLOEXEC) != 0) return process;
  if (pipe2(err, O_CLOEXEC) != 0) {
    close(out[0]);
    close(out[1]);
    return process;
  }
  posix_spawn_file_actions_t actions;
  posix_spawn_file_actions_init(&actions);
  posix_spawn_file_actions_adddup2(&actions, out[1], STDOUT_FILENO);
  posix_spawn_file_actions_adddup2(&actions, err[1], STDERR_FILENO);
  auto argv = Argv(program, args);
  if (posix_spawn(&process.pid_, program.c_str(), &actions, nullptr, argv.data(), environ) != 0)
    process.pid_ = -1;
  posix_spawn_file_actions_destroy(&actions);
  close(out[1]);
  close(err[1]);
  process.outFd_ = out[0];
  process.errFd_ = err[0];
  return process;
}

KvmonProcess KvmonProcess::OnTerminal(const std::string& program,
                                      const std::vector<std::string>& args, int columns, int rows) {
  KvmonProcess process;
  winsize size{};
  size.ws_col = static_cast<unsigned short>(columns);
  size.ws_row = static_cast<unsigned short>(rows);
  auto argv = Argv(program, args);  // built before the fork: the child only calls exec
  int master = -1;
  const pid_t pid = forkpty(&master, nullptr, nullptr, &size);
  if (pid == 0) {
    execv(program.c_str(), argv.data());
    _exit(127);
  }
  process.pid_ = pid;
  process.outFd_ = master;
  return process;
}

KvmonProcess::KvmonProcess(KvmonProcess&& other) noexcept
    : pid_(other.pid_),
      outFd_(other.outFd_),
      errFd_(other.errFd_),
      exitCode_(other.exitCode_),
      exited_(other.exited_),
      out_(std::move(other.out_)),
      err_(std::move(other.err_)) {
  other.pid_ = -1;
  other.outFd_ = other.errFd_ = -1;
}

KvmonProcess::~KvmonProcess() {
  if (pid_ > 0 && !exited_) {
    kill(pid_, SIGKILL);
    waitpid(pid_, nullptr, 0);
  }
  if (outFd_ >= 0) close(outFd_);
  if (errFd_ >= 0) close(errFd_);
}

bool KvmonProcess::Pump(int ms) {
  pollfd fds[2] = {{outFd_, POLLIN, 0}, {errFd_, POLLIN, 0}};
  const int count = errFd_ >= 0 ? 2 : 1;
  if (outFd_ < 0 && errFd_ < 0) return false;
  if (poll(fds, count, ms) <= 0) return true;
  std::string* sinks[2] = {&out_, &err_};
  int* fdOf[2] = {&outFd_, &errFd_};
  for (int i = 0; i < count; ++i) {
    if (fds[i].fd < 0 || fds[i].revents == 0) continue;
    char chunk[4096];
    const ssize_t n = read(fds[i].fd, chunk, sizeof chunk);
    if (n > 0) {
      sinks[i]->append(chunk, static_cast<size_t>(n));
    } else if (n == 0 || errno != EINTR) {  // end of stream (a pty reports EIO)
      close(*fdOf[i]);
      *fdOf[i] = -1;
    }
  }
  return outFd_ >= 0 || errFd_ >= 0;
}

bool KvmonProcess::ReadUntil(const std::function<bool(const std::string&)>& done,
                             std::chrono::milliseconds timeout) {
  const auto deadline = std::chrono::steady_clock::now() + timeout;
  while (!done(out_)) {
    if (std::chrono::steady_clock::now() >= deadline || !Pump(100)) return done(out_);
  }
  return true;
}

void KvmonProcess::Signal(int signal) {
  if (pid_ > 0 && !exited_) kill(pid_, signal);
}

void KvmonProcess::Type(const std::string& bytes) {
  if (outFd_ >= 0 && write(outFd_, bytes.data(), bytes.size()) < 0) return;
}

int KvmonProcess::WaitForExit(std::chrono::milliseconds timeout) {
  const auto deadline = std::chrono::steady_clock::now() + timeout;
  while (!exited_ && pid_ > 0) {
    int status = 0;
    const pid_t done = waitpid(pid_, &status, WNOHANG);
    if (done == pid_) {
      exited_ = true;
      exitCode_ = WIFEXITED(status) ? WEXITSTATUS(status) : -1;
      break;
    }
    if (std::chrono::steady_clock::now() >= deadline) return -1;
    Pump(50);
  }
  const auto drained = std::chrono::steady_clock::now() + std::chrono::seconds(5);
  while (Pump(100) && std::chrono::steady_clock::now() < drained) {
  }
  return exitCode_;
}

std::vector<std::string> SplitLines(const std::string& text) {
  std::vector<std::string> lines;
  size_t start = 0;
  while (start < text.size()) {
    const size_t end = text.find('\n', start);
    lines.push_back(text.substr(start, end == std::string::npos ? std::string::npos : end - start));
    if (end == std::string::npos) break;
    start = end + 1;
  }
  return lines;
}

}  // namespace kvtest
