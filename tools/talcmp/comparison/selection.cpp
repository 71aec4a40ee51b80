#include "selection.h"

#include <algorithm>
#include <charconv>
#include <stdexcept>
#include <string_view>

namespace talcmp {
namespace {

std::vector<std::string_view> split(std::string_view text, const char separator) {
    std::vector<std::string_view> parts;
    for (std::size_t end = text.find(separator); end != std::string_view::npos;
         end = text.find(separator)) {
        parts.push_back(text.substr(0, end));
        text.remove_prefix(end + 1);
    }
    parts.push_back(text);
    return parts;
}

std::string_view trimmed(std::string_view text) {
    text.remove_prefix(std::min(text.find_first_not_of(' '), text.size()));
    return text.substr(0, text.find_last_not_of(' ') + 1);
}

// Nothing if there is only blank space.
std::optional<std::int64_t> number_from(const std::string_view part) {
    const std::string_view text = trimmed(part);
    if (text.empty()) {
        return std::nullopt;
    }
    std::int64_t number = 0;
    const char* const end = text.data() + text.size();
    const auto [rest, error] = std::from_chars(text.data(), end, number);
    if (error != std::errc{} || rest != end) {
        throw std::invalid_argument("'" + std::string(text) + "' is no index");
    }
    return number;
}

AxisRange range_from(const std::string_view text) {
    const auto parts = split(text, ':');
    if (parts.size() > 3) {
        throw std::invalid_argument("'" + std::string(text) + "' has more than two colons");
    }
    AxisRange range;
    range.start = number_from(parts[0]);
    if (parts.size() == 1) {
        if (!range.start) {
            throw std::invalid_argument("an axis has neither an index nor a colon");
        }
        range.one_index = true;
        return range;
    }
    range.stop = number_from(parts[1]);
    range.step = parts.size() == 3 ? number_from(parts[2]).value_or(1) : 1;
    if (range.step == 0) {
        throw std::invalid_argument("a step is 0");
    }
    return range;
}

} // namespace

Selection read_selection(const std::string& text) {
    Selection selection;
    bool after_ellipsis = false;
    for (const std::string_view part : split(text, ',')) {
        if (trimmed(part) != "...") {
            (after_ellipsis ? selection.last : selection.first).push_back(range_from(part));
        } else if (after_ellipsis) {
            throw std::invalid_argument("there is more than one '...'");
        } else {
            after_ellipsis = true;
        }
    }
    return selection;
}

} // namespace talcmp
