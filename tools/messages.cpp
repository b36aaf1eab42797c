// The messages of the morwick command.

#include "tools/messages.h"

#include <fmt/format.h>
#include <unistd.h>

#include <cstdio>
#include <new>
#include <utility>

#include "tools/text.h"

namespace tools {

using std::chrono::milliseconds;
using std::chrono::steady_clock;

namespace {

constexpr size_t kMostKept = 1000;

bool keeping = false;
uint64_t linesPrinted = 0;  // on a terminal
std::vector<Message> kept;
uint64_t leftOut = 0;

void Keep(std::string_view severity, std::string_view text) {
  if (!keeping) return;
  try {
    if (kept.size() < kMostKept) {
      kept.push_back({severity, std::string(text)});
      return;
    }
  } catch (const std::bad_alloc &) {  // counted below
  }
  ++leftOut;
}

void Print(std::string_view severity, const std::string &text) {
  const bool terminal = isatty(STDERR_FILENO) != 0;
  if (terminal) ++linesPrinted;
  std::fprintf(stderr, "morwick: %s\n", terminal ? PrintableLine(text).c_str() : text.c_str());
  Keep(severity, text);
}

}  // namespace

void Complain(const std::string &subject, const std::string &reason) {
  Print("error", subject + ": " + reason);
}

void Note(const std::string &subject, const std::string &reason) {
  Print("note", subject + ": " + reason);
}

Status RefuseUsage(const std::string &reason, const std::string &help) {
  Print("error", reason + " (see morwick " + help + ")");
  return kBadUsage;
}

ProgressLine::ProgressLine(bool isShown, milliseconds delay)
    : next_(isShown ? steady_clock::now() + delay : steady_clock::time_point::max()) {}

bool ProgressLine::IsDue() {
  const auto now = steady_clock::now();
  if (now < next_) return false;
  next_ = now + milliseconds(200);
  isThere_ = true;
  return true;
}

void ProgressLine::Clear() {
  if (isThere_) std::fputs("\r\033[K", stderr);
  isThere_ = false;
}

void ComplainOfMemory() {
  static bool printed = false;
  if (!std::exchange(printed, true)) std::fputs("morwick: out of memory\n", stderr);
  Keep("error", "out of memory");
}

uint64_t LinesPrinted() { return linesPrinted; }

void KeepMessages() { keeping = true; }

std::vector<Message> TakeMessages() {
  if (const uint64_t more = std::exchange(leftOut, 0)) {
    kept.push_back({"note", fmt::format("{} more messages are left out here", more)});
  }
  return std::exchange(kept, {});
}

}  // namespace tools
