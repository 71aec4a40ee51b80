#include "hdf5_members.h"

#include <algorithm>
#include <cstddef>
#include <deque>
#include <optional>
#include <set>
#include <string_view>
#include <tuple>
#include <vector>

#include <sys/stat.h>

namespace talcmp::hdf5 {
namespace {

// ---- Links

struct Link {
    std::string name;
    bool is_hard;
};

// An exception must not pass through the library.
herr_t add_link(const hid_t /*group*/, const char* const name, const H5L_info_t* const info,
                void* const links) try {
    static_cast<std::vector<Link>*>(links)->push_back({name, info->type == H5L_TYPE_HARD});
    return 0;
} catch (const std::bad_alloc&) {
    return -1;
}

// By their names; nothing if the group is broken.
std::optional<std::vector<Link>> links_of(const hid_t group) {
    std::vector<Link> links;
    if (::H5Literate(group, H5_INDEX_NAME, H5_ITER_NATIVE, nullptr, add_link, &links) < 0) {
        return std::nullopt;
    }
    std::sort(links.begin(), links.end(),
              [](const Link& one, const Link& other) { return one.name < other.name; });
    return links;
}

// ---- What a link leads to

std::optional<H5O_type_t> type_at(const hid_t group, const std::string& path) {
    H5O_info_t info = {};
    if (::H5Oget_info_by_name2(group, path.c_str(), &info, H5O_INFO_BASIC, H5P_DEFAULT) < 0) {
        return std::nullopt;
    }
    return info.type;
}

std::string text_of(const hid_t attribute) {
    const Handle type(::H5Aget_type(attribute));
    if (::H5Tget_class(type.id()) != H5T_STRING) {
        return "";
    }
    const Handle space(::H5Aget_space(attribute));
    if (::H5Sget_simple_extent_npoints(space.id()) != 1) {
        return "";
    }
    if (::H5Tis_variable_str(type.id()) > 0) {
        char* text = nullptr;
        if (::H5Aread(attribute, type.id(), static_cast<void*>(&text)) < 0 || text == nullptr) {
            return "";
        }
        std::string copy = text;
        ::H5free_memory(text);
        return copy;
    }
    std::string text(::H5Tget_size(type.id()), '\0');
    return ::H5Aread(attribute, type.id(), text.data()) < 0 ? "" : text;
}

// Whether the array at `path` stands for a dimension of netCDF that has a size, but no values.
bool is_mere_dimension(const hid_t group, const std::string& path) {
    constexpr std::string_view mark = "This is a netCDF dimension but not a netCDF variable";
    if (::H5Aexists_by_name(group, path.c_str(), "NAME", H5P_DEFAULT) <= 0) {
        return false;
    }
    const Handle attribute(
        ::H5Aopen_by_name(group, path.c_str(), "NAME", H5P_DEFAULT, H5P_DEFAULT));
    return attribute.id() >= 0 && text_of(attribute.id()).compare(0, mark.size(), mark) == 0;
}

// ---- Groups

// What tells a group from all others: its file, and its place there.
using GroupId = std::tuple<dev_t, ino_t, haddr_t>;

GroupId id_of(const hid_t group) {
    H5O_info_t info = {};
    struct stat status = {};
    ::H5Oget_info2(group, &info, H5O_INFO_BASIC);
    if (const auto descriptor = descriptor_of(Handle(::H5Iget_file_id(group)))) {
        ::fstat(*descriptor, &status);
    }
    return {status.st_dev, status.st_ino, info.addr};
}

class Search {
  public:
    Search(const hid_t file, const std::string& path) : file_(file), path_(path) {}

    std::map<std::string, Member> all() && {
        search_from(file_, "/", "", no_group);
        while (!other_links_.empty()) {
            const OtherLink link = std::move(other_links_.front());
            other_links_.pop_front();
            follow(link);
        }
        return std::move(members_);
    }

  private:
    static constexpr std::size_t no_group = static_cast<std::size_t>(-1);

    // A group on the way from the root to others; it may be on several.
    struct Step {
        GroupId group;
        std::size_t parent; // in `steps_`
    };

    // A group in which the search is.
    struct Level {
        Handle group;
        std::string prefix; // of the names in it
        std::size_t step;
        std::vector<Link> links;
        std::size_t next = 0; // in `links`
    };

    // A symbolic or external link, or one of a kind of its own.
    struct OtherLink {
        std::string path;
        std::string name; // in its group
        std::size_t step; // of its group
    };

