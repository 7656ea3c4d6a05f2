// Finds the closing brace of a report's root object by scanning it as JSON.
#pragma once

#include <cstddef>
#include <optional>
#include <string_view>

namespace qverr {

// Offset of the root object's closing brace; empty when the text is not one JSON object
// (optionally surrounded by blanks, tabs, CR and LF) or nests deeper than 64 levels.
std::optional<size_t> findRootObjectEnd(std::string_view text);

}  // namespace qverr
