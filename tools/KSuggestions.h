#pragma once

#include <string>
#include <vector>

// `text` in lower case (ASCII): names and list entries are matched without regard to case.
std::string KLowerCase(std::string text);

// " Did you mean a, b?" naming up to three of `known` closest to `wanted` (letters to add,
// drop or change, ignoring case; or containing it), nearest first; empty when none is close.
std::string KSuggestions(const std::string& wanted, const std::vector<std::string>& known);
