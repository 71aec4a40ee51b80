// The endings of names.

#pragma once

#include <string_view>

namespace talcmp {

inline bool ends_with(const std::string_view text, const std::string_view end) {
    return text.size() >= end.size() && text.substr(text.size() - end.size()) == end;
}

} // namespace talcmp
