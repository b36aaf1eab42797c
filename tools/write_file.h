// Writes files whole or not at all.
#ifndef TOOLS_WRITE_FILE_H
#define TOOLS_WRITE_FILE_H

#include <sys/types.h>

#include <optional>
#include <string>
#include <string_view>

#include "tools/messages.h"

namespace tools {

// Writes to a file or, without its name, to standard output. Returns `status`, or kBadData
// after a complaint. A file is written whole or not at all: under a temporary name in the same
// folder, and then renamed. It gets `mode`, or the mode that the umask allows. A link stays a link,
// and its target is written; but a link that another user planted in a shared folder such as /tmp
// is refused. Devices, pipes and open descriptors (/dev/stdout, /dev/fd/3) are written directly.
Status WriteWhole(std::string_view bytes, const std::string &file = "", Status status = kGood,
                  std::optional<mode_t> mode = std::nullopt);

}  // namespace tools

#endif
