// The blocks of small objects that a thread keeps for its next ones.
#pragma once

namespace xquery {

// Gives those of the calling thread to the process.
void giveFreeBlocks();

}  // namespace xquery
