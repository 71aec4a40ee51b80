# What `cmake --install` lays down: the library, in the component Development, and talcmp, in the
# component Runtime. Nothing of it knows the prefix, which may be moved
# afterwards, unless CMAKE_INSTALL_LIBDIR is absolute.

option(TALNUMERICARRAY_DEBIAN_PACKAGES "Lay files down as Debian does, and let CPack package them"
       OFF)
if(TALNUMERICARRAY_DEBIAN_PACKAGES)
  include(${CMAKE_CURRENT_LIST_DIR}/debian_packages.cmake)
endif()
include(CMakePackageConfigHelpers)
include(GNUInstallDirs)

# The headers include each other by bare name and have names like compare.h: a folder of their own.
set(header_folder ${CMAKE_INSTALL_INCLUDEDIR}/talnumericarray)
set(config_folder ${CMAKE_INSTALL_LIBDIR}/cmake/TalNumericArray)
set(generated ${PROJECT_BINARY_DIR}/install)

# ---- Headers and archive

list(TRANSFORM include_folders APPEND /*.h OUTPUT_VARIABLE header_patterns)
file(GLOB headers CONFIGURE_DEPENDS ${header_patterns})
install(
  FILES ${headers}
  DESTINATION ${header_folder}
  COMPONENT Development)

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
# Before version 1 a new minor version may break what is built on the last.
write_basic_package_version_file(${generated}/TalNumericArrayConfigVersion.cmake
                                 COMPATIBILITY SameMinorVersion)
install(
  FILES ${generated}/TalNumericArrayConfig.cmake ${generated}/TalNumericArrayConfigVersion.cmake
  DESTINATION ${config_folder}
  COMPONENT Development)
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
install(
  FILES ${generated}/talnumericarray.pc
  DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig
  COMPONENT Development)

# ---- The command

if(TARGET talcmp)
  install(TARGETS talcmp RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR} COMPONENT Runtime)
endif()
