// The words of a command line, as options and operands: what they are, not what they mean.

#pragma once

#include "shown.h"

#include <map>
#include <stdexcept>
#include <string>
#include <vector>

namespace talcmp {

// A command line that talcmp does not understand. The text says what is wrong, in one line whatever
// it quotes.
struct UsageError : std::runtime_error {
    explicit UsageError(const std::string& text) : std::runtime_error(shown(text)) {}
};

struct Option {
    enum class Kind { flag, value, values }; // options of kind `values` may be repeated
    std::string name;                        // "--tol"
    Kind kind = Kind::flag;
    char letter = '\0'; // of its short form, if it has one

    // Names that a user may take for this option's, and what to say then.
    std::vector<std::string> other_names = {};
    std::string hint = {};
};

struct Words {
    std::map<std::string, std::vector<std::string>> values; // by the name of the option
    std::vector<std::string> operands;
};

inline bool has(const Words& words, const std::string& option) {
    return words.values.count(option) != 0;
}

// All values that the option was given.
std::vector<std::string> values_of(const Words& words, const std::string& option);

// The option's only value; `otherwise` if the option was not given.
std::string value_of(const Words& words, const std::string& option, const std::string& otherwise);

// `--name value`, `--name=value`, `-nvalue`, `-n value`; several flags in one word, `-qv`. After
// `--` all words are operands. Throws UsageError.
Words sort_words(const std::vector<Option>& options, const std::vector<std::string>& words);

} // namespace talcmp
