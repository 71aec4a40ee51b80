#include "options.h"

#include <algorithm>
#include <cstddef>
#include <numeric>

namespace talcmp {
namespace {

bool begins_with(const std::string& text, const std::string& beginning) {
    return text.compare(0, beginning.size(), beginning) == 0;
}

// ---- What to say of an option that there is not

// How many characters have to be changed, put in or left out to make one word of the other.
std::size_t distance(const std::string& one, const std::string& other) {
    std::vector<std::size_t> row(other.size() + 1);
    std::iota(row.begin(), row.end(), std::size_t{0});
    for (std::size_t i = 0; i < one.size(); ++i) {
        std::size_t diagonal = row[0]++;
        for (std::size_t j = 0; j < other.size(); ++j) {
            const std::size_t replaced = diagonal + (one[i] == other[j] ? 0 : 1);
            diagonal = row[j + 1];
            row[j + 1] = std::min({replaced, row[j] + 1, row[j + 1] + 1});
        }
    }
    return row.back();
}

std::string hint_of(const Option& option) {
    return option.hint.empty() ? "did you mean " + option.name + "?" : option.hint;
}

// Empty where no option has a name that is like `word`.
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

class Sorter {
  public:
    Sorter(const std::vector<Option>& options, const std::vector<std::string>& words)
        : options_(options), next_(words.begin()), end_(words.end()) {}

    Words sort() {
        while (next_ != end_) {
            const std::string& word = *next_++;
            if (word == "--") {
                sorted_.operands.insert(sorted_.operands.end(), next_, end_);
                next_ = end_;
            } else if (begins_with(word, "--")) {
                take_long(word);
            } else if (word.size() > 1 && word[0] == '-') {
                take_short(word);
            } else {
                sorted_.operands.push_back(word);
            }
        }
        return sorted_;
    }

  private:
    template <typename Condition>
    const Option* find(const Condition& condition) const {
        const auto found = std::find_if(options_.begin(), options_.end(), condition);
        return found == options_.end() ? nullptr : &*found;
    }

    const Option* named(const std::string& name) const {
        return find([&name](const Option& option) { return option.name == name; });
    }

    const Option* lettered(const char letter) const {
        return find([letter](const Option& option) { return option.letter == letter; });
    }

    bool is_option(const std::string& word) const {
        return begins_with(word, "--")
               || (word.size() == 2 && word[0] == '-' && lettered(word[1]) != nullptr);
    }

    void take_long(const std::string& word) {
        const std::size_t equals = word.find('=');
        const std::string name = word.substr(0, equals);
        const Option* const option = named(name);
        if (option == nullptr) {
            refuse(options_, name);
        }
        const bool takes_value = option->kind != Option::Kind::flag;
        if (equals == std::string::npos) {
            add(*option, name, takes_value ? next_value(name) : "");
        } else if (takes_value) {
            add(*option, name, word.substr(equals + 1));
        } else {
            throw UsageError(name + " takes no value");
        }
    }

    void take_short(const std::string& word) {
        for (std::size_t i = 1; i < word.size(); ++i) {
            const Option* const option = lettered(word[i]);
            if (option == nullptr) {
                refuse(options_, word);
            }
            const std::string name = {'-', word[i]};
            if (option->kind != Option::Kind::flag) {
                const std::string rest = word.substr(i + 1);
                add(*option, name, rest.empty() ? next_value(name) : rest);
                return;
            }
            add(*option, name, "");
        }
    }

    std::string next_value(const std::string& name) {
        if (next_ == end_) {
            throw UsageError(name + " needs a value");
        }
        if (is_option(*next_)) {
            throw UsageError(name + " needs a value, and '" + *next_ + "' is an option");
        }
        return *next_++;
    }

    void add(const Option& option, const std::string& name, const std::string& value) {
        std::vector<std::string>& values = sorted_.values[option.name];
        if (option.kind == Option::Kind::value && !values.empty()) {
            throw UsageError(option.name + " is given twice");
        }
        if (option.kind != Option::Kind::flag && value.empty()) {
            throw UsageError(name + ": empty value");
        }
        values.push_back(value);
    }

    const std::vector<Option>& options_;
    std::vector<std::string>::const_iterator next_;
    std::vector<std::string>::const_iterator end_;
    Words sorted_;
};

} // namespace

std::vector<std::string> Words::all(const std::string& option) const {
    const auto found = values.find(option);
    return found == values.end() ? std::vector<std::string>() : found->second;
}

std::string Words::value(const std::string& option, const std::string& otherwise) const {
    return has(option) ? all(option).front() : otherwise;
}

Words sort_words(const std::vector<Option>& options, const std::vector<std::string>& words) {
    return Sorter(options, words).sort();
}

} // namespace talcmp
