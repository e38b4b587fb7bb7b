# kastarri-conform: the program, and what it knows and is made of, which it finds by its place relative to its own. Nothing
# depends on the width, so packages of both widths may bring the same files.
file(RELATIVE_PATH KASTARRI_CONFORM_FILES ${CMAKE_INSTALL_FULL_BINDIR} ${CMAKE_INSTALL_FULL_DATADIR}/kastarri/conform)
cmake_path(ABSOLUTE_PATH KASTARRI_CONFORM_FILES BASE_DIRECTORY ${KASTARRI_BUILT_PROGRAMS} NORMALIZE OUTPUT_VARIABLE files)
file(MAKE_DIRECTORY ${files})
kastarri_tool(kastarri-conform ${files}/conform.json)
set(parts comparison.py programs.py register_access.py runtime.cpp)
foreach(part IN LISTS parts)
  configure_file(${PROJECT_SOURCE_DIR}/tools/conform/${part} ${files}/${part} COPYONLY)
endforeach()

set(tools ${PROJECT_SOURCE_DIR}/tools)
add_custom_command(OUTPUT ${files}/conform.json
  COMMAND Python3::Interpreter ${tools}/conform/data.py ${files}/conform.json
  DEPENDS ${tools}/conform/data.py ${tools}/reference/choices.py ${tools}/reference/entries.py
    ${PROJECT_SOURCE_DIR}/docs/choices.md ${KASTARRI_TABLES}
  COMMENT "Listing the intrinsics for kastarri-conform" VERBATIM)
add_custom_target(kastarri-conform ALL DEPENDS ${files}/conform.json)

list(TRANSFORM parts PREPEND ${files}/ OUTPUT_VARIABLE installed)
kastarri_install(FILES ${files}/conform.json ${installed} DESTINATION ${CMAKE_INSTALL_DATADIR}/kastarri/conform)
