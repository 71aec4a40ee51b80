// The files of arrays in a folder.

#pragma once

#include <map>
#include <optional>
#include <set>
#include <string>

namespace talcmp {

struct FolderFile {
    std::string path;
    std::optional<std::string> trouble = {}; // why it must not be opened
};

using FilesByName = std::map<std::string, FolderFile>;

struct FolderFiles {
    FilesByName files;
    std::set<std::string> others; // the names of files that are not called like arrays
};

// All files in a folder and in those below it that are called like files of arrays, by their paths
// in the folder. Links to folders are followed. Throws Trouble when the folder itself cannot be
// read.
//
// What cannot be read is listed with its trouble, whatever its name, as it may hide arrays: a
// folder without permission, a link that leads nowhere or back to a folder that it is in.
FolderFiles files_in(const std::string& folder);

// Why a file that was not named itself must not be opened; nothing if it may be. Opening a pipe
// waits for a writer, which may never come.
std::optional<std::string> reason_not_to_open(const std::string& path);

} // namespace talcmp
