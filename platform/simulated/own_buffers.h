// Buffers that a simulated controller makes up where its scenario names no files.
#ifndef PLATFORM_SIMULATED_OWN_BUFFERS_H
#define PLATFORM_SIMULATED_OWN_BUFFERS_H

#include <string>
#include <string_view>

namespace simulated {

// The buffer with that key in a scenario, with the values of this moment. Empty when the made-up
// controller has no such buffer.
std::string MakeOwnBuffer(std::string_view key);

}  // namespace simulated

#endif
