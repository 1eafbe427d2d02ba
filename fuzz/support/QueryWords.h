// The words of queries, by what stands in the same place.
#pragma once

#include <string_view>
#include <vector>

namespace xquery::fuzz {

using Words = std::vector<std::string_view>;

const Words& literals();
const Words& axes();
const Words& nodeTests();
const Words& binaryOperators();
const Words& orderModifiers();
const Words& atomicTypes();
const Words& sequenceTypes();
const Words& prologItems();
// Of the library, but for those that look at files or at the network.
const Words& functionNames();
// All of these, and what else there is.
const Words& queryWords();

}  // namespace xquery::fuzz
