// What is said of HDF5 files where talcmp is built without the HDF5 library.

#include "array_file.h"

#include "support/temporary_folder.h"
#include "support/thrown_message.h"

#include <gtest/gtest.h>

#include <string>

namespace {

TEST(Hdf5Absent, IsTroubleOfFilesThatNeedIt) {
    const TemporaryFolder folder;
    const std::string signature = "\x89HDF\r\n\x1a\n";
    for (const std::size_t offset : {0U, 512U, 1024U, 4096U}) {
        const std::string path = folder.write("a.h5", std::string(offset, 'x') + signature);
        EXPECT_EQ(thrown_message([&] { talcmp::open_array_file(path); }),
                  path
                      + ": is an HDF5 file, and this talcmp was built without the HDF5 library; "
                        "install one that was built with it");
    }
}

TEST(Hdf5Absent, LeavesHdf5FilesUntested) {
    GTEST_SKIP() << "NOT TESTED: this build has no HDF5 library";
}

} // namespace
