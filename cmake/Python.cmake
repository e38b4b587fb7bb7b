# The package kastarri of Python, laid out in the build tree as it is installed: modules, the extension, the library.
# KASTARRI_PYTHON is the Python that it is for, which has NumPy; that of the system goes before others.
if(NOT KASTARRI_BITS EQUAL 64)
  message(FATAL_ERROR "KASTARRI_BUILD_PYTHON needs KASTARRI_BITS=64, as wide as Python")
endif()
find_program(KASTARRI_PYTHON python3 PATHS /usr/bin NO_DEFAULT_PATH)
find_program(KASTARRI_PYTHON python3 REQUIRED)
set(Python_EXECUTABLE ${KASTARRI_PYTHON})
find_package(Python REQUIRED COMPONENTS Interpreter Development.Module NumPy)

set(source ${PROJECT_SOURCE_DIR}/python)
set(KASTARRI_PYTHON_DIR ${CMAKE_CURRENT_BINARY_DIR}/python)
set(package ${KASTARRI_PYTHON_DIR}/kastarri)
set(tools ${PROJECT_SOURCE_DIR}/tools)

set(generated ${KASTARRI_PYTHON_DIR}/rows.inc ${package}/intrinsics.py ${package}/intrinsics.pyi ${package}/__init__.pyi)
add_custom_command(OUTPUT ${generated}
  COMMAND Python::Interpreter ${source}/generate.py ${KASTARRI_PYTHON_DIR}
  DEPENDS ${source}/generate.py ${tools}/rules.py ${tools}/reference/entries.py
    ${PROJECT_SOURCE_DIR}/include/kastarri/state.h ${KASTARRI_TABLES}
  COMMENT "Writing the Python package" VERBATIM)

file(GLOB sources CONFIGURE_DEPENDS ${source}/src/*.cpp)
Python_add_library(kastarri_python MODULE WITH_SOABI ${sources} ${generated})
set_property(SOURCE ${source}/src/rows.cpp APPEND PROPERTY OBJECT_DEPENDS ${KASTARRI_PYTHON_DIR}/rows.inc)
target_include_directories(kastarri_python PRIVATE ${KASTARRI_PYTHON_DIR})
# The headers of Python and NumPy are not ours to warn of.
get_target_property(numpy Python::NumPy INTERFACE_INCLUDE_DIRECTORIES)
target_include_directories(kastarri_python SYSTEM PRIVATE ${numpy} ${Python_INCLUDE_DIRS})
target_compile_options(kastarri_python PRIVATE -O3 -fvisibility=hidden)
target_link_libraries(kastarri_python PRIVATE kastarri)
set_target_properties(kastarri_python PROPERTIES OUTPUT_NAME _core LIBRARY_OUTPUT_DIRECTORY ${package}
  INSTALL_RPATH "$ORIGIN")

file(GLOB modules CONFIGURE_DEPENDS RELATIVE ${source}/kastarri ${source}/kastarri/*.py ${source}/kastarri/*.pyi
  ${source}/kastarri/py.typed)
foreach(module IN LISTS modules)
  configure_file(${source}/kastarri/${module} ${package}/${module} COPYONLY)
  list(APPEND generated ${package}/${module})
endforeach()

# For a wheel: the package with the library in it. Nothing else installs this component.
list(FILTER generated EXCLUDE REGEX "rows\.inc$")
install(FILES ${generated} DESTINATION kastarri COMPONENT python EXCLUDE_FROM_ALL)
install(TARGETS kastarri_python LIBRARY DESTINATION kastarri COMPONENT python EXCLUDE_FROM_ALL)
install(FILES $<TARGET_FILE:kastarri> RENAME $<TARGET_SONAME_FILE_NAME:kastarri> DESTINATION kastarri COMPONENT python EXCLUDE_FROM_ALL)
