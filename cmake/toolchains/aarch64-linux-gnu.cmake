# 64-bit ARM Linux.

set(TALNUMERICARRAY_TRIPLE aarch64-linux-gnu)
set(TALNUMERICARRAY_QEMU qemu-aarch64)
set(CMAKE_SYSTEM_PROCESSOR aarch64)
include(${CMAKE_CURRENT_LIST_DIR}/debian-cross.cmake)
