# The packages (.deb, .rpm, .tar.gz), all with the programs in /opt/ruv and everything else in the system's directories.
# scripts/package builds and checks them.
set(CPACK_GENERATOR DEB RPM TGZ)
set(CPACK_PROJECT_CONFIG_FILE ${PROJECT_SOURCE_DIR}/cmake/package_components.cmake)
set(CPACK_PACKAGING_INSTALL_PREFIX /)
set(CPACK_INSTALL_DEFAULT_DIRECTORY_PERMISSIONS
  OWNER_READ OWNER_WRITE OWNER_EXECUTE GROUP_READ GROUP_EXECUTE WORLD_READ WORLD_EXECUTE)
set(CPACK_STRIP_FILES ON)
set(CPACK_VERBATIM_VARIABLES ON)

set(CPACK_PACKAGE_NAME ruv-launcher)
set(CPACK_PACKAGE_VENDOR "RUV launcher maintainers")
set(CPACK_PACKAGE_CONTACT ${RUV_MAINTAINER})
set(CPACK_PACKAGE_DESCRIPTION_SUMMARY "launcher for the RUV server diagnostics")
set(CPACK_PACKAGE_DESCRIPTION
"Stands in front of the diagnostics application in /opt/ruv: finds out what
machine it runs on, keeps the application's update packages current through
the package tool, and starts the application with the remaining arguments.
The application, its package tool and its helper script are not part of this
package.")
set(CPACK_PACKAGE_HOMEPAGE_URL ${RUV_DOWNLOAD_URL})

set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_PACKAGE_RELEASE 1)
set(CPACK_DEBIAN_PACKAGE_SECTION admin)
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS ON)
set(CPACK_DEBIAN_PACKAGE_RECOMMENDS logrotate)
set(CPACK_DEBIAN_PACKAGE_CONTROL_STRICT_PERMISSION ON)
set(CPACK_DEBIAN_PACKAGE_CONTROL_EXTRA
  ${PROJECT_SOURCE_DIR}/packaging/postinst ${PROJECT_SOURCE_DIR}/packaging/debian/conffiles)

set(CPACK_RPM_FILE_NAME RPM-DEFAULT)
set(CPACK_RPM_PACKAGE_LICENSE 0BSD)
set(CPACK_RPM_PACKAGE_GROUP System)
set(CPACK_RPM_POST_INSTALL_SCRIPT_FILE ${PROJECT_SOURCE_DIR}/packaging/postinst)
set(CPACK_RPM_USER_FILELIST "%config(noreplace) /etc/logrotate.d/ruv-launcher")
# Directories that belong to other packages.
set(CPACK_RPM_EXCLUDE_FROM_AUTO_FILELIST_ADDITION
  /etc/logrotate.d /opt /usr/lib/tmpfiles.d /usr/share/bash-completion /usr/share/bash-completion/completions
  /usr/share/man /usr/share/man/man8 /usr/share/zsh /usr/share/zsh/site-functions)
set(CPACK_RPM_SPEC_MORE_DEFINE "%define _build_id_links none")

include(CPack)
