// The buffers of a simulated controller for which its scenario names no files.
#ifndef PLATFORM_SIMULATED_OWN_BUFFERS_H
#define PLATFORM_SIMULATED_OWN_BUFFERS_H

#include <cstdint>
#include <string>

namespace simulated {

// The buffer that the command reads, as of now by the wall clock; empty when the made-up controller
// has no such buffer.
std::string MakeOwnBuffer(uint32_t command);

}  // namespace simulated

#endif
