# Read by cpack for each kind of package: which components go into it, and where.
list(GET CPACK_INSTALL_CMAKE_PROJECTS 0 build_tree)
set(CPACK_INSTALL_CMAKE_PROJECTS)
macro(put component directory)
  list(APPEND CPACK_INSTALL_CMAKE_PROJECTS ${build_tree} ruv-launcher ${component} ${directory})
endmacro()

put(programs /opt/ruv)
put(documents /usr)
put(settings /)
if(CPACK_GENERATOR STREQUAL "DEB")
  put(debian /usr)
else()
  put(generic /usr)
endif()

# The archive is unpacked at /.
set(CPACK_INCLUDE_TOPLEVEL_DIRECTORY OFF)
