# What `cmake --install` lays down: the library, in the component Development, talcmp, in the
# component Runtime, and, if they are built, talcmp-mpi, in the component Mpi, and the Python package,
# in the component Python. None of it contains the prefix, which may be moved afterwards, unless
# CMAKE_INSTALL_LIBDIR is absolute.

option(TALNUMERICARRAY_DEBIAN_PACKAGES "Lay files down as Debian does, and let CPack package them"
       OFF)
set(zsh_folder site-functions)
if(TALNUMERICARRAY_DEBIAN_PACKAGES)
  set(zsh_folder vendor-completions)
  include(${CMAKE_CURRENT_LIST_DIR}/debian_packages.cmake)
endif()
include(CMakePackageConfigHelpers)
include(GNUInstallDirs)

# The headers include each other by bare name and have names like compare.h, so they get a folder of
# their own.
set(header_folder ${CMAKE_INSTALL_INCLUDEDIR}/talnumericarray)
set(config_folder ${CMAKE_INSTALL_LIBDIR}/cmake/TalNumericArray)
set(generated ${PROJECT_BINARY_DIR}/install)

# talnumericarray_install(COMPONENT FOLDER FILE...)
function(talnumericarray_install component folder)
  install(
    FILES ${ARGN}
    DESTINATION ${folder}
    COMPONENT ${component})
endfunction()

# talnumericarray_install_manual(COMPONENT FILE)
function(talnumericarray_install_manual component manual)
  if(TALNUMERICARRAY_DEBIAN_PACKAGES)
    # Debian compresses its manual pages.
    get_filename_component(name ${manual} NAME)
    file(MAKE_DIRECTORY ${generated})
    execute_process(COMMAND gzip -9nc ${manual} OUTPUT_FILE ${generated}/${name}.gz
                            COMMAND_ERROR_IS_FATAL ANY)
    set(manual ${generated}/${name}.gz)
  endif()
  talnumericarray_install(${component} ${CMAKE_INSTALL_MANDIR}/man1 ${manual})
endfunction()

# ---- Headers and archive

