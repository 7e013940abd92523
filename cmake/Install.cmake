# Installation: the libraries with their public headers, the CMake package and the pkg-config
# module, the programs and the demo data; and the Debian package made from them by CPack.
include(CMakePackageConfigHelpers)

set(PTC_LIBRARIES TesselData TesselSys ProcCommandAndFactoryBase TesselComponents FileSystemUtilities IhmUtils
    Navigation GuiToolConfiguration ProcStartUpdateAgent Win32Platform ProcToolConfiguration)
set(PTC_PROGRAMS ToolConfigurationHost ToolConfigurationCli)
foreach(target IN LISTS PTC_LIBRARIES PTC_PROGRAMS)
  if(NOT TARGET ${target})
    message(FATAL_ERROR "Install: target ${target} is not defined")
  endif()
endforeach()

# Installed, the libraries and the plug-in share one folder and the programs find it relative to
# their own, so an unpacked tree runs wherever it lies.
foreach(library IN LISTS PTC_LIBRARIES)
  set_target_properties(${library} PROPERTIES VERSION ${PROJECT_VERSION} SOVERSION ${PROJECT_VERSION_MAJOR}
      INSTALL_RPATH "$ORIGIN")
endforeach()
file(RELATIVE_PATH PTC_BIN_TO_LIB /${CMAKE_INSTALL_BINDIR} /${CMAKE_INSTALL_LIBDIR})
set_target_properties(${PTC_PROGRAMS} PROPERTIES INSTALL_RPATH "$ORIGIN/${PTC_BIN_TO_LIB}")

set(PTC_INCLUDE_SUBDIR ${CMAKE_INSTALL_INCLUDEDIR}/ProcToolConfiguration)
set(PTC_CMAKE_DIR ${CMAKE_INSTALL_LIBDIR}/cmake/ProcToolConfiguration)
set(PTC_DATA_DIR ${CMAKE_INSTALL_DATADIR}/ProcToolConfiguration)

# The plug-in lies beside the framework libraries, where the component manager looks first.
install(TARGETS ${PTC_LIBRARIES} EXPORT ProcToolConfigurationTargets
    LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR})
install(TARGETS ${PTC_PROGRAMS} RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR})

# Public headers, one flat folder as the include directories of the build tree give them.
file(GLOB PTC_PUBLIC_HEADERS CONFIGURE_DEPENDS
    ${PROJECT_SOURCE_DIR}/include/*.h
    ${PROJECT_SOURCE_DIR}/Lib/Platform/*.h
    ${PROJECT_SOURCE_DIR}/Lib/Application/ProcToolConfiguration/*/*.h)
install(FILES ${PTC_PUBLIC_HEADERS} DESTINATION ${PTC_INCLUDE_SUBDIR})

install(DIRECTORY ${PROJECT_SOURCE_DIR}/Apps/ToolConfigurationHost/demo/ DESTINATION ${PTC_DATA_DIR}/demo
    USE_SOURCE_PERMISSIONS)
install(FILES ${PROJECT_SOURCE_DIR}/docs/INTEGRATION.md DESTINATION ${CMAKE_INSTALL_DOCDIR})

# CMake package: ProcToolConfiguration::<library>.
install(EXPORT ProcToolConfigurationTargets NAMESPACE ProcToolConfiguration:: DESTINATION ${PTC_CMAKE_DIR})
configure_package_config_file(${CMAKE_CURRENT_LIST_DIR}/ProcToolConfigurationConfig.cmake.in
    ${PROJECT_BINARY_DIR}/ProcToolConfigurationConfig.cmake INSTALL_DESTINATION ${PTC_CMAKE_DIR})
write_basic_package_version_file(${PROJECT_BINARY_DIR}/ProcToolConfigurationConfigVersion.cmake
    COMPATIBILITY SameMajorVersion)
install(FILES ${PROJECT_BINARY_DIR}/ProcToolConfigurationConfig.cmake
    ${PROJECT_BINARY_DIR}/ProcToolConfigurationConfigVersion.cmake DESTINATION ${PTC_CMAKE_DIR})

# pkg-config module; its prefix is found from its own folder, so the installed tree can move.
set(PTC_PC_DIR ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
file(RELATIVE_PATH PTC_PC_TO_PREFIX /${PTC_PC_DIR} /)
string(REGEX REPLACE "/$" "" PTC_PC_TO_PREFIX "${PTC_PC_TO_PREFIX}")
list(REVERSE PTC_LIBRARIES)
list(TRANSFORM PTC_LIBRARIES PREPEND "-l" OUTPUT_VARIABLE PTC_PC_LIBS)
list(REVERSE PTC_LIBRARIES)
list(JOIN PTC_PC_LIBS " " PTC_PC_LIBS)
configure_file(${CMAKE_CURRENT_LIST_DIR}/ProcToolConfiguration.pc.in ${PROJECT_BINARY_DIR}/ProcToolConfiguration.pc @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/ProcToolConfiguration.pc DESTINATION ${PTC_PC_DIR})

# Debian package (scripts/package), for Debian 12.
set(CPACK_PACKAGE_NAME proctoolconfiguration)
set(CPACK_PACKAGE_VENDOR "ProcToolConfiguration developers")
set(CPACK_PACKAGE_CONTACT "ProcToolConfiguration developers <ptc@localhost>")
set(CPACK_PACKAGE_DESCRIPTION_SUMMARY "Tool-configuration dialogs plug-in, its framework libraries and host")
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_PACKAGE_SECTION devel)
set(CPACK_DEBIAN_PACKAGE_DEPENDS
    "libc6, libstdc++6, libace-7.0.8, libqt6core6, libqt6gui6, libqt6widgets6, libpugixml1v5, libinih1, libzip4")
include(CPack)
