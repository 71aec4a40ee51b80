// The bytes of zip archives.

#ifndef TALNUMERICARRAY_TESTS_ZIP_BYTES_H
#define TALNUMERICARRAY_TESTS_ZIP_BYTES_H

#include "npy_bytes.h"

#include <string>
#include <vector>

namespace zip {

using npy::little_endian;

// From the version that is needed to the length of the name, as both headers of a member have it.
inline std::string facts_of_empty_member(const std::string& name) {
    return little_endian(20, 2) + std::string(20, '\0') + little_endian(name.size(), 2);
}

// An archive of stored files without contents.
inline std::string of_empty_members(const std::vector<std::string>& names) {
    std::string members;
    std::string directory;
    for (const std::string& name : names) {
        directory += "PK\x01\x02" + little_endian(20, 2) + facts_of_empty_member(name)
                     + std::string(12, '\0') + little_endian(members.size(), 4) + name;
        members += "PK\x03\x04" + facts_of_empty_member(name) + std::string(2, '\0') + name;
    }
    return members + directory + "PK\x05\x06" + std::string(4, '\0')
           + little_endian(names.size(), 2) + little_endian(names.size(), 2)
           + little_endian(directory.size(), 4) + little_endian(members.size(), 4)
           + std::string(2, '\0');
}

} // namespace zip

#endif
