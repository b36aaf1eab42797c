// What a simulated controller tells about itself when its scenario names no files for it.
#ifndef PLATFORM_SIMULATED_OWN_BUFFERS_H
#define PLATFORM_SIMULATED_OWN_BUFFERS_H

#include <cstddef>
#include <cstdint>
#include <optional>

namespace simulated {

// Writes the buffer that the command reads, as it is at this moment by the wall clock, cut to the
// room. The number of bytes written, or nothing for a buffer that controllers make none of.
std::optional<size_t> MakeOwnBuffer(uint32_t command, void *reply, size_t room);

}  // namespace simulated

#endif
