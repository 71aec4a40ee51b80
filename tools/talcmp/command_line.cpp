#include "command_line.h"

#include "array_file.h"

#include <CLI/CLI.hpp>

#include <algorithm>
#include <charconv>
#include <cmath>
#include <cstdio>

namespace talcmp {
namespace {

// One screen of 24 lines.
constexpr const char* help =
    R"(Usage: talcmp [OPTION]... A B
Say whether two arrays of numbers are the same, and where they first differ.
A and B: .npy files, .npz archives, '-' for an .npy file on standard input,
two folders, or two patterns in quotes ('run1/*.npy'), matched by name.

      --tol DIGITS        tolerate so many binary digits in reals (default 0)
      --strict-type       arrays of different element types differ
      --slice RANGES      compare a part, such as 0:10,:,3
      --include PATTERN   only such members of an archive; may be repeated
      --exclude PATTERN   no such members, or files of folders; may be repeated
  -n, --max-differences N list the first N differences (default 1)
      --report            count and measure all differences
      --json              print a report in JSON
  -q, --quiet             print nothing but trouble, only exit
  -v, --verbose           tell of arrays that are the same, too
      --threads N         use at most N threads; answers are the same
  -h, --help; --version   print this; print the version

With DIGITS = 0 reals are compared bit by bit. Otherwise two reals of one sign
are the same when they differ by less than 2^(DIGITS - 53) times the larger,
2^(DIGITS - 24) for singles. Integers are always compared exactly.
Exit status: 0 the same, 1 different, 2 trouble. More: man talcmp.
)";

talreal tolerance_from(const std::string& text) {
    talreal tolerance = 0;
    const char* const end = text.data() + text.size();
    const auto [rest, error] = std::from_chars(text.data(), end, tolerance);
    if (error == std::errc::result_out_of_range) {
        throw UsageError("--tol " + text + " is too large or too small for a double");
    }
    if (error != std::errc{} || rest != end || std::isnan(tolerance)) {
        throw UsageError("--tol takes a number of binary digits, such as 10 or 2.5, not '" + text
                         + "'");
    }
    return tolerance;
}

template <typename Number>
Number number_from(const char* const option, const std::string& text, const Number most) {
    Number number = 0;
    const char* const end = text.data() + text.size();
    const auto [rest, error] = std::from_chars(text.data(), end, number);
    if (error != std::errc{} || rest != end || number < 1 || number > most) {
        throw UsageError(std::string(option) + " takes a number from 1 to " + std::to_string(most)
                         + ", not '" + text + "'");
    }
    return number;
}

Selection selection_from(const std::string& text) {
    try {
        return read_selection(text);
    } catch (const std::invalid_argument& error) {
        throw UsageError("--slice takes ranges such as 0:10,:,3; in '" + text
                         + "': " + error.what());
    }
}

// As it stands on the command line.
struct Texts {
    std::string tolerance = "0";
    std::string differences = "1";
    std::string threads;
    bool help = false;
    bool version = false;
};

// What the words are that belong to no option, and are no operands.
std::string complaint(const std::vector<std::string>& words) {
    const auto option = std::find_if(words.begin(), words.end(), [](const std::string& word) {
        return word.size() > 1 && word.front() == '-';
    });
    if (option != words.end()) {
        return "there is no option '" + *option + "'";
    }
    return "there are more than two arrays; a pattern for several goes in quotes";
}

void add_options(CLI::App& app, CommandLine& line, Texts& texts) {
    app.set_help_flag();
    app.add_flag("-h,--help", texts.help)->disable_flag_override();
    app.add_flag("--version", texts.version)->disable_flag_override();
    app.add_option("--tol", texts.tolerance);
    app.add_flag("--strict-type", line.question.strict_type)->disable_flag_override();
    app.add_option("--slice", line.slice);
    // One pattern behind each; the next word is an operand.
    app.add_option("--include", line.filter.include)->allow_extra_args(false);
    app.add_option("--exclude", line.filter.exclude)->allow_extra_args(false);
    app.add_option("-n,--max-differences", texts.differences);
    app.add_flag("--report", line.question.report)->disable_flag_override();
    app.add_flag("--json", line.json)->disable_flag_override();
    app.add_flag("-q,--quiet", line.quiet)->disable_flag_override();
    app.add_flag("-v,--verbose", line.verbose)->disable_flag_override();
    app.add_option("--threads", texts.threads);
    app.add_option("A", line.first);
    app.add_option("B", line.second);
}

void check_together(const CommandLine& line) {
    if (line.first.empty() || line.second.empty()) {
        throw UsageError("two arrays are needed, A and B");
    }
    if (line.first == standard_input_path && line.second == standard_input_path) {
        throw UsageError("standard input can be only one of the two arrays");
    }
    if (line.quiet && (line.verbose || line.json || line.question.report)) {
        throw UsageError("--quiet prints nothing, and so does not go with --verbose, --report or "
                         "--json");
    }
}

} // namespace

std::optional<CommandLine> read_command_line(const int argc, const char* const* argv) {
    CommandLine line;
    Texts texts;
    CLI::App app;
    add_options(app, line, texts);
    try {
        app.parse(argc, argv);
    } catch (const CLI::ExtrasError&) {
        throw UsageError(complaint(app.remaining()));
    } catch (const CLI::ParseError& error) {
        throw UsageError(error.what());
    }
    if (texts.help || texts.version) {
        std::fputs(texts.help ? help : "talcmp " TALCMP_VERSION "\n", stdout);
        return std::nullopt;
    }
    constexpr std::size_t most_differences = 10000000; // that memory holds
    constexpr unsigned most_threads = 64;
    line.question.tolerance = tolerance_from(texts.tolerance);
    line.question.differences =
        number_from("--max-differences", texts.differences, most_differences);
    if (!texts.threads.empty()) {
        line.question.threads = number_from("--threads", texts.threads, most_threads);
    }
    if (!line.slice.empty()) {
        line.question.selection = selection_from(line.slice);
    }
    check_together(line);
    line.question.report = line.question.report || line.json;
    line.question.only_whether = line.quiet;
    return line;
}

} // namespace talcmp
