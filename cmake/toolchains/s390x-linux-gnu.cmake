# IBM Z under Linux: 64-bit, big-endian.

set(TALNUMERICARRAY_TRIPLE s390x-linux-gnu)
set(TALNUMERICARRAY_QEMU qemu-s390x)
set(CMAKE_SYSTEM_PROCESSOR s390x)
include(${CMAKE_CURRENT_LIST_DIR}/debian-cross.cmake)
