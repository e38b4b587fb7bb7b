# The programs for users: tools/<name>.in with what the build tells it. Each knows --version and --help, from which its
# man page is made.
find_package(Python3 REQUIRED COMPONENTS Interpreter)
find_program(KASTARRI_HELP2MAN help2man)
if(NOT KASTARRI_HELP2MAN)
  message(STATUS "There is no help2man: man pages are left out")
endif()

# Where programs find data that do not depend on the width, and the same place in the build tree, which is laid out as the
# installed one.
file(RELATIVE_PATH KASTARRI_DATA ${CMAKE_INSTALL_FULL_BINDIR} ${CMAKE_INSTALL_FULL_DATADIR}/kastarri)
set(KASTARRI_BUILT_PROGRAMS ${PROJECT_BINARY_DIR}/bin)
cmake_path(ABSOLUTE_PATH KASTARRI_DATA BASE_DIRECTORY ${KASTARRI_BUILT_PROGRAMS} NORMALIZE OUTPUT_VARIABLE KASTARRI_BUILT_DATA)
file(MAKE_DIRECTORY ${KASTARRI_BUILT_DATA})

# kastarri_tool(<name> [<file that it reads for --help> ...])
function(kastarri_tool name)
  set(source ${PROJECT_SOURCE_DIR}/tools/${name}.in)
  set(program ${KASTARRI_BUILT_PROGRAMS}/${name})
  configure_file(${source} ${program} @ONLY
    FILE_PERMISSIONS OWNER_READ OWNER_WRITE OWNER_EXECUTE GROUP_READ GROUP_EXECUTE WORLD_READ WORLD_EXECUTE)
  kastarri_install(PROGRAMS ${program} DESTINATION ${CMAKE_INSTALL_BINDIR})
  # What it is for, in a line: the first of the text that --help shows.
  file(STRINGS ${source} summary REGEX "^\"\"\".*\\.$" LIMIT_COUNT 1)
  string(REGEX REPLACE "^\"\"\"(.*)\\.$" "\\1" summary "${summary}")
  kastarri_man_page(${name} ${program} "${summary}" ${ARGN})
endfunction()

# kastarri_man_page(<name> <program> <what it is for> [<file that it reads for --help> ...])
function(kastarri_man_page name program summary)
  if(NOT KASTARRI_HELP2MAN)
    return()
  endif()
  set(page ${PROJECT_BINARY_DIR}/share/man/man1/${name}.1)
  # A page bears the month of the source, not that of the build: all builds of one tree make the same page.
  set(date $ENV{SOURCE_DATE_EPOCH})
  if(NOT date)
    file(TIMESTAMP ${PROJECT_SOURCE_DIR}/tools/${name}.in date %s UTC)
  endif()
  file(MAKE_DIRECTORY ${PROJECT_BINARY_DIR}/share/man/man1)
  add_custom_command(OUTPUT ${page}
    COMMAND ${CMAKE_COMMAND} -E env PROGRAM=${program} SOURCE_DATE_EPOCH=${date} ${KASTARRI_HELP2MAN}
      --no-info --source=kastarri --name=${summary} --output=${page} ${PROJECT_SOURCE_DIR}/tools/for_help2man.sh
    DEPENDS ${program} ${ARGN} COMMENT "Writing the man page of ${name}" VERBATIM)
  add_custom_target(${name}-man ALL DEPENDS ${page})
  kastarri_install(FILES ${page} DESTINATION ${CMAKE_INSTALL_MANDIR}/man1)
endfunction()
