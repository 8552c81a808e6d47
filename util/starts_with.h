#pragma once

#include <string_view>

// Returns whether the first bytes of `text` are those of `prefix`.
constexpr bool starts_with(std::string_view text, std::string_view prefix) noexcept {
  return text.substr(0, prefix.size()) == prefix;
}
