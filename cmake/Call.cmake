# kastarri-call: the program, what it knows, and for each width the program that calls (cmake/Profile.cmake says how these
# find each other).
set(runner_dir lib/kastarri/call)
file(RELATIVE_PATH KASTARRI_CALL_FILES ${CMAKE_INSTALL_FULL_BINDIR} ${CMAKE_INSTALL_FULL_DATADIR}/kastarri/call)
file(RELATIVE_PATH KASTARRI_CALL_RUNNERS ${CMAKE_INSTALL_FULL_BINDIR} ${CMAKE_INSTALL_PREFIX}/${runner_dir})
set(tools ${PROJECT_SOURCE_DIR}/tools)
cmake_path(ABSOLUTE_PATH KASTARRI_CALL_FILES BASE_DIRECTORY ${KASTARRI_BUILT_PROGRAMS} NORMALIZE OUTPUT_VARIABLE files)
cmake_path(ABSOLUTE_PATH KASTARRI_CALL_RUNNERS BASE_DIRECTORY ${KASTARRI_BUILT_PROGRAMS} NORMALIZE OUTPUT_VARIABLE runners)
file(MAKE_DIRECTORY ${files})
kastarri_tool(kastarri-call)
foreach(module IN ITEMS search.py values.py)
  configure_file(${tools}/call/${module} ${files}/${module} COPYONLY)
endforeach()

add_custom_command(OUTPUT ${files}/call.json
  COMMAND Python3::Interpreter ${tools}/call/data.py ${files}/call.json
  DEPENDS ${tools}/call/data.py ${tools}/rules.py ${tools}/not_built.py
    ${tools}/reference/entries.py ${tools}/reference/words.py ${KASTARRI_TABLES}
  COMMENT "Listing the intrinsics for kastarri-call" VERBATIM)

add_executable(kastarri-call ${tools}/call/run.cpp ${tools}/reference/calls.cpp ${tools}/reference/operands.cpp
  ${PROJECT_SOURCE_DIR}/tests/support/registers.cpp ${files}/call.json)
target_include_directories(kastarri-call PRIVATE ${tools}/reference ${PROJECT_SOURCE_DIR}/tests ${PROJECT_SOURCE_DIR}/src)
target_compile_options(kastarri-call PRIVATE -msse2 -mfpmath=sse -O0)
target_link_libraries(kastarri-call PRIVATE kastarri)
# It needs what the library needs, and no C++ library of its width.
target_link_options(kastarri-call PRIVATE -static-libstdc++ -static-libgcc)
file(RELATIVE_PATH to_library ${CMAKE_INSTALL_PREFIX}/${runner_dir}/${KASTARRI_BITS} ${CMAKE_INSTALL_FULL_LIBDIR})
set_target_properties(kastarri-call PROPERTIES OUTPUT_NAME run RUNTIME_OUTPUT_DIRECTORY ${runners}/${KASTARRI_BITS}
  INSTALL_RPATH "$ORIGIN/${to_library}")

kastarri_install(FILES ${files}/call.json ${tools}/call/search.py ${tools}/call/values.py
  DESTINATION ${CMAKE_INSTALL_DATADIR}/kastarri/call)
kastarri_install(TARGETS kastarri-call RUNTIME DESTINATION ${runner_dir}/${KASTARRI_BITS})
