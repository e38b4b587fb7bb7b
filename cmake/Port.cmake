# kastarri-port: the program, and what it knows, which it finds by its place relative to its own. Neither depends on
# the width, so packages of both widths may bring the same files.
kastarri_tool(kastarri-port)

set(tools ${PROJECT_SOURCE_DIR}/tools)
add_custom_command(OUTPUT ${KASTARRI_BUILT_DATA}/port.json
  COMMAND Python3::Interpreter ${tools}/port_data.py ${KASTARRI_BUILT_DATA}/port.json
  DEPENDS ${tools}/port_data.py ${tools}/not_built.py ${KASTARRI_TABLES}
  COMMENT "Listing the intrinsics for kastarri-port" VERBATIM)
add_custom_target(kastarri-port ALL DEPENDS ${KASTARRI_BUILT_DATA}/port.json)

kastarri_install(FILES ${KASTARRI_BUILT_DATA}/port.json DESTINATION ${CMAKE_INSTALL_DATADIR}/kastarri)
