// The lines below an error that say where in the query it arose:
//
//     at prices.xq:12:8, in local:price
//     12 |   $b/price * $rate
//        |   ^^^^^^^^
//     called at prices.xq:20:10
#pragma once

#include "Options.h"
#include "xquery/xquery.h"

#include <string>

namespace cli {

// How messages name the query.
std::string queryName(const Options& options);
// The same of a module by its URL; of the query where that is null.
std::string moduleName(const xquery::Ref<xquery::NSString>& URL, const Options& options);

// Of a line of the query: without the lines that a session puts before what was entered.
int64_t lineAsEntered(int64_t line, const Options& options);

// Each line with a line feed before it, for a terminal; empty where nothing is known. `marks` is
// what the terminal is told before the mark under a line, and what after it.
struct Marks {
  std::string before, after;
};
std::string linesOfPlace(const xquery::XQueryError& error, const Options& options,
                         const Marks& marks);

// Members of an object: "category" and, where they are known, "place", "calls" and "callsLeftOut",
// each with a comma before it.
std::string jsonOfPlace(const xquery::XQueryError& error, const Options& options);

}  // namespace cli
