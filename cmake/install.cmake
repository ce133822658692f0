# `cmake --install build` installs everything below the prefix, the directory of the diagnostics application. In the
# packages (packages.cmake) only the programs are there; the other components go to /usr and /etc.
if(CMAKE_INSTALL_PREFIX_INITIALIZED_TO_DEFAULT)
  set(CMAKE_INSTALL_PREFIX /opt/ruv CACHE PATH "Directory of the diagnostics application" FORCE)
endif()

set(documents share/doc/ruv-launcher)

# Adds a target that writes a compressed copy of a file into the build tree, and sets variable to its path.
function(ruv_compress file variable)
  get_filename_component(name ${file} NAME)
  set(compressed ${PROJECT_BINARY_DIR}/compressed/${name}.gz)
  file(MAKE_DIRECTORY ${PROJECT_BINARY_DIR}/compressed)
  add_custom_command(OUTPUT ${compressed} DEPENDS ${file} VERBATIM
    COMMAND sh -c [[gzip -9nc "$1" >"$2"]] sh ${file} ${compressed})
  add_custom_target(compressed_${name} ALL DEPENDS ${compressed})
  set(${variable} ${compressed} PARENT_SCOPE)
endfunction()

ruv_compress(${PROJECT_SOURCE_DIR}/man/ruv-launcher.8 manual)
install(TARGETS launcher RUNTIME DESTINATION . COMPONENT programs)
install(FILES ${manual} DESTINATION share/man/man8 COMPONENT documents)
if(TARGET ruv-trace)
  ruv_compress(${PROJECT_SOURCE_DIR}/man/ruv-trace.8 manual)
  install(TARGETS ruv-trace RUNTIME DESTINATION bin COMPONENT programs)
  install(FILES ${manual} DESTINATION share/man/man8 COMPONENT documents)
endif()

# In /usr of a system that has the package.
install(FILES docs/administrator.md RENAME README.md DESTINATION ${documents} COMPONENT documents)
install(FILES docs/security.md DESTINATION ${documents} COMPONENT documents)
foreach(program launcher ruv-trace)
  install(FILES completions/${program}.bash RENAME ${program} DESTINATION share/bash-completion/completions
          COMPONENT documents)
  install(FILES completions/${program}.zsh RENAME _${program} DESTINATION share/zsh/site-functions COMPONENT generic)
  install(FILES completions/${program}.zsh RENAME _${program} DESTINATION share/zsh/vendor-completions
          COMPONENT debian EXCLUDE_FROM_ALL)
endforeach()
install(FILES packaging/tmpfiles.conf RENAME ruv-launcher.conf DESTINATION lib/tmpfiles.d COMPONENT documents)
install(FILES packaging/ruv-launcher.service packaging/ruv-launcher.timer DESTINATION lib/systemd/system
        COMPONENT documents)

# In /etc.
install(FILES packaging/logrotate.conf RENAME ruv-launcher DESTINATION etc/logrotate.d COMPONENT settings)

# In /usr as well; Debian has its own names and directories for these, see below.
install(FILES LICENSE CHANGELOG.md DESTINATION ${documents} COMPONENT generic)

ruv_compress(${PROJECT_SOURCE_DIR}/CHANGELOG.md changelog)
string(TIMESTAMP build_time "%a, %d %b %Y %H:%M:%S +0000" UTC)
configure_file(packaging/debian/changelog.in changelog.Debian @ONLY)
ruv_compress(${PROJECT_BINARY_DIR}/changelog.Debian debian_changelog)
install(FILES LICENSE RENAME copyright DESTINATION ${documents} COMPONENT debian EXCLUDE_FROM_ALL)
install(FILES ${changelog} RENAME changelog.gz DESTINATION ${documents} COMPONENT debian EXCLUDE_FROM_ALL)
install(FILES ${debian_changelog} DESTINATION ${documents} COMPONENT debian EXCLUDE_FROM_ALL)
install(FILES packaging/debian/lintian-overrides RENAME ruv-launcher DESTINATION share/lintian/overrides
        COMPONENT debian EXCLUDE_FROM_ALL)
