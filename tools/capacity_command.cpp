// morwick capacity.

#include "morwick/capacity.h"
#include "tools/commands.h"

namespace tools {

Status CapacityCommand(const std::vector<uint32_t> &megabytes) {
  Output output;
  for (const uint32_t capacity : megabytes) {
    output.Write(std::to_string(GetUserCapacityInGB(capacity)) + "\n");
  }
  return output.Finish(kGood);
}

}  // namespace tools
