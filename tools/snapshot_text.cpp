// Snapshots as the library's text, block by block.

#include "tools/snapshot_text.h"

#include "fleet/snapshot_text.h"

namespace tools {
namespace {

fleet::TakeText WriteTo(Output &output) {
  return [&](std::string_view text) { return output.Write(text); };
}

}  // namespace

bool PrintFixedText(Output &output, SnapshotRecords &records) {
  fleet::FixedText text(WriteTo(output));
  text.Begin();
  for (;;) {
    const auto block = records.Next();
    if (!block) return false;
    if (block->empty()) break;
    if (!text.Print(*block) || !output.Flush()) return false;
  }
  return text.End();
}

Status PrintDescribedText(Output &output, SnapshotRecords &records, const std::string &header,
                          const std::string &name) {
  fleet::DescribedText text(WriteTo(output), header);
  const std::string tooLong =
      " a text of " + std::to_string(fleet::DescribedText::kMostText) + " bytes";
  RepeatedComplaint passedOver(name);
  bool good = true;  // reading
  for (bool goesOn = true; goesOn;) {
    const uint64_t first = records.count();
    const auto block = records.Next();
    good = block.has_value();
    if (!good || block->empty()) break;
    const auto passOver = [&](uint32_t index) {
      passedOver.Add(
          [&] { return "record " + std::to_string(first + index) + " does not fit" + tooLong; });
    };
    goesOn = text.Print(*block, passOver) && output.Flush();
  }
  const bool all = !passedOver.Finish("records do not fit" + tooLong);
  return !good ? kBadUsage : all ? kGood : kBadData;
}

}  // namespace tools
