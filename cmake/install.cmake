# `cmake --install build` installs the programs, manual pages and documents below the prefix, the directory of the
# diagnostics application. Only the packages (packages.cmake) have the rest, which is of no use below a prefix.
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

# The notices of the libraries that are linked statically are those of the Debian packages they come from.
file(READ LICENSE copyright)
set(notices ${CMAKE_SYSROOT}/usr/share/doc/nlohmann-json3-dev/copyright)
if(EXISTS ${notices})
  file(READ ${notices} notices)
  string(APPEND copyright "
The programs also contain parts of the GNU C++ run-time library, which the GCC
Runtime Library Exception allows in programs of any licence, and ruv-trace
contains nlohmann-json, whose Debian package describes its sources as follows:

${notices}")
endif()
file(WRITE ${PROJECT_BINARY_DIR}/copyright "${copyright}")

ruv_compress(${PROJECT_SOURCE_DIR}/man/ruv-launcher.8 manual)
install(TARGETS launcher RUNTIME DESTINATION . COMPONENT programs)
install(FILES ${manual} DESTINATION share/man/man8 COMPONENT documents)
if(TARGET ruv-trace)
  ruv_compress(${PROJECT_SOURCE_DIR}/man/ruv-trace.8 manual)
  install(TARGETS ruv-trace RUNTIME DESTINATION bin COMPONENT programs)
  install(FILES ${manual} DESTINATION share/man/man8 COMPONENT documents)
endif()
install(FILES docs/administrator.md RENAME README.md DESTINATION ${documents} COMPONENT documents)
install(FILES docs/security.md ${PROJECT_BINARY_DIR}/copyright DESTINATION ${documents} COMPONENT documents)

# In /usr of a system that has the package.
foreach(program launcher ruv-trace)
  install(FILES completions/${program}.bash RENAME ${program} DESTINATION share/bash-completion/completions
          COMPONENT system EXCLUDE_FROM_ALL)
  install(FILES completions/${program}.zsh RENAME _${program} DESTINATION share/zsh/site-functions
          COMPONENT generic EXCLUDE_FROM_ALL)
  install(FILES completions/${program}.zsh RENAME _${program} DESTINATION share/zsh/vendor-completions
          COMPONENT debian EXCLUDE_FROM_ALL)
endforeach()
install(FILES packaging/tmpfiles.conf RENAME ruv-launcher.conf DESTINATION lib/tmpfiles.d
        COMPONENT system EXCLUDE_FROM_ALL)
install(FILES packaging/ruv-launcher.service packaging/ruv-launcher.timer DESTINATION lib/systemd/system
        COMPONENT system EXCLUDE_FROM_ALL)
install(FILES packaging/ruv-launcher.preset RENAME 80-ruv-launcher.preset DESTINATION lib/systemd/system-preset
        COMPONENT system EXCLUDE_FROM_ALL)
install(PROGRAMS packaging/make-directories DESTINATION lib/ruv-launcher COMPONENT system EXCLUDE_FROM_ALL)

# In /etc. The arguments can contain passwords.
install(FILES packaging/logrotate.conf RENAME ruv-launcher DESTINATION etc/logrotate.d
        COMPONENT settings EXCLUDE_FROM_ALL)
install(FILES packaging/default RENAME ruv-launcher DESTINATION etc/default PERMISSIONS OWNER_READ OWNER_WRITE
        COMPONENT settings EXCLUDE_FROM_ALL)

# The same file, under Debian's name for it and another one.
install(FILES CHANGELOG.md DESTINATION ${documents} COMPONENT generic EXCLUDE_FROM_ALL)
ruv_compress(${PROJECT_SOURCE_DIR}/CHANGELOG.md changelog)
install(FILES ${changelog} RENAME changelog.gz DESTINATION ${documents} COMPONENT debian EXCLUDE_FROM_ALL)

string(TIMESTAMP build_time "%a, %d %b %Y %H:%M:%S +0000" UTC)
configure_file(packaging/debian/changelog.in changelog.Debian @ONLY)
ruv_compress(${PROJECT_BINARY_DIR}/changelog.Debian debian_changelog)
install(FILES ${debian_changelog} DESTINATION ${documents} COMPONENT debian EXCLUDE_FROM_ALL)
install(FILES packaging/debian/lintian-overrides RENAME ruv-launcher DESTINATION share/lintian/overrides
        COMPONENT debian EXCLUDE_FROM_ALL)
