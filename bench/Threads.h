// How much more two threads do than one.
#pragma once

namespace bench {

// For each kind of query, the evaluations per second of a thread alone in its process, and how many
// times as many two threads make that share the query and the document, and two that have a query
// and a document each; then how much more processor time an evaluation takes of threads that share
// than of one alone, which tells on a busy machine as well whether they are in each other's way.
// The exit status of the program: 0 when threads that share make at least 1.8 times the evaluations
// of one, or fall behind those that share nothing by no more than a twentieth where the machine
// does not give two threads twice the time of one.
[[nodiscard]] int reportThreads();

}  // namespace bench