list(TRANSFORM include_folders APPEND /*.h OUTPUT_VARIABLE header_patterns)
file(GLOB headers CONFIGURE_DEPENDS ${header_patterns})
talnumericarray_install(Development ${header_folder} ${headers})
target_include_directories(talnumericarray_compare INTERFACE $<INSTALL_INTERFACE:${header_folder}>)
install(
  TARGETS talnumericarray_compare
  EXPORT TalNumericArray
  ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR} COMPONENT Development)

# ---- find_package

configure_package_config_file(
  ${CMAKE_CURRENT_LIST_DIR}/TalNumericArrayConfig.cmake.in
  ${generated}/TalNumericArrayConfig.cmake
  INSTALL_DESTINATION ${config_folder}
  NO_SET_AND_CHECK_MACRO)
# Before version 1 a new minor version may break what was built with the last.
write_basic_package_version_file(${generated}/TalNumericArrayConfigVersion.cmake
                                 COMPATIBILITY SameMinorVersion)
talnumericarray_install(Development ${config_folder} ${generated}/TalNumericArrayConfig.cmake
                        ${generated}/TalNumericArrayConfigVersion.cmake)
install(
  EXPORT TalNumericArray
  NAMESPACE TalNumericArray::
  FILE TalNumericArrayTargets.cmake
  DESTINATION ${config_folder}
  COMPONENT Development)

# ---- pkg-config

# pkg-config replaces ${pcfiledir} by the folder of the file that it reads.
file(RELATIVE_PATH headers_from_pkgconfig ${CMAKE_INSTALL_FULL_LIBDIR}/pkgconfig
     ${CMAKE_INSTALL_FULL_INCLUDEDIR}/talnumericarray)
set(options $<TARGET_PROPERTY:talnumericarray_compare,INTERFACE_COMPILE_OPTIONS>)
configure_file(${CMAKE_CURRENT_LIST_DIR}/talnumericarray.pc.in ${generated}/talnumericarray.pc.in
               @ONLY)
file(GENERATE OUTPUT ${generated}/talnumericarray.pc INPUT ${generated}/talnumericarray.pc.in)
talnumericarray_install(Development ${CMAKE_INSTALL_LIBDIR}/pkgconfig
                        ${generated}/talnumericarray.pc)

# ---- The commands

if(TARGET talcmp)
  set(talcmp_folder ${PROJECT_SOURCE_DIR}/tools/talcmp)
  install(TARGETS talcmp RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR} COMPONENT Runtime)
  talnumericarray_install_manual(Runtime ${talcmp_folder}/talcmp.1)
  talnumericarray_install(Runtime ${CMAKE_INSTALL_DATADIR}/doc/talcmp
                          ${talcmp_folder}/talcmp.schema.json ${PROJECT_SOURCE_DIR}/docs/talcmp.md)
  install(
    DIRECTORY ${PROJECT_SOURCE_DIR}/examples/recipes
    DESTINATION ${CMAKE_INSTALL_DATADIR}/doc/talcmp
    COMPONENT Runtime
    USE_SOURCE_PERMISSIONS)
  talnumericarray_install(Runtime ${CMAKE_INSTALL_DATADIR}/bash-completion/completions
                          ${talcmp_folder}/completions/talcmp.bash RENAME talcmp)
  talnumericarray_install(Runtime ${CMAKE_INSTALL_DATADIR}/zsh/${zsh_folder}
                          ${talcmp_folder}/completions/_talcmp)
  talnumericarray_install(Runtime ${CMAKE_INSTALL_DATADIR}/fish/vendor_completions.d
                          ${talcmp_folder}/completions/talcmp.fish)
endif()

if(TARGET talcmp_mpi)
  install(TARGETS talcmp_mpi RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR} COMPONENT Mpi)
  talnumericarray_install_manual(Mpi ${PROJECT_SOURCE_DIR}/tools/talcmp_mpi/talcmp-mpi.1)
  talnumericarray_install(Mpi ${CMAKE_INSTALL_DATADIR}/doc/talcmp-mpi
                          ${PROJECT_SOURCE_DIR}/docs/mpi.md ${PROJECT_SOURCE_DIR}/docs/mpi.svg)
endif()

# ---- The Python package

if(TARGET talnumericarray_python)
  # Where its interpreter looks, below the prefix. Debian's finds what it has itself in a folder for
  # all versions, and what is installed locally in one for its own.
  foreach(variable SITEARCH VERSION_MAJOR VERSION_MINOR)
    get_directory_property(python_${variable} DIRECTORY python DEFINITION Python3_${variable})
  endforeach()
  if(TALNUMERICARRAY_DEBIAN_PACKAGES)
    set(python_folder lib/python3/dist-packages)
  elseif(python_SITEARCH MATCHES "lib[^/]*/python[0-9.]+/site-packages$")
    set(python_folder ${CMAKE_MATCH_0})
  else()
    set(python_folder lib/python${python_VERSION_MAJOR}.${python_VERSION_MINOR}/dist-packages)
  endif()
  set(TALNUMERICARRAY_PYTHON_FOLDER ${python_folder}
      CACHE STRING "Where the Python package is installed, below the prefix unless it is absolute")
  set(package_folder ${TALNUMERICARRAY_PYTHON_FOLDER}/talnumericarray)
  install(TARGETS talnumericarray_python LIBRARY DESTINATION ${package_folder} COMPONENT Python)
  get_directory_property(modules DIRECTORY python DEFINITION modules)
  list(TRANSFORM modules PREPEND ${PROJECT_SOURCE_DIR}/python/)
  talnumericarray_install(Python ${package_folder} ${modules})
  set(metadata talnumericarray-${PROJECT_VERSION}.dist-info)
  talnumericarray_install(Python ${TALNUMERICARRAY_PYTHON_FOLDER}/${metadata}
                          ${PROJECT_BINARY_DIR}/python/${metadata}/METADATA
                          ${PROJECT_SOURCE_DIR}/python/entry_points.txt)
  talnumericarray_install(Python ${CMAKE_INSTALL_DATADIR}/doc/python3-talnumericarray
                          ${PROJECT_SOURCE_DIR}/docs/python.md)
endif()
