# Three Debian packages: the library, the PC stand-ins that it loads, and the development files.
set(CPACK_GENERATOR DEB)
set(CPACK_PACKAGE_NAME libvarnekutils-ltn)
set(CPACK_PACKAGE_VENDOR "")
set(CPACK_PACKAGE_DESCRIPTION_SUMMARY "")  # each package has its own
set(CPACK_PACKAGE_CONTACT "varnekutils_ltn maintainers <maintainers@users.noreply.example>")
set(CPACK_PACKAGING_INSTALL_PREFIX /usr)
set(CPACK_STRIP_FILES ON)
set(CPACK_DEB_COMPONENT_INSTALL ON)
set(CPACK_COMPONENTS_ALL library standins dev)
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
package(standins libvarnekutils-ltn-standins libs "PC stand-ins for a device's log and feature store
libvarnekutils-ltn loads these libraries. The log writes to standard error
as logcat does. The feature store answers from a text file.")
package(dev libvarnekutils-ltn-dev libdevel "development files of libvarnekutils-ltn
This package has the headers, package files for CMake and pkg-config,
commented defaults, a stand-in for the timers under ThreadSanitizer, the
guide and the examples.")
set(CPACK_DEBIAN_LIBRARY_PACKAGE_DEPENDS "libvarnekutils-ltn-standins (= ${PROJECT_VERSION})")
set(CPACK_DEBIAN_DEV_PACKAGE_DEPENDS "libvarnekutils-ltn (= ${PROJECT_VERSION}), libc6-dev")

configure_file(cmake/debian/changelog.in changelog @ONLY)
execute_process(COMMAND gzip -9nf ${CMAKE_CURRENT_BINARY_DIR}/changelog COMMAND_ERROR_IS_FATAL ANY)

# The working copy of the debug configuration is a link to the file that an administrator edits.
install(FILES defaults/debug_ltn.ini DESTINATION ${VARNEK_SYSTEM_DIR} COMPONENT library)
install(CODE "
    file(MAKE_DIRECTORY \"\$ENV{DESTDIR}${VARNEK_DATA_DIR}\")
    file(CREATE_LINK ${VARNEK_SYSTEM_DIR}debug_ltn.ini \"\$ENV{DESTDIR}${VARNEK_DATA_DIR}debug_ltn.ini\" SYMBOLIC)"
    COMPONENT library)
file(WRITE ${CMAKE_CURRENT_BINARY_DIR}/conffiles "${VARNEK_SYSTEM_DIR}debug_ltn.ini\n")
file(WRITE ${CMAKE_CURRENT_BINARY_DIR}/triggers "activate-noawait ldconfig\n")
set(CPACK_DEBIAN_LIBRARY_PACKAGE_CONTROL_EXTRA ${CMAKE_CURRENT_SOURCE_DIR}/cmake/debian/postrm
    ${CMAKE_CURRENT_BINARY_DIR}/conffiles ${CMAKE_CURRENT_BINARY_DIR}/triggers)

include(CPack)
