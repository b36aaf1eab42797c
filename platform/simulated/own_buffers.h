// The buffers of a simulated controller for which its scenario names no files.
#ifndef PLATFORM_SIMULATED_OWN_BUFFERS_H
#define PLATFORM_SIMULATED_OWN_BUFFERS_H

#include <cstddef>
#include <cstdint>
#include <optional>

namespace simulated {

// Writes the buffer that the command reads, as of now by the wall clock, cut to the room. Returns
// the number of bytes written, or nothing when the made-up controller has no such buffer.
std::optional<size_t> MakeOwnBuffer(uint32_t command, void *reply, size_t room);

}  // namespace simulated

#endif
