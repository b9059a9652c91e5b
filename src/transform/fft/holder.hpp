// Table holders kept in work cells and instance-data slots by the transforms.
#pragma once

namespace tw {

// Gives back a holder and what it holds. Accepts null.
void ReleaseTableHolder(void* holder);

}  // namespace tw
