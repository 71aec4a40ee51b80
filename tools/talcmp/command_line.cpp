#include "command_line.h"

#include "array_file.h"

#include <charconv>
#include <cmath>
#include <cstdio>
#include <vector>

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
  -v, --verbose           report arrays that are the same, too
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

const std::vector<Option>& options() {
    using Kind = Option::Kind;
    static const std::vector<Option> all = {
        {"--tol",
         Kind::value,
         '\0',
         {"--rtol", "--atol", "--rel-tol", "--abs-tol", "--tolerance", "--eps", "--epsilon"},
         "reals are tolerated by --tol DIGITS, in binary digits"},
        {"--strict-type"},
        {"--slice", Kind::value},
        {"--include", Kind::values},
        {"--exclude", Kind::values},
        {"--max-differences", Kind::value, 'n'},
        {"--report"},
        {"--json"},
        {"--quiet", Kind::flag, 'q'},
        {"--verbose", Kind::flag, 'v'},
        {"--threads", Kind::value},
        {"--help", Kind::flag, 'h'},
        {"--version"},
    };
    return all;
}

// What the words mean.
CommandLine command_line_of(const Words& words) {
    constexpr std::size_t most_differences = 1000000; // each thread holds so many in memory
    constexpr unsigned most_threads = 64;
    CommandLine line;
    line.json = has(words, "--json");
    line.quiet = has(words, "--quiet");
    line.verbose = has(words, "--verbose");
    line.filter = {values_of(words, "--include"), values_of(words, "--exclude")};
    line.slice = value_of(words, "--slice", "");
    line.question.tolerance = tolerance_from(value_of(words, "--tol", "0"));
    line.question.strict_type = has(words, "--strict-type");
    line.question.differences = number_from(
        "--max-differences", value_of(words, "--max-differences", "1"), most_differences);
    line.question.report = has(words, "--report");
    if (has(words, "--threads")) {
        line.question.threads =
            number_from("--threads", value_of(words, "--threads", ""), most_threads);
    }
    if (has(words, "--slice")) {
        line.question.selection = selection_from(line.slice);
    }
    return line;
}

void take_operands(const std::vector<std::string>& operands, CommandLine& line) {
    if (operands.size() > 2) {
        throw UsageError("there are more than two arrays; a pattern for several goes in quotes");
    }
    if (operands.size() < 2 || operands[0].empty() || operands[1].empty()) {
        throw UsageError("two arrays are needed, A and B");
    }
    line.first = operands[0];
    line.second = operands[1];
}

void check_together(const CommandLine& line) {
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
    const Words words = sort_words(options(), {argv + 1, argv + argc});
    if (has(words, "--help") || has(words, "--version")) {
        std::fputs(has(words, "--help") ? help : "talcmp " TALCMP_VERSION "\n", stdout);
        return std::nullopt;
    }
    CommandLine line = command_line_of(words);
    take_operands(words.operands, line);
    check_together(line);
    line.question.report = line.question.report || line.json;
    line.question.only_whether = line.quiet;
    return line;
}

} // namespace talcmp
