// What keeps talcmp from an answer, and how that is told.

#ifndef TALCMP_TROUBLE_H
#define TALCMP_TROUBLE_H

#include <algorithm>
#include <stdexcept>
#include <string>

namespace talcmp {

// The name of a file or of a member of an archive, in one line and without what a terminal might
// take for a command. Names are others' work, those in archives anybody's.
inline std::string shown(std::string name) {
    std::replace_if(
        name.begin(), name.end(), [](const unsigned char c) { return c < ' ' || c == 0x7F; }, '?');
    return name.empty() ? "''" : name;
}

// A file that cannot be compared. The text names the file, what is wrong and, where there is
// something to do, what to do.
class Trouble : public std::runtime_error {
  public:
    Trouble(const std::string& file, const std::string& what_is_wrong)
        : std::runtime_error(shown(file) + ": " + shown(what_is_wrong)) {}
};

} // namespace talcmp

#endif
