# 32-bit x86 Linux, with SSE arithmetic.

set(TALNUMERICARRAY_TRIPLE i686-linux-gnu)
set(CMAKE_LIBRARY_ARCHITECTURE i386-linux-gnu)
set(TALNUMERICARRAY_QEMU qemu-i386)
set(CMAKE_SYSTEM_PROCESSOR i686)
# Arithmetic without the excess precision of the x87 unit.
set(CMAKE_CXX_FLAGS_INIT "-msse2 -mfpmath=sse")
include(${CMAKE_CURRENT_LIST_DIR}/debian-cross.cmake)
