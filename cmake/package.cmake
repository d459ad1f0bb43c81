# Installs the files other than the library and its headers, and defines the packages.

# The files for CMake and pkg-config. They refer to the tree relative to themselves, so it may be moved as a whole.
include(CMakePackageConfigHelpers)
set(package_dir ${CMAKE_INSTALL_LIBDIR}/cmake/varnekutils_ltn)
configure_package_config_file(cmake/varnekutils_ltn-config.cmake.in varnekutils_ltn-config.cmake
    INSTALL_DESTINATION ${package_dir} PATH_VARS VARNEK_SHARE VARNEK_STANDINS)
write_basic_package_version_file(varnekutils_ltn-config-version.cmake COMPATIBILITY SameMajorVersion)
install(EXPORT varnekutils_ltn NAMESPACE varnek:: FILE varnekutils_ltn-targets.cmake
        DESTINATION ${package_dir} COMPONENT dev)
install(FILES ${CMAKE_CURRENT_BINARY_DIR}/varnekutils_ltn-config.cmake
        ${CMAKE_CURRENT_BINARY_DIR}/varnekutils_ltn-config-version.cmake
        DESTINATION ${package_dir} COMPONENT dev)

foreach(kind IN ITEMS includedir datadir)
    string(TOUPPER CMAKE_INSTALL_${kind} variable)
    file(RELATIVE_PATH pc_${kind} /${CMAKE_INSTALL_LIBDIR}/pkgconfig /${${variable}})
endforeach()
configure_file(cmake/varnekutils_ltn.pc.in varnekutils_ltn.pc @ONLY)
install(FILES ${CMAKE_CURRENT_BINARY_DIR}/varnekutils_ltn.pc
        DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig COMPONENT dev)

install(FILES defaults/debug_ltn.ini defaults/Varnek_Config.cfg CommonUtility/gdb.py DESTINATION ${VARNEK_SHARE} COMPONENT dev)
install(FILES LICENSE DESTINATION ${CMAKE_INSTALL_DOCDIR} COMPONENT license)
# The directories are those of the source tree, so that the links between the documents work.
install(FILES README.md CHANGELOG.md SECURITY.md DESTINATION ${CMAKE_INSTALL_DOCDIR} COMPONENT dev)
install(DIRECTORY docs examples DESTINATION ${CMAKE_INSTALL_DOCDIR} COMPONENT dev
        FILES_MATCHING PATTERN *.md PATTERN *.svg PATTERN *.cpp PATTERN *.h PATTERN *.inc)
install(FILES CONTRIBUTING.md DESTINATION ${CMAKE_INSTALL_DOCDIR} COMPONENT dev)
install(DIRECTORY CommonUtility/include DESTINATION ${CMAKE_INSTALL_DOCDIR}/CommonUtility COMPONENT dev)
install(DIRECTORY defaults DESTINATION ${CMAKE_INSTALL_DOCDIR} COMPONENT dev)
install(FILES platform/README.md platform/varnek_platform.h DESTINATION ${CMAKE_INSTALL_DOCDIR}/platform COMPONENT dev)
install(FILES platform/host/features.txt DESTINATION ${CMAKE_INSTALL_DOCDIR}/platform/host COMPONENT dev)

if(TARGET receiver)
    install(TARGETS receiver DESTINATION ${CMAKE_INSTALL_BINDIR} COMPONENT receiver)
    install(FILES ${CMAKE_BINARY_DIR}/examples/receiver/receiver.1 DESTINATION ${CMAKE_INSTALL_MANDIR}/man1
            COMPONENT receiver)
endif()

# Debian packages; script/package builds them with the preset package.
if(VARNEK_DEBIAN)
    include(cmake/debian/packages.cmake)
endif()
