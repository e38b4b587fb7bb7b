# kastarri-check: the checking library and the program that loads it before another, laid out as the profiler's, whose
# list of intrinsics it has.
set(KASTARRI_CHECK_DIR lib/kastarri/check)
file(RELATIVE_PATH KASTARRI_CHECK_FILES ${CMAKE_INSTALL_FULL_BINDIR} ${CMAKE_INSTALL_PREFIX}/${KASTARRI_CHECK_DIR})
cmake_path(ABSOLUTE_PATH KASTARRI_CHECK_FILES BASE_DIRECTORY ${KASTARRI_BUILT_PROGRAMS} NORMALIZE OUTPUT_VARIABLE files)
kastarri_tool(kastarri-check)

set(source ${PROJECT_SOURCE_DIR}/src/check)
get_target_property(listed kastarri-profile LIBRARY_OUTPUT_DIRECTORY)
add_library(kastarri-check MODULE ${source}/check.cpp ${source}/report.cpp)
add_dependencies(kastarri-check kastarri-profile)
set_property(SOURCE ${source}/report.cpp APPEND PROPERTY OBJECT_DEPENDS ${listed}/intrinsics.inc)
set_target_properties(kastarri-check PROPERTIES LIBRARY_OUTPUT_DIRECTORY ${files}/${KASTARRI_BITS} LINKER_LANGUAGE C)
target_include_directories(kastarri-check PRIVATE ${PROJECT_SOURCE_DIR}/src ${PROJECT_SOURCE_DIR}/include ${listed})
target_compile_definitions(kastarri-check PRIVATE KASTARRI_SONAME="libkastarri.so.${PROJECT_VERSION_MAJOR}")
target_compile_options(kastarri-check PRIVATE -O1 -msse2 -mfpmath=sse -fno-exceptions -fno-rtti -fno-threadsafe-statics
  -fasynchronous-unwind-tables -fvisibility=hidden ${KASTARRI_STACK})
target_link_options(kastarri-check PRIVATE -static-libgcc -Wl,-z,text -Wl,-z,noexecstack -Wl,--no-undefined)
target_link_libraries(kastarri-check PRIVATE ${CMAKE_DL_LIBS})

kastarri_install(TARGETS kastarri-check LIBRARY DESTINATION ${KASTARRI_CHECK_DIR}/${KASTARRI_BITS})
