# What `cmake --install` puts under the prefix: the shared library with its headers, the ovmacro tool and its
# manual page, a CMake package (find_package(ovMacroExpander) gives ovMacroExpander::ovMacroExpander, the
# executable ovMacroExpander::ovmacro and ovmacro_generate()) and a pkg-config file.
# Everything is relocatable: `cmake --install build --prefix DIR` works for any DIR chosen at install time.
include(GNUInstallDirs)
include(CMakePackageConfigHelpers)

set(OVMACRO_CMAKE_DIR ${CMAKE_INSTALL_LIBDIR}/cmake/ovMacroExpander)

install(TARGETS ovMacroExpander
  EXPORT ovMacroExpanderTargets
  LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR} NAMELINK_COMPONENT Development
  RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR})
# The Python bridge goes beside the library, where the library looks for it on the first use of Python.
install(TARGETS ovMacroExpanderPython LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR})

# Every header of the library is public (the whole namespace is exported), in its subsystem folder, beside
# the umbrella header ovmacro/ovMacroExpander.h.
install(DIRECTORY ${PROJECT_SOURCE_DIR}/src/ovmacro/
  DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/ovmacro
  COMPONENT Development
  FILES_MATCHING PATTERN "*.h")

if(TARGET ovmacro)
  # The tool finds the library beside it in the prefix, wherever the prefix is moved.
  file(RELATIVE_PATH ovmacro_bin_to_lib
    ${CMAKE_INSTALL_FULL_BINDIR} ${CMAKE_INSTALL_FULL_LIBDIR})
  set_target_properties(ovmacro PROPERTIES INSTALL_RPATH "$ORIGIN/${ovmacro_bin_to_lib}")
  install(TARGETS ovmacro EXPORT ovMacroExpanderTargets RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR})
  install(FILES ${OVMACRO_MANUAL_PAGE} DESTINATION ${CMAKE_INSTALL_MANDIR}/man1)
endif()

# The exported target carries the library, its include directory and the C++20 requirement, and nothing of
# Python: only the bridge module, which the library loads itself, links the Python runtime, and no installed
# header includes Python.h, so a consumer needs only the .so and the headers.
install(EXPORT ovMacroExpanderTargets
  NAMESPACE ovMacroExpander::
  DESTINATION ${OVMACRO_CMAKE_DIR}
  COMPONENT Development)

configure_package_config_file(
  ${PROJECT_SOURCE_DIR}/cmake/ovMacroExpanderConfig.cmake.in
  ${PROJECT_BINARY_DIR}/ovMacroExpanderConfig.cmake
  INSTALL_DESTINATION ${OVMACRO_CMAKE_DIR})
# Until the first 1.0 release every minor version may change the interface.
if(PROJECT_VERSION_MAJOR EQUAL 0)
  set(ovmacro_compatibility SameMinorVersion)
else()
  set(ovmacro_compatibility SameMajorVersion)
endif()
write_basic_package_version_file(
  ${PROJECT_BINARY_DIR}/ovMacroExpanderConfigVersion.cmake
  VERSION ${PROJECT_VERSION}
  COMPATIBILITY ${ovmacro_compatibility})
install(FILES
  ${PROJECT_BINARY_DIR}/ovMacroExpanderConfig.cmake
  ${PROJECT_BINARY_DIR}/ovMacroExpanderConfigVersion.cmake
  ${PROJECT_SOURCE_DIR}/cmake/ovMacroExpanderGenerate.cmake
  DESTINATION ${OVMACRO_CMAKE_DIR}
  COMPONENT Development)

# pkg-config: paths are relative to the .pc file's own folder, so that the file stays right when the prefix
# is given only at install time or the tree is moved.
set(OVMACRO_PC_DIR ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
file(RELATIVE_PATH ovmacro_pc_to_prefix
  ${CMAKE_INSTALL_PREFIX}/${OVMACRO_PC_DIR} ${CMAKE_INSTALL_PREFIX})
string(REGEX REPLACE "/$" "" ovmacro_pc_to_prefix "${ovmacro_pc_to_prefix}")
set(OVMACRO_PC_PREFIX "\${pcfiledir}/${ovmacro_pc_to_prefix}")
foreach(kind LIBDIR INCLUDEDIR)
  if(IS_ABSOLUTE "${CMAKE_INSTALL_${kind}}")
    set(OVMACRO_PC_${kind} "${CMAKE_INSTALL_${kind}}")
  else()
    set(OVMACRO_PC_${kind} "\${prefix}/${CMAKE_INSTALL_${kind}}")
  endif()
endforeach()
configure_file(${PROJECT_SOURCE_DIR}/cmake/ovMacroExpander.pc.in ${PROJECT_BINARY_DIR}/ovMacroExpander.pc @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/ovMacroExpander.pc DESTINATION ${OVMACRO_PC_DIR} COMPONENT Development)
