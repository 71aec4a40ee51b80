#include "operands.h"

#include "array_file.h"
#include "folder_files.h"
#include "trouble.h"

#include <algorithm>
#include <filesystem>
#include <iterator>
#include <map>
#include <set>
#include <system_error>

#include <fnmatch.h>
#include <glob.h>

namespace talcmp {
namespace {

namespace fs = std::filesystem;

// Removes from `pairs` what is below a name with trouble, as nothing is known about it.
void leave_to_trouble(std::map<std::string, NamedPair>& pairs) {
    for (auto pair = pairs.begin(); pair != pairs.end(); ++pair) {
        if (pair->second.trouble) {
            const std::string below = pair->first + '/';
            const std::string after = pair->first + char('/' + 1);
            pairs.erase(pairs.lower_bound(below), pairs.lower_bound(after));
        }
    }
}

std::vector<NamedPair> matched(const FilesByName& first, const FilesByName& second) {
    std::map<std::string, NamedPair> pairs;
    const auto add = [&pairs](const FilesByName& files,
                              std::optional<std::string> NamedPair::*side) {
        for (const auto& [name, file] : files) {
            NamedPair& pair = pairs[name];
            pair.name = name;
            pair.*side = file.path;
            if (file.trouble && !pair.trouble) {
                pair.trouble = Trouble(file.path, *file.trouble).what();
            }
        }
    };
    add(first, &NamedPair::first);
    add(second, &NamedPair::second);
    leave_to_trouble(pairs);
    std::vector<NamedPair> list;
    list.reserve(pairs.size());
    for (auto& [name, pair] : pairs) {
        list.push_back(std::move(pair));
    }
    return list;
}

bool is_folder(const std::string& path) {
    std::error_code error;
    return fs::is_directory(path, error);
}

bool exists(const std::string& path) {
    std::error_code error;
    return fs::exists(fs::symlink_status(path, error));
}

bool is_pattern(const std::string& operand) {
    return operand.find_first_of("*?[") != std::string::npos && !exists(operand);
}

FilesByName files_that_match(const std::string& pattern) {
    glob_t found = {};
    // NOLINTNEXTLINE(concurrency-mt-unsafe): no other thread is there yet.
    const int status = ::glob(pattern.c_str(), GLOB_ERR, nullptr, &found);
    std::vector<std::string> paths;
    if (status == 0) {
        paths.assign(found.gl_pathv, found.gl_pathv + found.gl_pathc);
    }
    ::globfree(&found);
    if (status == GLOB_ABORTED) {
        throw Trouble(pattern, "cannot be matched: one of its folders cannot be read");
    }
    if (paths.empty()) {
        throw Trouble(pattern, "there is no such file, and no file matches it as a pattern");
    }
    FilesByName files;
    for (const std::string& path : paths) {
        const std::string name = fs::path(path).filename().string();
        const auto [place, is_new] =
            files.emplace(name, FolderFile{path, reason_not_to_open(path)});
        if (!is_new) {
            throw Trouble(pattern, "matches two files of one name, " + place->second.path + " and "
                                       + path + "; files are matched by name");
        }
    }
    return files;
}

// What an operand stands for, determined once.
enum class OperandKind { file, member, standard_input, folder, pattern };

OperandKind kind_of(const std::string& operand) {
    return operand == standard_input_path ? OperandKind::standard_input
           : is_folder(operand)           ? OperandKind::folder
           : split_member(operand).second ? OperandKind::member
           : is_pattern(operand)          ? OperandKind::pattern
                                          : OperandKind::file;
}

bool stands_for_many(const OperandKind kind) {
    return kind == OperandKind::folder || kind == OperandKind::pattern;
}

FolderFiles files_of(const std::string& operand, const OperandKind kind) {
    return kind == OperandKind::folder ? files_in(operand)
                                       : FolderFiles{files_that_match(operand), {}};
}

// The file of the same name in the folder. Throws Trouble.
std::string in_folder(const std::string& folder, const std::string& file) {
    std::string path = (fs::path(folder) / fs::path(file).filename()).string();
    if (const auto trouble = reason_not_to_open(path)) {
        throw Trouble(path, *trouble);
    }
    return path;
}

bool is_file_or_pipe(const std::string& path) {
    std::error_code error;
    const fs::file_status status = fs::status(path, error);
    return path == standard_input_path || fs::is_regular_file(status) || fs::is_fifo(status);
}

// A pattern of members, or the name of one, without the root.
std::string without_root(const std::string& name) {
    return name.substr(name.size() > 1 && name.front() == '/' ? 1 : 0);
}

bool matches_any(const std::vector<std::string>& patterns, const std::string& name) {
    return std::any_of(patterns.begin(), patterns.end(), [&name](const std::string& pattern) {
        return ::fnmatch(pattern.c_str(), name.c_str(), 0) == 0;
    });
}

bool accepts(const NameFilter& filter, const std::string& name) {
    return (filter.include.empty() || matches_any(filter.include, name))
           && !matches_any(filter.exclude, name);
}

// Without names that match a pattern.
FolderFiles without(FolderFiles folder, const std::vector<std::string>& exclude) {
    const auto remove_from = [&exclude](auto& entries, const auto& name_of) {
        for (auto entry = entries.begin(); entry != entries.end();) {
            entry = matches_any(exclude, name_of(*entry)) ? entries.erase(entry) : std::next(entry);
        }
    };
    remove_from(folder.files, [](const auto& file) { return file.first; });
    remove_from(folder.others, [](const std::string& name) { return name; });
    return folder;
}

FilePairs match_many(const FolderFiles& first, const FolderFiles& second) {
    std::set<std::string> others = first.others;
    others.insert(second.others.begin(), second.others.end());
    return {true, matched(first.files, second.files), others.size()};
}

} // namespace

std::pair<std::string, std::optional<std::string>> split_member(const std::string& operand) {
    if (operand.empty() || operand.back() != ']' || exists(operand)) {
        return {operand, std::nullopt};
    }
    // Names of files and of members may have brackets too.
    for (std::size_t bracket = operand.find('['); bracket != std::string::npos;
         bracket = operand.find('[', bracket + 1)) {
        std::string path = operand.substr(0, bracket);
        if (is_file_or_pipe(path)) {
            const std::string member = operand.substr(bracket + 1, operand.size() - bracket - 2);
            return {std::move(path), without_root(member)};
        }
    }
    return {operand, std::nullopt};
}

FilePairs match_files(const std::string& first, const std::string& second,
                      const std::vector<std::string>& exclude) {
    const OperandKind kind1 = kind_of(first);
    const OperandKind kind2 = kind_of(second);
    if (stands_for_many(kind1) && stands_for_many(kind2)) {
        FilePairs files = match_many(without(files_of(first, kind1), exclude),
                                     without(files_of(second, kind2), exclude));
        if (files.pairs.empty()) {
            throw Trouble(first,
                          "holds no file of arrays to compare, nor does " + second
                              + "; in folders, these are the files named *.npy, *.npz, *.h5, "
                                "*.hdf5, *.he5, *.nc, *.nc4 and *.cdf");
        }
        return files;
    }
    if (kind1 == OperandKind::standard_input || kind2 == OperandKind::standard_input
        || kind1 == OperandKind::member || kind2 == OperandKind::member) {
        auto [path1, member1] = split_member(first);
        auto [path2, member2] = split_member(second);
        return {false, {{"", path1, path2}}, 0, member1, member2};
    }
    if (kind1 == OperandKind::pattern || kind2 == OperandKind::pattern) {
        throw Trouble(kind1 == OperandKind::pattern ? first : second,
                      "there is no such file; a pattern can be compared with another one or with a "
                      "folder");
    }
    const std::string path1 = kind1 == OperandKind::folder ? in_folder(first, second) : first;
    const std::string path2 = kind2 == OperandKind::folder ? in_folder(second, first) : second;
    return {false, {{"", path1, path2}}};
}

std::vector<NamedPair> match_names(const std::vector<std::string>& first,
                                   const std::vector<std::string>& second,
                                   const NameFilter& filter) {
    NameFilter of_names;
    for (const auto list : {&NameFilter::include, &NameFilter::exclude}) {
        for (const std::string& pattern : filter.*list) {
            (of_names.*list).push_back(without_root(pattern));
        }
    }
    const auto accepted = [&of_names](const std::vector<std::string>& names) {
        FilesByName result;
        for (const std::string& name : names) {
            if (accepts(of_names, name)) {
                result[name] = {name};
            }
        }
        return result;
    };
    return matched(accepted(first), accepted(second));
}

} // namespace talcmp
