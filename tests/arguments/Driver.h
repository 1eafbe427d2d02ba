// Calls functions with combinations of the samples and compares with their rules.
#pragma once

#include "arguments/Model.h"

#include <vector>

namespace xquery::arguments {

// Every function of the family with 0 to 5 arguments: none and one of all samples, all pairs of the
// typical ones, and combinations of the usual ones; with less than that where the function takes
// no such number of arguments. Without a context item and, for up to two arguments, with each of
// some.
void expectRules(const std::vector<Function>& family);

// The families; together they are all built-in functions.
const std::vector<Function>& constructorFunctions();
const std::vector<Function>& cardinalityFunctions();
const std::vector<Function>& sequenceFunctions();
const std::vector<Function>& aggregateFunctions();
const std::vector<Function>& numericFunctions();
const std::vector<Function>& dateFunctions();
const std::vector<Function>& stringFunctions();
const std::vector<Function>& patternFunctions();
const std::vector<Function>& nodeFunctions();
const std::vector<Function>& focusFunctions();
const std::vector<Function>& resourceFunctions();
const std::vector<Function>& extensionFunctions();
std::vector<const std::vector<Function>*> families();

}  // namespace xquery::arguments
