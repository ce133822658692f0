# The packages (.deb, .rpm): the programs in /opt/ruv, everything else in the system's directories. scripts/package builds
# and checks them, and makes the archive.
set(CPACK_GENERATOR DEB RPM)
set(CPACK_PROJECT_CONFIG_FILE ${PROJECT_SOURCE_DIR}/cmake/package_components.cmake)
set(CPACK_PACKAGING_INSTALL_PREFIX /)
set(CPACK_INSTALL_DEFAULT_DIRECTORY_PERMISSIONS
  OWNER_READ OWNER_WRITE OWNER_EXECUTE GROUP_READ GROUP_EXECUTE WORLD_READ WORLD_EXECUTE)
set(CPACK_VERBATIM_VARIABLES ON)

set(CPACK_PACKAGE_NAME ruv-launcher)
set(CPACK_PACKAGE_VENDOR "RUV launcher maintainers")
set(CPACK_PACKAGE_CONTACT ${RUV_MAINTAINER})
set(CPACK_PACKAGE_DESCRIPTION_SUMMARY "launcher for the RUV server diagnostics")
set(CPACK_PACKAGE_DESCRIPTION
"Front end of the diagnostics application in /opt/ruv: identifies the machine,
keeps the application's update packages current through the package tool, and
starts the application with the remaining arguments. The application, its
package tool and its helper script are not part of this package.")
set(CPACK_PACKAGE_HOMEPAGE_URL ${RUV_DOWNLOAD_URL})

set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_PACKAGE_RELEASE ${RUV_PACKAGE_RELEASE})
set(CPACK_DEBIAN_PACKAGE_SECTION admin)
set(CPACK_DEBIAN_COMPRESSION_TYPE xz) # as scripts/package packs it again
if(CMAKE_SYSROOT)
  set(CPACK_DEBIAN_PACKAGE_ARCHITECTURE ${RUV_ARCH})
  set(CPACK_DEBIAN_PACKAGE_DEPENDS "libc6 (>= 2.17)") # scripts/check-programs verifies it
else()
  set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS ON)
endif()
set(CPACK_DEBIAN_PACKAGE_RECOMMENDS logrotate)
set(CPACK_DEBIAN_PACKAGE_CONTROL_STRICT_PERMISSION ON)
set(CPACK_DEBIAN_PACKAGE_CONTROL_EXTRA
  ${PROJECT_SOURCE_DIR}/packaging/debian/preinst ${PROJECT_SOURCE_DIR}/packaging/debian/conffiles
  ${PROJECT_SOURCE_DIR}/packaging/postinst ${PROJECT_SOURCE_DIR}/packaging/postrm)

set(CPACK_RPM_FILE_NAME RPM-DEFAULT)
set(CPACK_RPM_PACKAGE_RELEASE ${RUV_PACKAGE_RELEASE})
set(CPACK_RPM_PACKAGE_ARCHITECTURE ${CMAKE_SYSTEM_PROCESSOR})
set(CPACK_RPM_PACKAGE_DESCRIPTION ${CPACK_PACKAGE_DESCRIPTION})
set(CPACK_RPM_PACKAGE_SUMMARY "Launcher for the RUV server diagnostics")
set(CPACK_RPM_PACKAGE_LICENSE 0BSD)
set(CPACK_RPM_PACKAGE_GROUP System)
set(CPACK_PACKAGE_RELOCATABLE OFF)
string(TIMESTAMP changelog_date "%a %b %d %Y" UTC)
file(WRITE ${PROJECT_BINARY_DIR}/changelog.rpm
"* ${changelog_date} ${RUV_MAINTAINER} - ${PROJECT_VERSION}-${RUV_PACKAGE_RELEASE}
- See CHANGELOG.md for the changes.
")
set(CPACK_RPM_CHANGELOG_FILE ${PROJECT_BINARY_DIR}/changelog.rpm)
set(CPACK_RPM_POST_INSTALL_SCRIPT_FILE ${PROJECT_SOURCE_DIR}/packaging/postinst)
set(CPACK_RPM_POST_UNINSTALL_SCRIPT_FILE ${PROJECT_SOURCE_DIR}/packaging/postrm)
set(CPACK_RPM_USER_FILELIST
  "%config(noreplace) /etc/default/ruv-launcher" "%config(noreplace) /etc/logrotate.d/ruv-launcher")
# Directories that belong to other packages or, below /opt, to the application.
set(CPACK_RPM_EXCLUDE_FROM_AUTO_FILELIST_ADDITION
  /etc/default /etc/logrotate.d /opt /opt/ruv /opt/ruv/bin /usr/lib/systemd /usr/lib/systemd/system
  /usr/lib/systemd/system-preset /usr/lib/tmpfiles.d /usr/share/bash-completion
  /usr/share/bash-completion/completions /usr/share/man /usr/share/man/man8 /usr/share/zsh
  /usr/share/zsh/site-functions)
# rpm before 4.12 (RHEL 7, SLES 12) ignores Recommends and reads gzip, not zstd. The other lines make the
# packages reproducible.
set(CPACK_RPM_SPEC_MORE_DEFINE
"Packager: ${RUV_MAINTAINER}
Recommends: logrotate
%define _binary_payload w9.gzdio
%define _build_id_links none
%define _buildhost localhost
%define use_source_date_epoch_as_buildtime 1
%define __os_install_post find %{buildroot} -exec touch -d @$SOURCE_DATE_EPOCH {} +")

include(CPack)
