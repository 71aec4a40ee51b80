// What the two operands of the command line stand for.

#pragma once

#include <optional>
#include <string>
#include <vector>

namespace talcmp {

// Two paths with one name, or a path that has no counterpart.
struct NamedPair {
    std::string name;
    std::optional<std::string> first;
    std::optional<std::string> second;
    std::optional<std::string> trouble = {}; // why they cannot be compared, with the name of which
};

struct FilePairs {
    bool many = false;            // whether folders or patterns were matched by name
    std::vector<NamedPair> pairs; // of paths
};

// Two files; or all .npy and .npz files in two folders, by their paths in the folders; or what
// matches two patterns, by the names of the files. Throws Trouble.
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

// All names of both lists that the filter accepts, in order.
std::vector<NamedPair> match_names(const std::vector<std::string>& first,
                                   const std::vector<std::string>& second,
                                   const NameFilter& filter);

} // namespace talcmp
