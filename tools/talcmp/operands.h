// What the two operands of the command line stand for.

#pragma once

#include <array>
#include <cstdint>
#include <optional>
#include <string>
#include <utility>
#include <vector>

namespace talcmp {

// Two paths with one name, or a path that has no counterpart.
struct NamedPair {
    std::string name;
    std::optional<std::string> first;
    std::optional<std::string> second;
    std::optional<std::string> trouble = {}; // why they cannot be compared, with the name of which
    // Of each, if known: those that may be read in any order.
    std::array<std::uint64_t, 2> bytes = {};
};

struct FilePairs {
    bool many = false;                       // whether folders or patterns were matched by name
    std::vector<NamedPair> pairs;            // of paths
    std::uint64_t others = 0;                // files in folders whose names are not those of arrays
    std::optional<std::string> member1 = {}; // the arrays that were named in a pair of files
    std::optional<std::string> member2 = {};
};

// The path of a file and, if the operand is "file[member]" and no file has this name, the member,
// without the root that messages write before it.
std::pair<std::string, std::optional<std::string>> split_member(const std::string& operand);

// Two files, or members of them; or all files of arrays in two folders, by their paths in the
// folders; or what matches two patterns, by the names of the files. Throws Trouble.
// Names that match a pattern of `exclude` are left out.
//
// Links to folders are followed. What may hide arrays and cannot be read is a pair with trouble: a
// folder without permission, a link that leads nowhere or to a folder that it is in, and a pipe, a
// socket or a device with the name of a file.
FilePairs match_files(const std::string& first, const std::string& second,
                      const std::vector<std::string>& exclude);

// Patterns for names, as in a shell; `include` without patterns stands for all names.
struct NameFilter {
    std::vector<std::string> include;
    std::vector<std::string> exclude;
};

// All names of both lists that the filter accepts, in order. A pattern may begin with the root that
// messages write before names.
std::vector<NamedPair> match_names(const std::vector<std::string>& first,
                                   const std::vector<std::string>& second,
                                   const NameFilter& filter);

} // namespace talcmp
