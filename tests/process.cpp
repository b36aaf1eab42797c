#include "tests/process.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <poll.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>

namespace {

// Feeds standard input from a file, so that neither side ever waits for the other.
int InputFile(const std::string &input) {
  FILE *file = std::tmpfile();
  if (std::fwrite(input.data(), 1, input.size(), file) != input.size()) std::abort();
  std::rewind(file);
  return fileno(file);
}

struct TemporaryFolder {
  TemporaryFolder() { std::filesystem::create_directories(path); }
  ~TemporaryFolder() {
    std::error_code ignored;
    std::filesystem::remove_all(path, ignored);
  }
  std::filesystem::path path =
      std::filesystem::path(testing::TempDir()) / ("morwick_test_" + std::to_string(getpid()));
};

}  // namespace

Process::Process(std::vector<std::string> arguments, std::vector<std::string> environment,
                 const std::string &input) {
  int out[2];
  int err[2];
  if (pipe2(out, O_CLOEXEC) != 0 || pipe2(err, O_CLOEXEC) != 0) std::abort();
  const int in = InputFile(input);
  pid_ = fork();
  if (pid_ == 0) {
    dup2(in, STDIN_FILENO);
    dup2(out[1], STDOUT_FILENO);
    dup2(err[1], STDERR_FILENO);
    for (std::string &variable : environment) putenv(variable.data());
    std::vector<char *> argv;
    argv.reserve(arguments.size() + 1);
    for (std::string &argument : arguments) argv.push_back(argument.data());
    argv.push_back(nullptr);
    execvp(argv[0], argv.data());
    _exit(127);
  }
  close(in);
  close(out[1]);
  close(err[1]);
  out_ = out[0];
  err_ = err[0];
}

Process::~Process() {
  if (pid_ <= 0) return;
  kill(pid_, SIGKILL);
  Wait();
}

void Process::Signal(int signal) const { kill(pid_, signal); }

// False when both streams have ended or nothing came in time.
bool Process::ReadMore(std::chrono::milliseconds limit) {
  pollfd streams[] = {{out_, POLLIN, 0}, {err_, POLLIN, 0}};
  if (poll(streams, 2, static_cast<int>(limit.count())) <= 0) return false;
  for (const auto &[stream, text] : {std::pair(&out_, &result_.out), {&err_, &result_.err}}) {
    if (streams[stream == &err_].revents == 0) continue;
    char bytes[65536];
    const ssize_t count = read(*stream, bytes, sizeof bytes);
    if (count > 0) {
      text->append(bytes, static_cast<size_t>(count));
    } else {
      close(*stream);
      *stream = -1;
    }
  }
  return out_ >= 0 || err_ >= 0;
}

bool Process::WaitForError(const std::string &text, std::chrono::seconds limit) {
  const auto end = std::chrono::steady_clock::now() + limit;
  while (result_.err.find(text) == std::string::npos) {
    if (std::chrono::steady_clock::now() > end || !ReadMore(limit)) return false;
  }
  return true;
}

ProcessResult Process::Wait() {
  while (ReadMore(std::chrono::minutes(2))) {
  }
  int status = 0;
  waitpid(pid_, &status, 0);
  pid_ = -1;
  result_.status = WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
  return result_;
}

ProcessResult RunProcess(std::vector<std::string> arguments, std::vector<std::string> environment,
                         const std::string &input) {
  return Process(std::move(arguments), std::move(environment), input).Wait();
}

std::vector<std::string> FastSleep(std::vector<std::string> environment) {
  environment.emplace_back("LD_PRELOAD=" FAST_SLEEP_LIBRARY);
  // The sanitizer would rather be the first library of the process.
  environment.emplace_back("ASAN_OPTIONS=verify_asan_link_order=0");
  return environment;
}

std::string TemporaryFile(const std::string &name, const std::string &text) {
  static const TemporaryFolder folder;
  std::string path = folder.path / name;
  std::ofstream(path, std::ios::binary) << text;
  return path;
}
