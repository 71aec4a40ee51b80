#include "command_line.h"

#include "array_file.h"
#include "picture.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <cmath>
#include <vector>

namespace talcmp {
namespace {

constexpr const char* help =
    R"(Usage: talcmp [OPTION]... A B
Say whether two arrays of numbers are the same, and where they first differ.
A and B: files of arrays; members of files, such as 'a.npz[x]'; '-' for a file
on standard input; two folders, or two patterns in quotes ('run1/*.npy'),
matched by name.

What is the same
      --tol DIGITS        tolerate so many binary digits in reals (default 0)
      --relative ERROR    the same tolerance as a relative error, such as 1e-9
      --absolute ERROR    elements at most ERROR apart are the same, too
      --equal-nan         a NaN is the same as a NaN
      --strict-type       arrays of different element types differ
      --squeeze           axes of length 1 do not matter
What is compared
      --slice RANGES      a part, such as 0:10,:,3 or ...,::2
      --ignore FILE       nothing where this array of booleans is true
      --include PATTERN   only such members of files; may be repeated
      --exclude PATTERN   no such members, or files of folders; may be repeated
      --skip-others       members that are no arrays of numbers are no trouble
      --first             stop at the first difference of several arrays
What is printed
  -n, --max-differences N list the first N differences (default 1)
      --report            count and measure all differences
      --json              print a report in JSON
      --picture FILE      draw where they differ, as .png or .svg
  -q, --quiet             print nothing but trouble, only exit
  -v, --verbose           report arrays that are the same, too
      --threads N         use at most N threads; answers are the same
  -h, --help; --version   print this; print the version and the formats

With DIGITS = 0 reals are compared bit by bit. Otherwise two reals of one sign
are the same when they differ by less than 2^(DIGITS - 53) times the larger,
2^(DIGITS - 24) for singles. Integers are always compared exactly.
Exit status: 0 the same, 1 different, 2 trouble. More: man talcmp.
)";

// Nothing if the text is no number at all; throws if it is one that is too large or too small.
std::optional<double> real_from(const char* const option, const std::string& text) {
    double value = 0;
    const char* const end = text.data() + text.size();
    const auto [rest, error] = std::from_chars(text.data(), end, value);
    if (error == std::errc::result_out_of_range) {
        throw UsageError(std::string(option) + " " + text
                         + " is too large or too small for a double");
    }
    return error != std::errc{} || rest != end || std::isnan(value) ? std::nullopt
                                                                    : std::optional(value);
}

talreal tolerance_from(const std::string& text) {
    const auto tolerance = real_from("--tol", text);
    if (!tolerance) {
        throw UsageError("--tol takes a number of binary digits, such as 10 or 2.5, not '" + text
                         + "'");
    }
    return *tolerance;
}

double relative_from(const std::string& text) {
    const auto error = real_from("--relative", text);
    if (!error || !is_relative_error(*error)) {
        throw UsageError("--relative takes an error between 0 and 1, such as 1e-9, not '" + text
                         + "'");
    }
    return *error;
}

double absolute_from(const std::string& text) {
    const auto error = real_from("--absolute", text);
    if (!error || !is_absolute_error(*error)) {
        throw UsageError("--absolute takes an error from 0 to 1e300, such as 1e-12, not '" + text
                         + "'");
    }
    return *error;
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

std::string picture_from(std::string path) {
    if (!path.empty() && !is_picture(path)) {
        throw UsageError("--picture takes a file named *.png or *.svg, not '" + path + "'");
    }
    return path;
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
         {"--tolerance", "--eps", "--epsilon"},
         "reals are tolerated by --tol DIGITS, in binary digits, or by --relative ERROR"},
        {"--relative", Kind::value, '\0', {"--rtol", "--rel-tol"}},
        {"--absolute", Kind::value, '\0', {"--atol", "--abs-tol"}},
        {"--equal-nan", Kind::flag, '\0', {"--equal_nan", "--nan-equal", "--nans-equal"}},
        {"--strict-type"},
        {"--squeeze"},
        {"--slice", Kind::value},
        {"--ignore", Kind::value},
        {"--include", Kind::values},
        {"--exclude", Kind::values},
        {"--skip-others"},
        {"--first"},
        {"--max-differences", Kind::value, 'n'},
        {"--report"},
        {"--json"},
        {"--picture", Kind::value},
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
    CommandLine line;
    line.json = has(words, "--json");
    line.quiet = has(words, "--quiet");
    line.verbose = has(words, "--verbose");
    line.filter = {values_of(words, "--include"), values_of(words, "--exclude")};
    line.skip_others = has(words, "--skip-others");
    line.only_first = has(words, "--first");
    line.slice = value_of(words, "--slice", "");
    line.ignore = value_of(words, "--ignore", "");
    line.question.tolerance = tolerance_from(value_of(words, "--tol", "0"));
    if (has(words, "--relative")) {
        line.question.relative = relative_from(value_of(words, "--relative", ""));
    }
    if (has(words, "--absolute")) {
        line.question.absolute = absolute_from(value_of(words, "--absolute", ""));
    }
    line.question.equal_nan = has(words, "--equal-nan");
    line.question.squeeze = has(words, "--squeeze");
    line.question.strict_type = has(words, "--strict-type");
    line.question.differences = number_from(
        "--max-differences", value_of(words, "--max-differences", "1"), most_differences);
    line.report = has(words, "--report");
    line.picture = picture_from(value_of(words, "--picture", ""));
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

// Whether the operand is standard input, or a member of what is there.
bool is_standard_input(const std::string& operand) {
    return operand == standard_input_path || operand.compare(0, 2, "-[") == 0;
}

void check_together(const Words& words, const CommandLine& line) {
    const auto from_there = [](const std::string& operand) { return is_standard_input(operand); };
    const std::array<std::string, 3> operands = {line.first, line.second, line.ignore};
    if (std::count_if(operands.begin(), operands.end(), from_there) > 1) {
        throw UsageError("standard input can be only one of the arrays");
    }
    if (has(words, "--tol") && has(words, "--relative")) {
        throw UsageError("--tol and --relative both say how much reals may differ; give one");
    }
    if (line.quiet && (line.verbose || line.json || line.report)) {
        throw UsageError("--quiet prints nothing, and so does not go with --verbose, --report or "
                         "--json");
    }
}

// An error is easily taken for a number of digits.
std::string note_on_tolerance(const Words& words, const CommandLine& line) {
    const talreal tolerance = line.question.tolerance;
    if (line.quiet || !(0 < tolerance && tolerance < 1)) {
        return "";
    }
    const std::string text = value_of(words, "--tol", "");
    return "--tol " + text + " means " + text + " binary digits; a relative error is --relative "
           + text;
}

std::string version() {
    std::string formats;
    for (const std::string_view format : format_names()) {
        formats += (formats.empty() ? "" : ", ") + std::string(format);
    }
    return "talcmp " TALCMP_VERSION "\nreads " + formats + "\n";
}

} // namespace

CommandLine read_command_line(const int argc, const char* const* argv) {
    const Words words = sort_words(options(), {argv + 1, argv + argc});
    if (has(words, "--help") || has(words, "--version")) {
        CommandLine line;
        line.text = has(words, "--help") ? help : version();
        return line;
    }
    CommandLine line = command_line_of(words);
    take_operands(words.operands, line);
    check_together(words, line);
    line.note = note_on_tolerance(words, line);
    line.question.report = line.report || line.json || !line.picture.empty();
    line.question.only_whether = line.quiet;
    return line;
}

} // namespace talcmp
