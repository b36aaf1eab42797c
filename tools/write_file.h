// Writes files whole or not at all.
#ifndef TOOLS_WRITE_FILE_H
#define TOOLS_WRITE_FILE_H

#include <sys/types.h>

#include <optional>
#include <string>
#include <string_view>

namespace tools {

// Writes a file whole or not at all: beside it first, then renamed, with that mode or as the umask
// gives it. A link stays a link, and the file that it leads to is written; a link that somebody
// else has planted in a shared folder such as /tmp is refused. A device or a pipe is written
// directly, and so is an open descriptor (/dev/stdout, /dev/fd/3). False after a complaint.
bool WriteFile(const std::string &file, std::string_view bytes,
               std::optional<mode_t> mode = std::nullopt);

}  // namespace tools

#endif
