// How long it takes to make a tree of a text, beside other readers in the same run.
#pragma once

namespace bench {

// For texts of six kinds: how long libxml2's SAX parser takes with handlers that do nothing, how
// many times as long the trees take that the engine, libxml2 and pugixml make, what the engine's
// takes in memory for each byte of text, and how long it takes to walk. The factor is that of the
// data sets. Answers the exit status of the program: 0.
[[nodiscard]] int reportReading(double factor);

}  // namespace bench
