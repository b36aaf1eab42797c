// Reads files from outside, and prints complaints.
#ifndef PLATFORM_SIMULATED_FILES_H
#define PLATFORM_SIMULATED_FILES_H

#include <cstddef>
#include <string>
#include <string_view>

namespace simulated {

// Reads at most the first `most` bytes of the file, so that devices and FIFOs work too. Returns 0,
// or the error number as in errno; `bytes` means nothing then.
int ReadFile(const std::string &path, size_t most, std::string *bytes);

// Makes text from outside safe to print: bytes other than printable ASCII become \x0a and the like.
std::string Printable(std::string_view text);

// The same in quotes.
std::string Quoted(std::string_view text);

// Prints one line on standard error, after the program's name. When nobody reads standard error it
// gives up after a second: signals may already be blocked, so that only SIGKILL would end a wait.
void Complain(const std::string &reason);

}  // namespace simulated

#endif
