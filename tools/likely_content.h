// What a file holds by its looks, for a note before it is printed as something else.
#ifndef TOOLS_LIKELY_CONTENT_H
#define TOOLS_LIKELY_CONTENT_H

#include <string>
#include <string_view>

namespace tools {

// What the beginning of something that is no snapshot looks like: text, statistics, packed data.
// Empty when it may be a snapshot.
std::string OtherThanSnapshot(std::string_view beginning);

}  // namespace tools

#endif
