# Debian packages: the library, its debug information, the PC stand-ins that it loads, the development files, and the
# example receiver.
set(CPACK_GENERATOR DEB)
set(CPACK_PACKAGE_NAME libvarnekutils-ltn)
set(CPACK_PACKAGE_VENDOR "")
set(CPACK_PACKAGE_DESCRIPTION_SUMMARY "")  # each package has its own
set(CPACK_PACKAGE_CONTACT "varnekutils_ltn maintainers <maintainers@users.noreply.example>")
set(CPACK_PACKAGING_INSTALL_PREFIX /usr)
set(CPACK_STRIP_FILES ON)
set(CPACK_DEB_COMPONENT_INSTALL ON)
set(CPACK_COMPONENTS_ALL library debug standins dev receiver)
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_PACKAGE_PRIORITY optional)
set(CPACK_DEBIAN_PACKAGE_CONTROL_STRICT_PERMISSION ON)
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS ON)
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS_PRIVATE_DIRS ${CMAKE_LIBRARY_OUTPUT_DIRECTORY})

# package(COMPONENT NAME SECTION DESCRIPTION): sets the control fields, and installs the copyright and the changelog in
# the document directory of the package.
macro(package component name section description)
    string(TOUPPER ${component} COMPONENT)
    set(CPACK_DEBIAN_${COMPONENT}_PACKAGE_NAME ${name})
    set(CPACK_DEBIAN_${COMPONENT}_PACKAGE_SECTION ${section})
    set(CPACK_DEBIAN_${COMPONENT}_DESCRIPTION "${description}")
    install(FILES cmake/debian/copyright ${CMAKE_CURRENT_BINARY_DIR}/changelog.gz
            DESTINATION ${CMAKE_INSTALL_DATADIR}/doc/${name} COMPONENT ${component})
endmacro()

