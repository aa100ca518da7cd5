# What `cmake --install` puts where, and the packages of it: one for each program, a component of its name. A portable
# build makes RPMs, any other Debian packages; ./dev package makes those: it knows what they depend on.
include(GNUInstallDirs)
set(CMAKE_SKIP_INSTALL_ALL_DEPENDENCY ON) # installing needs the programs, not the tests

# Debian wants manual pages and changelogs compressed, and without a name and a time, to be reproducible. The result
# stands in the build folder.
add_custom_target(compressed_documents ALL)
function(morvane_gzip SOURCE)
  cmake_path(GET SOURCE FILENAME name)
  set(output ${CMAKE_BINARY_DIR}/${name}.gz)
  add_custom_command(OUTPUT ${output}
    COMMAND gzip -9nc ${CMAKE_SOURCE_DIR}/${SOURCE} > ${output}
    DEPENDS ${CMAKE_SOURCE_DIR}/${SOURCE} VERBATIM)
  target_sources(compressed_documents PRIVATE ${output})
endfunction()
morvane_gzip(packaging/changelog)

# Installs a program that is a target, with what every package holds.
function(morvane_install PROGRAM FOLDER MANUAL)
  install(TARGETS ${PROGRAM} RUNTIME DESTINATION ${FOLDER} COMPONENT ${PROGRAM})
  # Stripping also takes the compilers' names, as Debian's packages do it.
  install(CODE "if(CMAKE_INSTALL_DO_STRIP)
    execute_process(COMMAND ${CMAKE_STRIP} --remove-section=.comment
      \$ENV{DESTDIR}\${CMAKE_INSTALL_PREFIX}/${FOLDER}/${PROGRAM} COMMAND_ERROR_IS_FATAL ANY)
  endif()" COMPONENT ${PROGRAM})
  morvane_install_documents(${PROGRAM} ${MANUAL})
endfunction()

# Installs what every package holds: the program's manual page and the copyright; for Debian the changelog, too, and what
# lintian is to overlook, if anything.
function(morvane_install_documents PROGRAM MANUAL)
  morvane_gzip(${MANUAL})
  cmake_path(GET MANUAL FILENAME page)
  string(REGEX MATCH "[1-8]$" section ${page})
  install(FILES ${CMAKE_BINARY_DIR}/${page}.gz
    DESTINATION ${CMAKE_INSTALL_MANDIR}/man${section} COMPONENT ${PROGRAM})
  if(MORVANE_PORTABLE)
    install(FILES packaging/copyright DESTINATION ${CMAKE_INSTALL_DATADIR}/licenses/${PROGRAM} COMPONENT ${PROGRAM})
    return()
  endif()
  install(FILES packaging/copyright ${CMAKE_BINARY_DIR}/changelog.gz
    DESTINATION ${CMAKE_INSTALL_DATADIR}/doc/${PROGRAM} COMPONENT ${PROGRAM})
  if(EXISTS ${CMAKE_SOURCE_DIR}/packaging/${PROGRAM}.lintian-overrides)
    install(FILES packaging/${PROGRAM}.lintian-overrides
      DESTINATION ${CMAKE_INSTALL_DATADIR}/lintian/overrides RENAME ${PROGRAM} COMPONENT ${PROGRAM})
  endif()
endfunction()

if(MORVANE_PORTABLE)
  set(CPACK_GENERATOR RPM)
else()
  set(CPACK_GENERATOR DEB)
endif()
set(CPACK_PACKAGE_VENDOR "Morvane maintainers")
set(CPACK_PACKAGE_CONTACT "Morvane maintainers <morvane@example.org>")
set(CPACK_PACKAGE_DESCRIPTION_SUMMARY "") # each package's description begins with its own
set(CPACK_STRIP_FILES ON)
set(CPACK_INSTALL_DEFAULT_DIRECTORY_PERMISSIONS
  OWNER_READ OWNER_WRITE OWNER_EXECUTE GROUP_READ GROUP_EXECUTE WORLD_READ WORLD_EXECUTE)
set(CPACK_DEB_COMPONENT_INSTALL ON)
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
if(CMAKE_SIZEOF_VOID_P EQUAL 4)
  set(CPACK_DEBIAN_PACKAGE_ARCHITECTURE i386)
else()
  set(CPACK_DEBIAN_PACKAGE_ARCHITECTURE amd64)
endif()
set(CPACK_DEBIAN_PACKAGE_CONTROL_STRICT_PERMISSION ON)

morvane_install(morvane ${CMAKE_INSTALL_SBINDIR} docs/morvane.8)
install(FILES README.md DESTINATION ${CMAKE_INSTALL_DATADIR}/doc/morvane COMPONENT morvane)
file(GLOB documents CONFIGURE_DEPENDS docs/*.md docs/*.svg)
list(REMOVE_ITEM documents # other packages'
  ${CMAKE_SOURCE_DIR}/docs/fleet.md ${CMAKE_SOURCE_DIR}/docs/identity.md ${CMAKE_SOURCE_DIR}/docs/monitoring.md
  ${CMAKE_SOURCE_DIR}/docs/watch.md)
install(FILES ${documents} DESTINATION ${CMAKE_INSTALL_DATADIR}/doc/morvane/docs COMPONENT morvane)

# Where the collectors of support bundles look for other programs' plugins. sos stands among the modules of the system's
# Python: that of Debian, those of Enterprise Linux 8, 9 and 10.
if(MORVANE_PORTABLE)
  set(module_folders python3.6/site-packages python3.9/site-packages python3.12/site-packages)
else()
  set(module_folders python3/dist-packages)
endif()
foreach(folder ${module_folders})
  install(FILES support/sos.py DESTINATION lib/${folder}/sos/report/plugins RENAME morvane.py COMPONENT morvane)
endforeach()
install(PROGRAMS support/supportconfig DESTINATION lib/supportconfig/plugins RENAME morvane COMPONENT morvane)

set(CPACK_COMPONENTS_ALL morvane)
set(CPACK_DEBIAN_MORVANE_PACKAGE_NAME morvane)
set(CPACK_DEBIAN_MORVANE_PACKAGE_SECTION admin)
set(CPACK_DEBIAN_MORVANE_PACKAGE_RECOMMENDS procps) # pgrep, for the look at PowerPath's daemon
set(CPACK_DEBIAN_MORVANE_PACKAGE_SUGGESTS "morvane-view, morvane-watch, open-iscsi")
set(CPACK_DEBIAN_MORVANE_PACKAGE_CONTROL_EXTRA ${CMAKE_SOURCE_DIR}/packaging/debian/morvane/prerm)
set(CPACK_COMPONENT_MORVANE_DESCRIPTION
"Storage-path report for Linux hosts
Morvane finds every storage path of a Linux host: Fibre Channel LUNs through
the SNIA HBA API, iSCSI sessions, direct disks and logical devices. It reads
each LUN's identity from the device itself with SCSI INQUIRY and writes one
log: the report, and a trace of every step that led to it.
.
It takes no arguments and changes nothing on the host but its log directory.")

if(TARGET morvane-view)
  morvane_install(morvane-view ${CMAKE_INSTALL_BINDIR} view/morvane-view.1)
  # Where each shell of the distribution looks for other packages' completions.
  if(MORVANE_PORTABLE)
    set(zsh_folder zsh/site-functions)
  else()
    set(zsh_folder zsh/vendor-completions)
  endif()
  install(FILES ${CMAKE_BINARY_DIR}/view/completion.bash RENAME morvane-view
    DESTINATION ${CMAKE_INSTALL_DATADIR}/bash-completion/completions COMPONENT morvane-view)
  install(FILES ${CMAKE_BINARY_DIR}/view/completion.zsh RENAME _morvane-view
    DESTINATION ${CMAKE_INSTALL_DATADIR}/${zsh_folder} COMPONENT morvane-view)
  install(FILES ${CMAKE_BINARY_DIR}/view/completion.fish RENAME morvane-view.fish
    DESTINATION ${CMAKE_INSTALL_DATADIR}/fish/vendor_completions.d COMPONENT morvane-view)
  install(FILES view/morvane-log.schema.json view/morvane-verify.schema.json
    DESTINATION ${CMAKE_INSTALL_DATADIR}/morvane-view COMPONENT morvane-view)
  install(DIRECTORY monitoring DESTINATION ${CMAKE_INSTALL_DATADIR}/morvane-view COMPONENT morvane-view)
  install(FILES docs/fleet.md docs/identity.md docs/monitoring.md docs/view.png
    DESTINATION ${CMAKE_INSTALL_DATADIR}/doc/morvane-view COMPONENT morvane-view)

  list(APPEND CPACK_COMPONENTS_ALL morvane-view)
  set(CPACK_DEBIAN_MORVANE-VIEW_PACKAGE_NAME morvane-view)
  set(CPACK_DEBIAN_MORVANE-VIEW_PACKAGE_SOURCE morvane)
  set(CPACK_DEBIAN_MORVANE-VIEW_PACKAGE_SECTION utils)
  set(CPACK_DEBIAN_MORVANE-VIEW_PACKAGE_SUGGESTS jq) # for the questions in the manual page
  set(CPACK_COMPONENT_MORVANE-VIEW_DESCRIPTION
"Reader of Morvane's storage-path logs
morvane-view shows what a log of Morvane says: what is wrong first, each with
its cause, then every LUN with its paths, then the trees; as text, as JSON, or
as a page for the browser with a picture of the topology and a search. It tells
what differs between two logs of a host, and joins the logs of many hosts into
one view of the SAN.
.
It needs no storage, no root and no Morvane on the machine that reads.")
endif()

if(TARGET morvane-view)
  install(PROGRAMS watch/morvane-watch DESTINATION ${CMAKE_INSTALL_SBINDIR} COMPONENT morvane-watch)
  install(DIRECTORY watch/morvane_watch DESTINATION ${CMAKE_INSTALL_DATADIR}/morvane-watch COMPONENT morvane-watch
    FILES_MATCHING PATTERN *.py PATTERN __pycache__ EXCLUDE)
  morvane_install_documents(morvane-watch watch/morvane-watch.8)
  install(FILES docs/watch.md DESTINATION ${CMAKE_INSTALL_DATADIR}/doc/morvane-watch COMPONENT morvane-watch)
  install(FILES watch/morvane-watch.bash DESTINATION ${CMAKE_INSTALL_DATADIR}/bash-completion/completions
    RENAME morvane-watch COMPONENT morvane-watch)
  install(FILES watch/watch.conf DESTINATION /etc/morvane COMPONENT morvane-watch)
  install(FILES watch/morvane-watch.service watch/morvane-watch.timer DESTINATION lib/systemd/system
    COMPONENT morvane-watch)

  list(APPEND CPACK_COMPONENTS_ALL morvane-watch)
  set(CPACK_DEBIAN_MORVANE-WATCH_PACKAGE_NAME morvane-watch)
  set(CPACK_DEBIAN_MORVANE-WATCH_PACKAGE_SOURCE morvane)
  set(CPACK_DEBIAN_MORVANE-WATCH_PACKAGE_SECTION admin)
  set(CPACK_DEBIAN_MORVANE-WATCH_PACKAGE_ARCHITECTURE all)
  set(CPACK_DEBIAN_MORVANE-WATCH_PACKAGE_DEPENDS
    "python3:any, morvane, morvane-view (>= ${PROJECT_VERSION}), zstd, init-system-helpers (>= 1.54~)")
  set(CPACK_DEBIAN_MORVANE-WATCH_PACKAGE_CONTROL_EXTRA "")
  foreach(file conffiles postinst prerm postrm)
    list(APPEND CPACK_DEBIAN_MORVANE-WATCH_PACKAGE_CONTROL_EXTRA
      ${CMAKE_SOURCE_DIR}/packaging/debian/morvane-watch/${file})
  endforeach()
  set(CPACK_COMPONENT_MORVANE-WATCH_DESCRIPTION
"Watch over the storage paths of a Linux host
morvane-watch runs Morvane every night, keeps the logs, and compares each with
the state that somebody accepted. A lost path or LUN, or another LUN behind a
path, goes to the journal and makes a systemd unit fail, so that the monitoring
that is there sees it.
.
It starts nothing by itself: enable morvane-watch.timer.")
endif()
include(cmake/Rpm.cmake)
include(CPack)
