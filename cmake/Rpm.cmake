# The RPMs of a portable build. The programs need of a system what their own symbols say, which rpmbuild finds, and their
# packages run nothing when they are installed or removed.
set(CPACK_VERBATIM_VARIABLES ON) # quotes in what follows
set(CPACK_RPM_COMPONENT_INSTALL ON)
set(CPACK_RPM_FILE_NAME RPM-DEFAULT)
set(CPACK_RPM_PACKAGE_ARCHITECTURE ${CMAKE_SYSTEM_PROCESSOR})
set(CPACK_RPM_PACKAGE_LICENSE LicenseRef-all-rights-reserved)
set(CPACK_RPM_PACKAGE_GROUP System/Base)
set(CPACK_PACKAGE_RELOCATABLE OFF)
set(CPACK_RPM_COMPRESSION_TYPE xz) # which the rpm of every server knows
set(CPACK_RPM_CHANGELOG_FILE ${CMAKE_SOURCE_DIR}/packaging/rpm/changelog)
# What other packages own.
set(CPACK_RPM_EXCLUDE_FROM_AUTO_FILELIST_ADDITION
  /etc /usr/lib /usr/lib/systemd /usr/lib/systemd/system /usr/sbin /usr/share/man /usr/share/man/man1 /usr/share/man/man8
  /usr/share/bash-completion /usr/share/bash-completion/completions /usr/share/zsh /usr/share/zsh/site-functions
  /usr/share/fish /usr/share/fish/vendor_completions.d /usr/share/licenses)

# A component's description begins with its summary, and has Debian's mark between its paragraphs.
foreach(component ${CPACK_COMPONENTS_ALL})
  string(TOUPPER ${component} name)
  string(REGEX MATCH "^([^\n]*)\n(.*)$" description "${CPACK_COMPONENT_${name}_DESCRIPTION}")
  set(summary "${CMAKE_MATCH_1}")
  set(description "${CMAKE_MATCH_2}")
  string(REPLACE "\n.\n" "\n\n" description "${description}")
  set(CPACK_RPM_${name}_PACKAGE_NAME ${component})
  set(CPACK_RPM_${name}_PACKAGE_SUMMARY "${summary}")
  set(CPACK_RPM_${name}_PACKAGE_DESCRIPTION "${description}")
  set(CPACK_RPM_${name}_USER_FILELIST "%license /usr/share/licenses/${component}/copyright")
endforeach()
list(APPEND CPACK_RPM_MORVANE-WATCH_USER_FILELIST "%config(noreplace) /etc/morvane/watch.conf")
set(CPACK_RPM_MORVANE-WATCH_PACKAGE_ARCHITECTURE noarch)
set(CPACK_RPM_MORVANE-WATCH_PACKAGE_REQUIRES "morvane, morvane-view >= ${PROJECT_VERSION}, zstd, systemd")
set(CPACK_RPM_MORVANE-WATCH_POST_INSTALL_SCRIPT_FILE ${CMAKE_SOURCE_DIR}/packaging/rpm/morvane-watch/post)
set(CPACK_RPM_MORVANE-WATCH_PRE_UNINSTALL_SCRIPT_FILE ${CMAKE_SOURCE_DIR}/packaging/rpm/morvane-watch/preun)
set(CPACK_RPM_MORVANE-WATCH_POST_UNINSTALL_SCRIPT_FILE ${CMAKE_SOURCE_DIR}/packaging/rpm/morvane-watch/post)

# The plugins of other collectors ask for nothing: who has these has Python, or a shell.
# The same sources make the same bytes. What CPack has no variable for is said in rpmbuild's own language.
if(MORVANE_PORTABLE)
  set(CPACK_PRE_BUILD_SCRIPTS ${CMAKE_SOURCE_DIR}/cmake/SetTimes.cmake)
endif()
if(CMAKE_SIZEOF_VOID_P EQUAL 8)
  set(mark "()(64bit)")
endif()
set(CPACK_RPM_SPEC_MORE_DEFINE "%define use_source_date_epoch_as_buildtime 1
%define clamp_mtime_to_source_date_epoch 1
%define _buildhost localhost
%define _build_id_links none
%define __os_install_post %{nil}
%define __python_requires %{nil}
Packager: ${CPACK_PACKAGE_CONTACT}
%if \"%{name}\" == \"morvane\"
Recommends: libHBAAPI.so.2${mark}
Suggests: morvane-view
Suggests: morvane-watch
%define __requires_exclude ^/bin/sh$
%endif")