package(library libvarnekutils-ltn libs "common utility library of an ISDB-Tb receiver stack
It provides threads with message queues, mutexes, semaphores, timers and
files, a trace that is filtered by level and module, and tools for
broadcast code: bit stream, ring buffer, CRC-32, text conversion and
configuration.")
package(debug libvarnekutils-ltn-dbg debug "debug information of libvarnekutils-ltn
With this package, gdb shows the functions and variables of the library,
and gdb.py of libvarnekutils-ltn-dev lists the live objects of a process.")
package(standins libvarnekutils-ltn-standins libs "PC stand-ins for a device's log and feature store
libvarnekutils-ltn loads these libraries. The log writes to standard error
as logcat does. The feature store answers from a text file.")
package(dev libvarnekutils-ltn-dev libdevel "development files of libvarnekutils-ltn
This package has the headers, package files for CMake and pkg-config,
commented defaults, helpers for gdb, ThreadSanitizer and valgrind, the guide,
the reference and the examples.")
package(receiver libvarnekutils-ltn-receiver utils "show the contents of ISDB-Tb and DVB transport streams
The program receiver reads a transport stream with libvarnekutils-ltn, and
shows services, events, errors and PIDs as text or JSON. Its source is an
example in libvarnekutils-ltn-dev.")
set(CPACK_DEBIAN_LIBRARY_PACKAGE_DEPENDS "libvarnekutils-ltn-standins (= ${PROJECT_VERSION})")
set(CPACK_DEBIAN_DEBUG_PACKAGE_DEPENDS "libvarnekutils-ltn (= ${PROJECT_VERSION})")
set(CPACK_DEBIAN_RECEIVER_PACKAGE_DEPENDS "libvarnekutils-ltn (= ${PROJECT_VERSION})")
set(CPACK_DEBIAN_DEV_PACKAGE_DEPENDS "libvarnekutils-ltn (= ${PROJECT_VERSION}), libc6-dev")

configure_file(cmake/debian/changelog.in changelog @ONLY)
execute_process(COMMAND gzip -9nf ${CMAKE_CURRENT_BINARY_DIR}/changelog COMMAND_ERROR_IS_FATAL ANY)
install(CODE "
    execute_process(COMMAND gzip -9nf \$ENV{DESTDIR}/usr/${CMAKE_INSTALL_MANDIR}/man1/receiver.1 COMMAND_ERROR_IS_FATAL ANY)"
    COMPONENT receiver)

# gdb finds the debug information of a stripped library by its build id. CPack's own packages for it have wrong checksums
# and no copyright.
install(CODE "
    set(library \"$<TARGET_FILE:varnekutils_ltn>\")"
    COMPONENT debug)
install(CODE [[
    execute_process(COMMAND readelf -n ${library} OUTPUT_VARIABLE notes COMMAND_ERROR_IS_FATAL ANY)
    if(NOT notes MATCHES "Build ID: (..)([0-9a-f]+)")
        message(FATAL_ERROR "${library} has no build id")
    endif()
    set(directory $ENV{DESTDIR}/usr/lib/debug/.build-id/${CMAKE_MATCH_1})
    set(file ${directory}/${CMAKE_MATCH_2}.debug)
    file(MAKE_DIRECTORY ${directory})
    execute_process(COMMAND objcopy --only-keep-debug --compress-debug-sections ${library} ${file}
                    COMMAND_ERROR_IS_FATAL ANY)
    file(CHMOD ${file} PERMISSIONS OWNER_READ OWNER_WRITE GROUP_READ WORLD_READ)]]
    COMPONENT debug)

# The reference, which script/docs has built.
install(DIRECTORY build/docs/html DESTINATION ${CMAKE_INSTALL_DOCDIR} COMPONENT dev)
install(CODE "
    file(CREATE_LINK ../../common-licenses/Apache-2.0
         \"\$ENV{DESTDIR}/usr/${CMAKE_INSTALL_DOCDIR}/LICENSE\" SYMBOLIC)"
    COMPONENT dev)
# Android loads libraries without a version, so lintian is told that ours has none on purpose.
install(FILES cmake/debian/lintian-overrides DESTINATION ${CMAKE_INSTALL_DATADIR}/lintian/overrides
        RENAME libvarnekutils-ltn COMPONENT library)

# The configuration in /etc. The data directory's files belong to no package, so that no upgrade replaces them: the
# scripts create, keep and purge them.
cmake_path(GET VARNEK_FEATURE_FILE PARENT_PATH feature_dir)
install(FILES defaults/debug_ltn.ini DESTINATION ${VARNEK_SYSTEM_DIR} COMPONENT library)
install(FILES platform/host/features.txt DESTINATION ${feature_dir} COMPONENT standins)
install(CODE "file(MAKE_DIRECTORY \"\$ENV{DESTDIR}${VARNEK_DATA_DIR}\")" COMPONENT library)
# The settings without their comments, which loading would report as unknown lines.
file(STRINGS defaults/Varnek_Config.cfg settings REGEX "^[^#]")
list(JOIN settings "\n" settings)
set(control ${CMAKE_CURRENT_BINARY_DIR}/debian)
file(WRITE ${control}/library/conffiles "${VARNEK_SYSTEM_DIR}debug_ltn.ini\n")
file(WRITE ${control}/library/triggers "activate-noawait ldconfig\n")
file(WRITE ${control}/standins/conffiles "${VARNEK_FEATURE_FILE}\n")
foreach(name IN ITEMS preinst postinst postrm)
    configure_file(cmake/debian/${name}.in ${control}/library/${name} @ONLY
        FILE_PERMISSIONS OWNER_READ OWNER_WRITE OWNER_EXECUTE GROUP_READ GROUP_EXECUTE WORLD_READ WORLD_EXECUTE)
    list(APPEND CPACK_DEBIAN_LIBRARY_PACKAGE_CONTROL_EXTRA ${control}/library/${name})
endforeach()
list(APPEND CPACK_DEBIAN_LIBRARY_PACKAGE_CONTROL_EXTRA ${control}/library/conffiles ${control}/library/triggers)
set(CPACK_DEBIAN_STANDINS_PACKAGE_CONTROL_EXTRA ${control}/standins/conffiles)

include(CPack)
