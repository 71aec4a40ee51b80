#include "json_writer.h"

#include "shown.h"

#include <nlohmann/json.hpp>

#include <algorithm>
#include <array>

namespace talcmp {
namespace {

constexpr int indentation = 2;

// Characters from 0x7F upwards occur only in strings.
std::string escaped(const char32_t code) {
    if (code < 0x7F) {
        return {static_cast<char>(code)};
    }
    std::array<char, 12> text = {};
    std::snprintf(text.data(), text.size(), "\\u%04x", static_cast<unsigned>(code));
    return text.data();
}

std::string text_of(const JsonWriter::Json& value) {
    std::string text =
        value.dump(indentation, ' ', false, JsonWriter::Json::error_handler_t::replace);
    const bool plain =
        std::all_of(text.begin(), text.end(), [](const unsigned char byte) { return byte < 0x7F; });
    return plain ? text : without_controls(text, escaped);
}

} // namespace

std::string JsonWriter::line_break() const {
    return "\n" + std::string(indentation * open_.size(), ' ');
}

void JsonWriter::begin_entry(const std::string& key) {
    if (open_.empty()) {
        return;
    }
    print((open_.back().empty ? "" : ",") + line_break());
    open_.back().empty = false;
    if (!key.empty()) {
        print(text_of(key) + ": ");
    }
}

void JsonWriter::begin(const std::string& key, const char begin, const char end) {
    begin_entry(key);
    print({begin});
    open_.push_back({end, true});
}

void JsonWriter::add(const std::string& key, const Json& value) {
    begin_entry(key);
    // A line break in a string is written as an escape.
    const std::string text = text_of(value);
    std::string indented;
    for (const char c : text) {
        indented += c == '\n' ? line_break() : std::string(1, c);
    }
    print(indented);
}

void JsonWriter::end() {
    const Open last = open_.back();
    open_.pop_back();
    print((last.empty ? "" : line_break()) + last.end + (open_.empty() ? "\n" : ""));
}

} // namespace talcmp
