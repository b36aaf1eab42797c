// Files from outside: the first byte chooses between a scenario and a snapshot header. A header
// that passes its check is used, at the end of its own allocation.

#include <cassert>
#include <optional>
#include <vector>

#include "morwick/morwick.h"
#include "platform/simulated/scenario.h"
#include "tools/snapshot_header.h"

namespace {

void CheckScenario(std::string_view text) {
  std::string error;
  const std::optional<simulated::Scenario> scenario =
      simulated::ParseScenario(text, "folder/file", &error);
  assert(scenario ? error.empty() : error.starts_with("folder/file:"));
  if (!scenario) return;
  for (const simulated::Controller &controller : scenario->controllers) {
    assert(simulated::RequestMethod(controller.className) != 0);
    assert(controller.files.size() == simulated::kBuffers.size());
    for (const auto &[command, files] : controller.files) {
      for (const std::string &file : files) {
        assert(file.starts_with('/') || (file.starts_with("folder/") && file.size() > 7));
        assert(file.find('\0') == std::string::npos);
      }
    }
  }
}

void CheckHeader(std::string_view file) {
  const std::string wrong = tools::CheckSnapshotHeader(file);
  assert(wrong == tools::CheckSnapshotHeader(file));
  if (!wrong.empty()) return;
  const std::vector<char> header(file.begin(), file.end());
  const std::vector<char> snapshot(1000, 'a');
  std::vector<char> output(1 << 16);
  uint64_t size = output.size();
  uint32_t state = 0;
  KVRParseSnapshotBufferWithInplaceParser(snapshot.data(), snapshot.size(), output.data(), &size,
                                          header.data(), &state);
  assert(size >= 1 && size <= output.size() && output[size - 1] == '\0');
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
  if (size == 0) return 0;
  const std::string_view rest(reinterpret_cast<const char *>(data) + 1, size - 1);
  if (data[0] % 2 == 0) {
    CheckScenario(rest);
  } else {
    CheckHeader(rest);
  }
  return 0;
}
