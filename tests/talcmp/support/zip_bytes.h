// The bytes of zip archives, well-formed or not.

#pragma once

#include "npy_bytes.h"

#include <cstdint>
#include <string>
#include <vector>

namespace zipped {

using npy::little_endian;

struct Member {
    std::string name;
    std::string contents = {};
    std::uint32_t checksum = 0; // that of no contents
    std::uint16_t method = 0;   // stored
};

// From the version that is needed to the length of the name, as both headers of a member have it.
inline std::string facts(const Member& member) {
    return little_endian(20, 2) + std::string(2, '\0') + little_endian(member.method, 2)
           + std::string(4, '\0') + little_endian(member.checksum, 4)
           + little_endian(member.contents.size(), 4) + little_endian(member.contents.size(), 4)
           + little_endian(member.name.size(), 2);
}

inline std::string archive(const std::vector<Member>& members) {
    std::string files;
    std::string directory;
    for (const Member& member : members) {
        directory += "PK\x01\x02" + little_endian(20, 2) + facts(member) + std::string(12, '\0')
                     + little_endian(files.size(), 4) + member.name;
        files +=
            "PK\x03\x04" + facts(member) + std::string(2, '\0') + member.name + member.contents;
    }
    return files + directory + "PK\x05\x06" + std::string(4, '\0')
           + little_endian(members.size(), 2) + little_endian(members.size(), 2)
           + little_endian(directory.size(), 4) + little_endian(files.size(), 4)
           + std::string(2, '\0');
}

} // namespace zipped
