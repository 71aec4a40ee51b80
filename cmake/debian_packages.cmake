# Debian packages by CPack: libtalnumericarray-dev, talcmp and, if they are built, talcmp-mpi and
# python3-talnumericarray, for whatever architecture is built.

find_program(TALNUMERICARRAY_DPKG_ARCHITECTURE dpkg-architecture)
if(NOT TALNUMERICARRAY_DPKG_ARCHITECTURE)
  message(FATAL_ERROR "dpkg-architecture is not installed; Debian has it in the package dpkg-dev")
endif()

# What Debian calls the architecture: amd64 or x86_64-linux-gnu, armhf or arm-linux-gnueabihf.
function(talnumericarray_debian_name variable key)
  execute_process(
    COMMAND ${TALNUMERICARRAY_DPKG_ARCHITECTURE} ${ARGN} -q${key}
    OUTPUT_VARIABLE name
    OUTPUT_STRIP_TRAILING_WHITESPACE ERROR_QUIET COMMAND_ERROR_IS_FATAL ANY)
  set(${variable} ${name} PARENT_SCOPE)
endfunction()

if(CMAKE_CROSSCOMPILING)
  set(target -t${CMAKE_CXX_COMPILER_TARGET})
endif()
talnumericarray_debian_name(CPACK_DEBIAN_PACKAGE_ARCHITECTURE DEB_HOST_ARCH ${target})
talnumericarray_debian_name(multiarch DEB_HOST_MULTIARCH ${target})
set(CMAKE_INSTALL_LIBDIR lib/${multiarch})

# ---- The packages

set(CPACK_GENERATOR DEB)
set(CPACK_COMPONENTS_ALL Development Runtime)
set(CPACK_DEB_COMPONENT_INSTALL ON)
set(CPACK_PACKAGING_INSTALL_PREFIX /usr)
set(CPACK_STRIP_FILES ON)
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_PACKAGE_MAINTAINER "TalNumericArray developers <talnumericarray@localhost>")
# Each package has a description of its own. CPack indents its lines.
set(CPACK_PACKAGE_DESCRIPTION_SUMMARY "")

set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_NAME libtalnumericarray-dev)
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_SECTION libdevel)
set(CPACK_COMPONENT_DEVELOPMENT_DESCRIPTION
    "${PROJECT_DESCRIPTION}
The headers, the static library and what CMake and pkg-config need to find them.")

set(CPACK_DEBIAN_RUNTIME_PACKAGE_NAME talcmp)
set(CPACK_DEBIAN_RUNTIME_PACKAGE_SECTION math)
if(CMAKE_CROSSCOMPILING)
  # dpkg-shlibdeps would name the packages of the cross compiler, which the architecture itself
  # lacks. These are Debian 12's, which the cross compiler links to.
  set(CPACK_DEBIAN_RUNTIME_PACKAGE_DEPENDS
      "libc6 (>= 2.36), libdeflate0 (>= 1.14), libgcc-s1 (>= 12), libhdf5-103-1 (>= 1.10.8),\
 libpng16-16 (>= 1.6), libstdc++6 (>= 12), libzip4 (>= 1.7), zlib1g (>= 1:1.2)")
else()
  set(CPACK_DEBIAN_RUNTIME_PACKAGE_SHLIBDEPS ON)
endif()
set(CPACK_COMPONENT_RUNTIME_DESCRIPTION
    "Compare the arrays in .npy and .npz files
talcmp says whether two arrays of numbers are the same, where they differ and by how much, under a
tolerance in binary digits.")

if(TARGET talcmp_mpi)
  list(APPEND CPACK_COMPONENTS_ALL Mpi)
  set(CPACK_DEBIAN_MPI_PACKAGE_NAME talcmp-mpi)
  set(CPACK_DEBIAN_MPI_PACKAGE_SECTION math)
  # This has mpirun, which no library of Open MPI asks for, and what starts the program alone.
  set(CPACK_DEBIAN_MPI_PACKAGE_DEPENDS openmpi-bin)
  set(CPACK_DEBIAN_MPI_PACKAGE_SHLIBDEPS ON)
  # Its manual page explains the options of both.
  set(CPACK_DEBIAN_MPI_PACKAGE_RECOMMENDS talcmp)
  set(CPACK_COMPONENT_MPI_DESCRIPTION
      "Compare arrays in files by several processes, with MPI
talcmp-mpi says what talcmp says about arrays in files, and has the same options. It divides the work
between the processes that mpirun or srun starts, on one computer or on several that see the same
files.")
endif()

if(TARGET talnumericarray_python)
  list(APPEND CPACK_COMPONENTS_ALL Python)
  get_directory_property(minor DIRECTORY python DEFINITION Python3_VERSION_MINOR)
  math(EXPR next_minor "${minor} + 1")
  set(CPACK_DEBIAN_PYTHON_PACKAGE_NAME python3-talnumericarray)
  set(CPACK_DEBIAN_PYTHON_PACKAGE_SECTION python)
  # The compiled part is for one version of Python.
  set(CPACK_DEBIAN_PYTHON_PACKAGE_DEPENDS
      "python3 (>= 3.${minor}), python3 (<< 3.${next_minor}), python3-numpy")
  set(CPACK_DEBIAN_PYTHON_PACKAGE_SHLIBDEPS ON)
  set(CPACK_DEBIAN_PYTHON_PACKAGE_SUGGESTS "python3-dask, python3-pytest, python3-xarray")
  # They compile the modules, and remove what Python has made of them, as Debian's packages do.
  set(CPACK_DEBIAN_PYTHON_PACKAGE_CONTROL_EXTRA ${CMAKE_CURRENT_LIST_DIR}/debian_python/postinst
                                                ${CMAKE_CURRENT_LIST_DIR}/debian_python/prerm)
  set(CPACK_COMPONENT_PYTHON_DESCRIPTION
      "Compare NumPy arrays exactly
The Python package talnumericarray says whether two arrays of numbers are the same, where they differ
and by how much, under a tolerance in binary digits. It compares NumPy's, Dask's and xarray's arrays,
and has an assertion for pytest.")
endif()

include(CPack)
