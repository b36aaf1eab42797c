// Snapshots as the library's text, block by block, however long they are.
#ifndef TOOLS_SNAPSHOT_TEXT_H
#define TOOLS_SNAPSHOT_TEXT_H

#include <string>

#include "tools/output.h"
#include "tools/snapshot_records.h"

namespace tools {

// In the fixed layout: legend, lines, an empty line. False when reading or writing has failed.
bool PrintFixedText(Output &output, SnapshotRecords &records);

// In the layout of a header that has passed its check. Complains, with the snapshot's name, about
// records that are too long.
Status PrintDescribedText(Output &output, SnapshotRecords &records, const std::string &header,
                          const std::string &name);

}  // namespace tools

#endif
