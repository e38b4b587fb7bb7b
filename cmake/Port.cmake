# kastarri-port: the program, and what it knows, which it finds by its place relative to its own. Neither depends on
# the width, so packages of both widths may bring the same files.
find_package(Python3 REQUIRED COMPONENTS Interpreter)

file(RELATIVE_PATH KASTARRI_PORT_FILES ${CMAKE_INSTALL_FULL_BINDIR} ${CMAKE_INSTALL_FULL_DATADIR}/kastarri)
set(programs ${PROJECT_BINARY_DIR}/bin)
cmake_path(ABSOLUTE_PATH KASTARRI_PORT_FILES BASE_DIRECTORY ${programs} NORMALIZE OUTPUT_VARIABLE files)
file(MAKE_DIRECTORY ${files})
configure_file(${PROJECT_SOURCE_DIR}/tools/kastarri-port.in ${programs}/kastarri-port @ONLY
  FILE_PERMISSIONS OWNER_READ OWNER_WRITE OWNER_EXECUTE GROUP_READ GROUP_EXECUTE WORLD_READ WORLD_EXECUTE)

set(tools ${PROJECT_SOURCE_DIR}/tools)
file(GLOB tables CONFIGURE_DEPENDS ${PROJECT_SOURCE_DIR}/src/*.def ${PROJECT_SOURCE_DIR}/src/*/*.def
  ${PROJECT_SOURCE_DIR}/src/*/*shapes.h ${PROJECT_SOURCE_DIR}/src/*/row_kinds.h)
add_custom_command(OUTPUT ${files}/port.json
  COMMAND Python3::Interpreter ${tools}/port_data.py ${files}/port.json
  DEPENDS ${tools}/port_data.py ${tools}/not_built.py ${tools}/generate_headers.py ${tables}
  COMMENT "Listing the intrinsics for kastarri-port" VERBATIM)
add_custom_target(kastarri-port ALL DEPENDS ${files}/port.json)

install(PROGRAMS ${programs}/kastarri-port DESTINATION ${CMAKE_INSTALL_BINDIR})
install(FILES ${files}/port.json DESTINATION ${CMAKE_INSTALL_DATADIR}/kastarri)
