// The system log: syslog, and standard error too for a person who runs the process in the
// foreground.

#include <sys/stat.h>
#include <syslog.h>

#include <csignal>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

#include "morwick/platform.h"
#include "platform/simulated/scenario.h"

namespace simulated {
namespace {

// The journal names the stream it reads from a service; what goes there would be logged twice.
bool StandardErrorIsTheJournal() {
  const char *journal = std::getenv("JOURNAL_STREAM");
  struct stat stream = {};
  return journal != nullptr && fstat(fileno(stderr), &stream) == 0 &&
         std::to_string(stream.st_dev) + ":" + std::to_string(stream.st_ino) == journal;
}

struct Log {
  Log() : foreground(!StandardErrorIsTheJournal()) {
    std::signal(SIGPIPE, SIG_IGN);  // nobody reading is no reason to leave a connection open
    openlog("grellon", LOG_PID, LOG_DAEMON);
    if (!RequireScenario().logEnabled) setlogmask(LOG_UPTO(LOG_WARNING));
  }
  bool foreground;
};

}  // namespace
}  // namespace simulated

void SystemLog(const char *format, ...) {
  static const simulated::Log log;
  if ((setlogmask(0) & LOG_MASK(LOG_NOTICE)) == 0) return;
  char message[1024];
  va_list arguments;
  va_start(arguments, format);
  std::vsnprintf(message, sizeof message, format, arguments);
  va_end(arguments);
  syslog(LOG_NOTICE, "%s", message);
  if (!log.foreground) return;
  // Some messages end their line themselves.
  const bool complete = message[0] != '\0' && message[std::strlen(message) - 1] == '\n';
  std::fprintf(stderr, "grellon: %s%s", message, complete ? "" : "\n");
}
