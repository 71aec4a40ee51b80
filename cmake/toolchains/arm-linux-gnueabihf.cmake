# 32-bit ARM Linux with hardware floating point. Without further flags: ARMv7, VFPv3 with 16 registers.

set(TALNUMERICARRAY_TRIPLE arm-linux-gnueabihf)
set(TALNUMERICARRAY_QEMU qemu-arm)
set(CMAKE_SYSTEM_PROCESSOR armv7l)
include(${CMAKE_CURRENT_LIST_DIR}/debian-cross.cmake)
