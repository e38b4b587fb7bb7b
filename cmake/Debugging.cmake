# The printers for gdb: a script that gdb loads with the library beside which it lies, and its modules. The
# build tree is laid out as the installed one.
set(script libkastarri.so.${PROJECT_VERSION}-gdb.py)
set(modules kastarri_printers.py kastarri_register_types.py)

configure_file(${PROJECT_SOURCE_DIR}/src/debug/auto_load.py ${CMAKE_CURRENT_BINARY_DIR}/${script} COPYONLY)
foreach(module IN LISTS modules)
  configure_file(${PROJECT_SOURCE_DIR}/src/debug/gdb/${module} ${CMAKE_CURRENT_BINARY_DIR}/kastarri/gdb/${module} COPYONLY)
endforeach()

# Where the script goes depends on the prefix, which is known when it is installed.
configure_file(${PROJECT_SOURCE_DIR}/cmake/install_printers.cmake.in install_printers.cmake @ONLY)
kastarri_install(SCRIPT ${CMAKE_CURRENT_BINARY_DIR}/install_printers.cmake)
kastarri_install(DIRECTORY ${CMAKE_CURRENT_BINARY_DIR}/kastarri/gdb DESTINATION ${CMAKE_INSTALL_LIBDIR}/kastarri FILES_MATCHING PATTERN "*.py")
