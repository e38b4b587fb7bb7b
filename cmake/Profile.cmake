# kastarri-profile: the counting library, the list of intrinsics beside it, what calls cost, and the program, which finds
# them by their place relative to its own. It is the same for both widths and finds the files of each.
enable_language(ASM)

set(KASTARRI_PROFILE_DIR lib/kastarri/profile)
file(RELATIVE_PATH KASTARRI_PROFILE_FILES ${CMAKE_INSTALL_FULL_BINDIR} ${CMAKE_INSTALL_PREFIX}/${KASTARRI_PROFILE_DIR})
cmake_path(ABSOLUTE_PATH KASTARRI_PROFILE_FILES BASE_DIRECTORY ${KASTARRI_BUILT_PROGRAMS} NORMALIZE OUTPUT_VARIABLE files)
string(APPEND files /${KASTARRI_BITS})
string(APPEND KASTARRI_PROFILE_DIR /${KASTARRI_BITS})
file(MAKE_DIRECTORY ${files})
kastarri_tool(kastarri-profile)
configure_file(${PROJECT_SOURCE_DIR}/bench/costs.csv ${KASTARRI_BUILT_DATA}/costs.csv COPYONLY)

set(tools ${PROJECT_SOURCE_DIR}/tools)
add_custom_command(OUTPUT ${files}/intrinsics.inc ${files}/intrinsics.csv
  COMMAND Python3::Interpreter ${tools}/list_intrinsics.py $<TARGET_FILE:kastarri> ${files}
  DEPENDS kastarri ${tools}/list_intrinsics.py ${tools}/generate_headers.py ${tools}/read_tables.py
  COMMENT "Listing the intrinsics for kastarri-profile" VERBATIM)

set(source ${PROJECT_SOURCE_DIR}/src/profile)
add_library(kastarri-profile MODULE ${source}/counters.cpp ${source}/callers.cpp ${source}/entries.S
  ${files}/intrinsics.inc ${files}/intrinsics.csv)
set_property(SOURCE ${source}/counters.cpp ${source}/entries.S APPEND PROPERTY OBJECT_DEPENDS ${files}/intrinsics.inc)
set_target_properties(kastarri-profile PROPERTIES LIBRARY_OUTPUT_DIRECTORY ${files} LINKER_LANGUAGE C)
target_include_directories(kastarri-profile PRIVATE ${files})
target_compile_definitions(kastarri-profile PRIVATE
  _FILE_OFFSET_BITS=64 KASTARRI_SONAME="libkastarri.so.${PROJECT_VERSION_MAJOR}")
target_compile_options(kastarri-profile PRIVATE $<$<COMPILE_LANGUAGE:CXX>:
  -O2 -fno-exceptions -fno-rtti -fno-threadsafe-statics -fvisibility=hidden ${KASTARRI_STACK}>)
target_link_options(kastarri-profile PRIVATE -static-libgcc -Wl,-z,text -Wl,-z,noexecstack -Wl,--no-undefined)
target_link_libraries(kastarri-profile PRIVATE pthread ${CMAKE_DL_LIBS})

kastarri_install(TARGETS kastarri-profile LIBRARY DESTINATION ${KASTARRI_PROFILE_DIR})
kastarri_install(FILES ${files}/intrinsics.csv DESTINATION ${KASTARRI_PROFILE_DIR})
kastarri_install(FILES ${PROJECT_SOURCE_DIR}/bench/costs.csv DESTINATION ${CMAKE_INSTALL_DATADIR}/kastarri)
