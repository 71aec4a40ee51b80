# What the other toolchain files share: Debian's cross compilers, with QEMU to run what
# they make. A platform's file sets
#
#   TALNUMERICARRAY_TRIPLE   Debian's name for the platform's tools: arm-linux-gnueabihf
#   TALNUMERICARRAY_QEMU     its emulator: qemu-arm
#   CMAKE_SYSTEM_PROCESSOR   as uname -m prints it there
#   CMAKE_LIBRARY_ARCHITECTURE   Debian's name for the folder of its libraries; usually the triple
#
# and includes this one. GCC is used unless CMAKE_CXX_COMPILER is Clang, which has all its targets in
# one program.

set(CMAKE_SYSTEM_NAME Linux)

# Says what is missing here and now, rather than by a test that cannot start.
function(talnumericarray_require variable program package)
  find_program(${variable} ${program})
  if(NOT ${variable})
    message(FATAL_ERROR "${program} is not installed; Debian has it in the package ${package}")
  endif()
endfunction()

talnumericarray_require(TALNUMERICARRAY_CROSS_GCC ${TALNUMERICARRAY_TRIPLE}-gcc
                        g++-${TALNUMERICARRAY_TRIPLE})
talnumericarray_require(TALNUMERICARRAY_CROSS_GXX ${TALNUMERICARRAY_TRIPLE}-g++
                        g++-${TALNUMERICARRAY_TRIPLE})
talnumericarray_require(TALNUMERICARRAY_EMULATOR ${TALNUMERICARRAY_QEMU} qemu-user)

if(NOT CMAKE_CXX_COMPILER)
  set(CMAKE_CXX_COMPILER ${TALNUMERICARRAY_CROSS_GXX})
endif()
# GoogleTest lists C among its languages.
set(CMAKE_C_COMPILER ${TALNUMERICARRAY_CROSS_GCC})
set(CMAKE_CXX_COMPILER_TARGET ${TALNUMERICARRAY_TRIPLE})
# Clang would be used with the host's.
foreach(tool AR RANLIB NM READELF OBJDUMP STRIP)
  string(TOLOWER ${tool} program)
  find_program(CMAKE_${tool} ${TALNUMERICARRAY_TRIPLE}-${program})
endforeach()

# Only the architecture's own libraries are taken; headers and packages without machine code, like
# those of nlohmann-json, are the host's. scripts/foreign-libraries fetches what Debian has no cross
# package for.
get_filename_component(foreign ${CMAKE_CURRENT_LIST_DIR}/../../build/foreign ABSOLUTE)
set(foreign ${foreign}/${TALNUMERICARRAY_TRIPLE})
set(CMAKE_FIND_ROOT_PATH /usr/${TALNUMERICARRAY_TRIPLE} ${foreign})
set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)
set(CMAKE_FIND_ROOT_PATH_MODE_LIBRARY ONLY)
if(NOT CMAKE_LIBRARY_ARCHITECTURE)
  set(CMAKE_LIBRARY_ARCHITECTURE ${TALNUMERICARRAY_TRIPLE})
endif()
set(foreign_folders ${foreign}/usr/lib/${CMAKE_LIBRARY_ARCHITECTURE}
                    ${foreign}/lib/${CMAKE_LIBRARY_ARCHITECTURE})
list(JOIN foreign_folders : foreign_path)
# Where the linker finds what those libraries need.
set(CMAKE_EXE_LINKER_FLAGS_INIT -Wl,-rpath-link,${foreign_path})

# The library path keeps the emulated loader away from the host's own libraries for the same
# architecture, which 64-bit x86 may have for 32-bit programs: they come from another build of libc
# than the loader.
set(CMAKE_CROSSCOMPILING_EMULATOR
    ${TALNUMERICARRAY_EMULATOR} -E
    LD_LIBRARY_PATH=/usr/${TALNUMERICARRAY_TRIPLE}/lib:${foreign_path} -L
    /usr/${TALNUMERICARRAY_TRIPLE})
