#include "terminal.h"

#include "environment.h"

#include <sys/ioctl.h>
#include <unistd.h>

namespace talcmp {

Terminal Terminal::of(const int descriptor) {
    const bool is_terminal = ::isatty(descriptor) == 1;
    const bool colours = is_terminal && takes_escapes() && environment("NO_COLOR").empty();
    return {is_terminal, colours, columns_of(descriptor)};
}

std::string Terminal::coloured(const std::string& text, const Colour colour) const {
    if (!colours_) {
        return text;
    }
    const char* const code = colour == Colour::red ? "31" : colour == Colour::green ? "32" : "34";
    return "\x1B[" + std::string(code) + "m" + text + "\x1B[0m";
}

bool takes_escapes() {
    const std::string terminal = environment("TERM");
    return !terminal.empty() && terminal != "dumb";
}

int columns_of(const int descriptor) {
    constexpr int usual = 80;
    struct winsize size = {};
    if (::ioctl(descriptor, TIOCGWINSZ, &size) != 0 || size.ws_col == 0) {
        return usual;
    }
    return size.ws_col;
}

} // namespace talcmp
