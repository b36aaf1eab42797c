// Guesses what a file holds, for a note when it does not look like a snapshot.
#ifndef TOOLS_LIKELY_CONTENT_H
#define TOOLS_LIKELY_CONTENT_H

#include <string>
#include <string_view>

namespace tools {

// What the beginning looks like: "text", "statistics" or, for packed data, such as "zip data".
// Empty when it may be a snapshot.
std::string OtherThanSnapshot(std::string_view beginning);

}  // namespace tools

#endif
