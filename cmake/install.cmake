# `cmake --install build` installs the programs, manual pages and documents below the prefix, the directory of the
# diagnostics application. Only the packages (packages.cmake) have the rest, which is of no use below a prefix.
if(CMAKE_INSTALL_PREFIX_INITIALIZED_TO_DEFAULT)
  set(CMAKE_INSTALL_PREFIX /opt/ruv CACHE PATH "Directory of the diagnostics application" FORCE)
endif()

set(documents share/doc/ruv-launcher)

# Compressed copies, in the build tree.
string(TIMESTAMP build_time "%a, %d %b %Y %H:%M:%S +0000" UTC)
configure_file(packaging/debian/changelog.in changelog.Debian @ONLY)
foreach(file man/ruv-launcher.8 man/ruv-trace.8 CHANGELOG.md ${PROJECT_BINARY_DIR}/changelog.Debian)
  get_filename_component(name ${file} NAME)
  execute_process(COMMAND gzip -9nc ${file} WORKING_DIRECTORY ${PROJECT_SOURCE_DIR}
                  OUTPUT_FILE ${PROJECT_BINARY_DIR}/${name}.gz)
  set_property(DIRECTORY APPEND PROPERTY CMAKE_CONFIGURE_DEPENDS ${file})
endforeach()

# The licence, and the notices of the libraries that are linked statically.
file(READ LICENSE copyright)
set(notices ${CMAKE_SYSROOT}/usr/share/doc/nlohmann-json3-dev/copyright)
if(EXISTS ${notices})
  file(READ ${notices} notices)
  string(APPEND copyright "
The programs contain parts of the GNU C++ run-time library, which the GCC Runtime
Library Exception allows in programs of any licence. ruv-trace also contains
nlohmann-json, whose Debian package describes its sources as follows:

${notices}")
endif()
file(WRITE ${PROJECT_BINARY_DIR}/copyright "${copyright}")

install(TARGETS launcher RUNTIME DESTINATION . COMPONENT programs)
install(FILES ${PROJECT_BINARY_DIR}/ruv-launcher.8.gz ${PROJECT_BINARY_DIR}/ruv-trace.8.gz DESTINATION share/man/man8
        COMPONENT documents)
install(TARGETS ruv-trace RUNTIME DESTINATION bin COMPONENT programs)
install(FILES docs/administrator.md RENAME README.md DESTINATION ${documents} COMPONENT documents)
install(FILES docs/security.md ${PROJECT_BINARY_DIR}/copyright DESTINATION ${documents} COMPONENT documents)

# Installs a file in the packages only. The component says where: system (/usr, in both), generic (/usr, in the .rpm),
# debian (/usr, in the .deb) or settings (/, in both). Further arguments can set its permissions.
function(ruv_package component file path)
  get_filename_component(directory ${path} DIRECTORY)
  get_filename_component(name ${path} NAME)
  install(FILES ${file} RENAME ${name} DESTINATION ${directory} COMPONENT ${component} EXCLUDE_FROM_ALL ${ARGN})
endfunction()

foreach(program launcher ruv-trace)
  ruv_package(system completions/${program}.bash share/bash-completion/completions/${program})
  ruv_package(generic completions/${program}.zsh share/zsh/site-functions/_${program})
  ruv_package(debian completions/${program}.zsh share/zsh/vendor-completions/_${program})
endforeach()
ruv_package(system packaging/make-directories lib/ruv-launcher/make-directories PERMISSIONS
  OWNER_READ OWNER_WRITE OWNER_EXECUTE GROUP_READ GROUP_EXECUTE WORLD_READ WORLD_EXECUTE)
ruv_package(system packaging/tmpfiles.conf lib/tmpfiles.d/ruv-launcher.conf)
ruv_package(system packaging/ruv-launcher.service lib/systemd/system/ruv-launcher.service)
ruv_package(system packaging/ruv-launcher.timer lib/systemd/system/ruv-launcher.timer)
ruv_package(system packaging/ruv-launcher.preset lib/systemd/system-preset/80-ruv-launcher.preset)
ruv_package(settings packaging/logrotate.conf etc/logrotate.d/ruv-launcher)
# The arguments can contain passwords.
ruv_package(settings packaging/default etc/default/ruv-launcher PERMISSIONS OWNER_READ OWNER_WRITE)
ruv_package(generic CHANGELOG.md ${documents}/CHANGELOG.md)
ruv_package(debian ${PROJECT_BINARY_DIR}/CHANGELOG.md.gz ${documents}/changelog.gz)
ruv_package(debian ${PROJECT_BINARY_DIR}/changelog.Debian.gz ${documents}/changelog.Debian.gz)
ruv_package(debian packaging/debian/lintian-overrides share/lintian/overrides/ruv-launcher)
