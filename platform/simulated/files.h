// Files from outside, and lines about them.
#ifndef PLATFORM_SIMULATED_FILES_H
#define PLATFORM_SIMULATED_FILES_H

#include <cstddef>
#include <string>
#include <string_view>

namespace simulated {

// Reads the file's first `room` bytes and not one more, so that a device or a FIFO will do. Returns
// 0, or the number of the error.
int ReadFile(const char *path, void *bytes, size_t room, size_t *size);

// Text from outside, without characters that would end a line or steer a terminal.
std::string Printable(std::string_view text);

// The same in quotes.
std::string Quoted(std::string_view text);

// One line on standard error, after the program's name. Whoever does not read it is given a second:
// the process may be one that no signal ends by now.
void Complain(const std::string &reason);

}  // namespace simulated

#endif
