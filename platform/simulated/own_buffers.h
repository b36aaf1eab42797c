// The buffers of a simulated controller for which its scenario names no files.
#ifndef PLATFORM_SIMULATED_OWN_BUFFERS_H
#define PLATFORM_SIMULATED_OWN_BUFFERS_H

#include <string>
#include <string_view>

namespace simulated {

// The buffer with that key in a scenario, as of now by the wall clock; empty when the made-up
// controller has no such buffer.
std::string MakeOwnBuffer(std::string_view key);

}  // namespace simulated

#endif
