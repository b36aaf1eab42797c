// Writes files whole or not at all.
#ifndef TOOLS_WRITE_FILE_H
#define TOOLS_WRITE_FILE_H

#include <sys/types.h>

#include <optional>
#include <string>
#include <string_view>

namespace tools {

// Writes a file whole or not at all: it writes a temporary file in the same folder and renames it.
// The file gets `mode`, or the mode that the umask allows. A link stays a link, and its target is
// written; but a link that another user planted in a shared folder such as /tmp is refused.
// Devices, pipes and open descriptors (/dev/stdout, /dev/fd/3) are written directly. Returns false
// after a complaint.
bool WriteFile(const std::string &file, std::string_view bytes,
               std::optional<mode_t> mode = std::nullopt);

}  // namespace tools

#endif