    // Follows hard links from a group on, and enters each group once. Groups may be deeper than
    // functions can call each other.
    void search_from(const hid_t group, const std::string& path, const std::string& prefix,
                     const std::size_t parent) {
        std::set<GroupId> entered;
        std::vector<Level> levels;
        enter(levels, entered, {group, path, prefix, parent});
        while (!levels.empty()) {
            const LibraryUse use(path_);
            Level& level = levels.back();
            if (level.next == level.links.size()) {
                levels.pop_back();
                continue;
            }
            const Link link = level.links[level.next++];
            const std::string name = level.prefix + link.name;
            if (!link.is_hard) {
                other_links_.push_back({name, link.name, level.step});
            } else if (add(level.group.id(), link.name, name, Member::Kind::broken)
                       == H5O_TYPE_GROUP) {
                enter(levels, entered, {level.group.id(), link.name, name + '/', level.step});
            }
        }
    }

    struct Door {
        hid_t from;
        std::string path; // from there
        std::string prefix;
        std::size_t parent;
    };

    // Does nothing if the group has been entered, or is on the way to itself.
    void enter(std::vector<Level>& levels, std::set<GroupId>& entered, const Door& door) {
        const LibraryUse use(path_);
        Handle group(::H5Gopen2(door.from, door.path.c_str(), H5P_DEFAULT));
        if (group.id() < 0) {
            return add_broken(door.prefix);
        }
        const GroupId id = id_of(group.id());
        if (is_on_the_way(door.parent, id) || !entered.insert(id).second) {
            return;
        }
        auto links = links_of(group.id());
        if (!links) {
            return add_broken(door.prefix);
        }
        steps_.push_back({id, door.parent});
        levels.push_back({std::move(group), door.prefix, steps_.size() - 1, *std::move(links)});
    }

    bool is_on_the_way(std::size_t step, const GroupId& group) const {
        while (step != no_group && steps_[step].group != group) {
            step = steps_[step].parent;
        }
        return step != no_group;
    }

    // Follows a link to a group only once, though it may be in groups with several names: a few
    // links could otherwise make more names than anybody can count.
    void follow(const OtherLink& link) {
        if (add(file_, link.path, link.path, Member::Kind::lost_link) == H5O_TYPE_GROUP
            && followed_.emplace(steps_[link.step].group, link.name).second) {
            search_from(file_, link.path, link.path + '/', link.step);
        }
    }

    // Adds what is there, unless it is a group; returns what it is, if it is anything.
    std::optional<H5O_type_t> add(const hid_t from, const std::string& path,
                                  const std::string& name, const Member::Kind otherwise) {
        const LibraryUse use(path_);
        const auto type = type_at(from, path);
        if (!type) {
            members_[name] = {otherwise, library_reason()};
        } else if (*type == H5O_TYPE_DATASET) {
            if (!is_mere_dimension(from, path)) {
                members_[name] = {};
            }
        } else if (*type != H5O_TYPE_GROUP) {
            members_[name] = {Member::Kind::element_type, ""};
        }
        return type;
    }

    // Adds a group, whose prefix ends with a slash, as a member that cannot be opened.
    void add_broken(const std::string& prefix) {
        const std::string reason = library_reason();
        if (prefix.empty()) {
            throw Trouble(path_, "is broken: " + reason + "; is the file complete?");
        }
        members_[prefix.substr(0, prefix.size() - 1)] = {Member::Kind::broken, reason};
    }

    const hid_t file_;
    const std::string& path_;
    std::vector<Step> steps_;
    std::deque<OtherLink> other_links_;
    std::set<std::pair<GroupId, std::string>> followed_;
    std::map<std::string, Member> members_;
};

} // namespace

std::map<std::string, Member> members_of(const hid_t file, const std::string& path) {
    return Search(file, path).all();
}

bool has_array(const hid_t group, const std::string& path, const std::string& name) {
    const LibraryUse use(name);
    return type_at(group, path) == H5O_TYPE_DATASET;
}

std::uint64_t bytes_of_array(const hid_t group, const std::string& path, const std::string& name) {
    const LibraryUse use(name);
    if (type_at(group, path) != H5O_TYPE_DATASET) {
        return 0;
    }
    const Handle dataset(::H5Dopen2(group, path.c_str(), H5P_DEFAULT));
    const Handle space(::H5Dget_space(dataset.id()));
    const Handle type(::H5Dget_type(dataset.id()));
    const hssize_t count = ::H5Sget_simple_extent_npoints(space.id());
    return static_cast<std::uint64_t>(std::max<hssize_t>(count, 0)) * ::H5Tget_size(type.id());
}

} // namespace talcmp::hdf5
