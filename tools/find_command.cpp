// morwick find.

#include <unistd.h>

#include <cstdio>

#include "morwick/morwick.h"
#include "tools/commands.h"

namespace tools {
namespace {

// Sends standard output to standard error while it lives: what the library prints on the way to a
// connection is not the data that was asked for.
class OutputAside {
 public:
  OutputAside() : output_(dup(STDOUT_FILENO)) { dup2(STDERR_FILENO, STDOUT_FILENO); }
  ~OutputAside() {
    std::fflush(stdout);
    dup2(output_, STDOUT_FILENO);
    close(output_);
  }
  OutputAside(const OutputAside &) = delete;
  OutputAside &operator=(const OutputAside &) = delete;

 private:
  int output_;
};

}  // namespace

Status FindCommand() {
  KVRConnection connection = {};
  {
    const OutputAside aside;
    if (openKVRConnection(&connection) == 0) return kBadData;  // the library has said why
  }
  const NandExporter &row = *connection.exporter;
  std::string text = "controller : " + std::string(row.className) + "\nstatistics :";
  if (row.parseBufferToCxt != nullptr) text += " kvr";
  if (row.ftlParseBufferToCxt != nullptr) text += " ftl";
  if (row.mspParseBufferToCxt != nullptr) text += " msp";
  closeKVRConnection(&connection);
  Output output;
  output.Write(text + "\n");
  return output.Finish(kGood);
}

}  // namespace tools
