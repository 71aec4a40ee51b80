#include "command_line.h"

#include <CLI/CLI.hpp>

#include <charconv>
#include <cmath>

namespace talcmp {
namespace {

constexpr const char* description =
    "Says whether two arrays in .npy files are the same, and where they first differ.";

constexpr const char* footer =
    "Exit status: 0 the arrays are the same, 1 they differ, 2 there was trouble.\n"
    "Two reals of one sign are the same when they differ by less than 2^(DIGITS - 53) times\n"
    "the larger, or 2^(DIGITS - 24) where they are compared as singles. Zero is the same only\n"
    "as zero. Integers are compared exactly. With the tolerance 0, arrays of one real or\n"
    "complex type are compared bit by bit: +0 and -0 differ, equal NaNs do not.";

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

} // namespace

std::optional<CommandLine> read_command_line(const int argc, const char* const* argv) {
    CommandLine command_line;
    std::string tolerance = "0";
    CLI::App app(description, "talcmp");
    app.footer(footer);
    app.set_version_flag("--version", "talcmp " TALCMP_VERSION);
    app.add_option("--tol", tolerance, "Tolerance for reals, in binary digits; 0 if not given")
        ->type_name("DIGITS");
    app.add_flag("--strict-type", command_line.question.strict_type,
                 "Arrays of different element types differ")
        ->disable_flag_override();
    app.add_option("A", command_line.first, "The first array, an .npy file")
        ->type_name("")
        ->required();
    app.add_option("B", command_line.second, "The second array, an .npy file")
        ->type_name("")
        ->required();
    try {
        app.parse(argc, argv);
    } catch (const CLI::ParseError& error) {
        if (error.get_exit_code() != static_cast<int>(CLI::ExitCodes::Success)) {
            throw UsageError(error.what());
        }
        app.exit(error); // prints the help or the version
        return std::nullopt;
    }
    command_line.question.tolerance = tolerance_from(tolerance);
    return command_line;
}

} // namespace talcmp
