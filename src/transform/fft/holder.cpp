#include "transform/fft/holder.hpp"

#include "frame/memory.hpp"

namespace tw {

// Provisional until the FFT table list exists: no transform stores a holder yet.
void ReleaseTableHolder(void* holder) { PlainFree(holder); }

}  // namespace tw
