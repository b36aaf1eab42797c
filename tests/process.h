// Runs a built program as a person does: arguments, environment, signals in; text and status out.
#ifndef TESTS_PROCESS_H
#define TESTS_PROCESS_H

#include <sys/types.h>

#include <chrono>
#include <string>
#include <vector>

struct ProcessResult {
  int status = -1;  // exit status, or 128 and the signal that ended it
  std::string out;
  std::string err;
};

class Process {
 public:
  // `environment` is added to the test's own, as "NAME=value".
  Process(std::vector<std::string> arguments, std::vector<std::string> environment = {},
          const std::string &input = "");
  ~Process();
  Process(const Process &) = delete;
  Process &operator=(const Process &) = delete;

  pid_t pid() const { return pid_; }
  void Signal(int signal) const;

  // Waits until standard error holds the text; false when it did not come in time.
  bool WaitForError(const std::string &text, std::chrono::seconds limit = std::chrono::seconds(20));
  ProcessResult Wait();

 private:
  bool ReadMore(std::chrono::milliseconds limit);

  pid_t pid_ = -1;
  int out_ = -1;
  int err_ = -1;
  ProcessResult result_;
};

// Runs to the end.
ProcessResult RunProcess(std::vector<std::string> arguments,
                         std::vector<std::string> environment = {}, const std::string &input = "");

// The environment that makes the program's pauses a thousand times shorter.
std::vector<std::string> FastSleep(std::vector<std::string> environment);

// Writes a file into the test's own temporary folder and returns its path.
std::string TemporaryFile(const std::string &name, const std::string &text);

#endif
