# What `cmake --install` puts where, and the Debian package of it. ./dev package makes the packages: it knows
# what they depend on.
include(GNUInstallDirs)
set(CMAKE_SKIP_INSTALL_ALL_DEPENDENCY ON) # installing needs the program, not the tests

# Debian wants manual pages and changelogs compressed, and without a name and a time, to be reproducible.
function(morvane_gzip SOURCE OUTPUT)
  add_custom_command(OUTPUT ${OUTPUT}
    COMMAND gzip -9nc ${CMAKE_SOURCE_DIR}/${SOURCE} > ${OUTPUT}
    DEPENDS ${CMAKE_SOURCE_DIR}/${SOURCE} VERBATIM)
endfunction()
morvane_gzip(docs/morvane.8 ${CMAKE_BINARY_DIR}/morvane.8.gz)
morvane_gzip(packaging/changelog ${CMAKE_BINARY_DIR}/changelog.gz)
add_custom_target(compressed_documents ALL DEPENDS ${CMAKE_BINARY_DIR}/morvane.8.gz ${CMAKE_BINARY_DIR}/changelog.gz)

install(TARGETS morvane RUNTIME DESTINATION ${CMAKE_INSTALL_SBINDIR} COMPONENT morvane)
# Stripping also takes the compilers' names, as Debian's packages do it.
install(CODE "if(CMAKE_INSTALL_DO_STRIP)
  execute_process(COMMAND ${CMAKE_STRIP} --remove-section=.comment
    \$ENV{DESTDIR}\${CMAKE_INSTALL_PREFIX}/${CMAKE_INSTALL_SBINDIR}/morvane COMMAND_ERROR_IS_FATAL ANY)
endif()" COMPONENT morvane)
install(FILES ${CMAKE_BINARY_DIR}/morvane.8.gz DESTINATION ${CMAKE_INSTALL_MANDIR}/man8 COMPONENT morvane)
install(FILES README.md packaging/copyright ${CMAKE_BINARY_DIR}/changelog.gz
  DESTINATION ${CMAKE_INSTALL_DOCDIR} COMPONENT morvane)
file(GLOB documents CONFIGURE_DEPENDS docs/*.md docs/*.svg)
install(FILES ${documents} DESTINATION ${CMAKE_INSTALL_DOCDIR}/docs COMPONENT morvane)
install(FILES packaging/lintian-overrides
  DESTINATION ${CMAKE_INSTALL_DATADIR}/lintian/overrides RENAME morvane COMPONENT morvane)

set(CPACK_GENERATOR DEB)
set(CPACK_PACKAGE_CONTACT "Morvane maintainers <morvane@example.org>")
set(CPACK_STRIP_FILES ON)
set(CPACK_INSTALL_DEFAULT_DIRECTORY_PERMISSIONS
  OWNER_READ OWNER_WRITE OWNER_EXECUTE GROUP_READ GROUP_EXECUTE WORLD_READ WORLD_EXECUTE)
set(CPACK_DEB_COMPONENT_INSTALL ON)
set(CPACK_COMPONENTS_ALL morvane)
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
if(CMAKE_SIZEOF_VOID_P EQUAL 4)
  set(CPACK_DEBIAN_PACKAGE_ARCHITECTURE i386)
else()
  set(CPACK_DEBIAN_PACKAGE_ARCHITECTURE amd64)
endif()
set(CPACK_DEBIAN_PACKAGE_CONTROL_STRICT_PERMISSION ON)
set(CPACK_DEBIAN_MORVANE_PACKAGE_NAME morvane)
set(CPACK_DEBIAN_MORVANE_PACKAGE_SECTION admin)
set(CPACK_DEBIAN_MORVANE_PACKAGE_RECOMMENDS procps) # pgrep, for the look at PowerPath's daemon
set(CPACK_DEBIAN_MORVANE_PACKAGE_SUGGESTS open-iscsi)
set(CPACK_COMPONENT_MORVANE_DESCRIPTION
"Morvane finds every storage path of a Linux host: Fibre Channel LUNs through
the SNIA HBA API, iSCSI sessions, direct disks and logical devices. It reads
each LUN's identity from the device itself with SCSI INQUIRY and writes one
log: the report, and a trace of every step that led to it.
.
It takes no arguments and changes nothing on the host but its log directory.")
include(CPack)
