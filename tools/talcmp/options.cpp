#include "options.h"

#include <algorithm>
#include <cstddef>
#include <numeric>
#include <utility>

#include <getopt.h>

namespace talcmp {
namespace {

bool begins_with(const std::string& text, const std::string& beginning) {
    return text.compare(0, beginning.size(), beginning) == 0;
}

// ---- What to say about an unknown option

// How many characters have to be changed, inserted or removed to turn one word into the other.
std::size_t distance(const std::string& one, const std::string& other) {
    std::vector<std::size_t> row(other.size() + 1);
    std::iota(row.begin(), row.end(), std::size_t{0});
    for (const char letter : one) {
        std::size_t diagonal = row[0]++;
        for (std::size_t j = 0; j < other.size(); ++j) {
            const std::size_t replaced = diagonal + (letter == other[j] ? 0 : 1);
            diagonal = row[j + 1];
            row[j + 1] = std::min({replaced, row[j] + 1, row[j + 1] + 1});
        }
    }
    return row.back();
}

std::string hint_of(const Option& option) {
    return option.hint.empty() ? "did you mean " + option.name + "?" : option.hint;
}

// Empty if no option has a name like `word`.
std::string hint_for(const std::vector<Option>& options, const std::string& word) {
    constexpr std::size_t shortest_beginning = 4; // "--st"
    std::size_t nearest = std::max<std::size_t>(word.size() / 3, 1) + 1;
    std::string hint;
    const auto consider = [&](const std::string& name, const std::string& hint_of_name) {
        const bool abbreviates = word.size() >= shortest_beginning && begins_with(name, word);
        const std::size_t away = abbreviates ? 0 : distance(word, name);
        if (away < nearest) {
            nearest = away;
            hint = hint_of_name;
        }
    };
    for (const Option& option : options) {
        consider(option.name, "did you mean " + option.name + "?");
        for (const std::string& name : option.other_names) {
            consider(name, hint_of(option));
        }
    }
    return hint;
}

[[noreturn]] void refuse(const std::vector<Option>& options, const std::string& word) {
    const std::string hint = hint_for(options, begins_with(word, "--") ? word : "-" + word);
    throw UsageError("there is no option '" + word + "'" + (hint.empty() ? "" : "; " + hint));
}

// ---- The words, one by one

// What getopt_long returns.
constexpr int is_operand = 1;
constexpr int is_member = '['; // of standard input: -[name]
constexpr int is_unknown = '?';
constexpr int lacks_value = ':';
constexpr int first_long_option = 256; // after all letters

class Sorter {
  public:
    Sorter(const std::vector<Option>& options, std::vector<std::string> words)
        : options_(options), words_(std::move(words)) {
        words_.insert(words_.begin(), "talcmp");
        for (std::string& word : words_) {
            arguments_.push_back(word.data());
        }
        arguments_.push_back(nullptr);
        describe_options();
    }

    Words sort() {
        ::optind = 0; // as at the start of the program
        ::opterr = 0; // it prints nothing
        while (take_next()) {
        }
        sorted_.operands.insert(sorted_.operands.end(), words_.begin() + ::optind, words_.end());
        return sorted_;
    }

  private:
    static bool takes_value(const Option& option) { return option.kind != Option::Kind::flag; }

    void describe_options() {
        for (std::size_t i = 0; i < options_.size(); ++i) {
            const Option& option = options_[i];
            long_options_.push_back({option.name.c_str() + 2,
                                     takes_value(option) ? required_argument : no_argument, nullptr,
                                     first_long_option + static_cast<int>(i)});
            if (option.letter != '\0') {
                letters_ += option.letter;
                letters_ += takes_value(option) ? ":" : "";
            }
        }
        long_options_.push_back({});
    }

    // Returns whether there was another option or operand in front of "--" or the end.
    bool take_next() {
        const std::string& word =
            words_[static_cast<std::size_t>(std::max(::optind, 1)) % words_.size()];
        // NOLINTNEXTLINE(concurrency-mt-unsafe): no other thread is there yet.
        const int found = ::getopt_long(static_cast<int>(words_.size()), arguments_.data(),
                                        letters_.c_str(), long_options_.data(), nullptr);
        if (found == is_operand) {
            sorted_.operands.emplace_back(::optarg);
        } else if (found == is_member) {
            sorted_.operands.push_back(std::string("-[") + (::optarg == nullptr ? "" : ::optarg));
        } else if (found >= 0) {
            take_option(word, found);
        }
        return found >= 0;
    }

    void take_option(const std::string& word, const int found) {
        const int code = found == is_unknown || found == lacks_value ? ::optopt : found;
        const Option* const option = option_of(code);
        const bool is_long = begins_with(word, "--");
        const std::string name =
            is_long ? word.substr(0, word.find('=')) : std::string{'-', static_cast<char>(code)};
        // Names may not be abbreviated, so that no new option changes what a command means.
        if (option == nullptr || (is_long && option->name != name)) {
            refuse(options_, is_long ? name : word);
        }
        if (found == is_unknown) {
            throw UsageError(name + " takes no value");
        }
        if (found == lacks_value) {
            throw UsageError(name + " needs a value");
        }
        add(*option, name, takes_value(*option) ? ::optarg : "");
    }

    // Null where there is none.
    const Option* option_of(const int code) const {
        const auto found =
            std::find_if(options_.begin(), options_.end(), [&](const Option& option) {
                return code == option.letter
                       || code == first_long_option + (&option - options_.data());
            });
        return code == '\0' || found == options_.end() ? nullptr : &*found;
    }

    bool is_option(const std::string& word) const {
        return begins_with(word, "--")
               || (word.size() == 2 && word[0] == '-' && option_of(word[1]) != nullptr);
    }

    void add(const Option& option, const std::string& name, const std::string& value) {
        std::vector<std::string>& values = sorted_.values[option.name];
        if (option.kind == Option::Kind::value && !values.empty()) {
            throw UsageError(option.name + " is given twice");
        }
        if (takes_value(option) && value.empty()) {
            throw UsageError(name + ": empty value");
        }
        // A value in a word of its own that looks like an option was probably meant as one.
        const bool own_word =
            takes_value(option) && ::optarg == arguments_[static_cast<std::size_t>(::optind - 1)];
        if (own_word && is_option(value)) {
            throw UsageError(name + " needs a value, and '" + value + "' is an option");
        }
        values.push_back(value);
    }

    const std::vector<Option>& options_;
    std::vector<std::string> words_;
    std::vector<char*> arguments_;
    std::vector<::option> long_options_;
    // "-" returns operands in their places; ":" tells missing values from unknown options.
    std::string letters_ = "-:[::";
    Words sorted_;
};

} // namespace

std::vector<std::string> values_of(const Words& words, const std::string& option) {
    const auto found = words.values.find(option);
    return found == words.values.end() ? std::vector<std::string>() : found->second;
}

std::string value_of(const Words& words, const std::string& option, const std::string& otherwise) {
    return has(words, option) ? words.values.at(option).front() : otherwise;
}

Words sort_words(const std::vector<Option>& options, const std::vector<std::string>& words) {
    return Sorter(options, words).sort();
}

} // namespace talcmp
