# The reference of all intrinsics as one page: tools/reference/build.py makes it from the rows and from worked
# examples, which this library computes.
find_package(Python3 REQUIRED COMPONENTS Interpreter)
set(KASTARRI_REFERENCE_TOOLS ${PROJECT_SOURCE_DIR}/tools/reference)

add_executable(kastarri_examples
  ${KASTARRI_REFERENCE_TOOLS}/worked_examples.cpp ${KASTARRI_REFERENCE_TOOLS}/calls.cpp ${KASTARRI_REFERENCE_TOOLS}/operands.cpp
  ${PROJECT_SOURCE_DIR}/tests/support/registers.cpp)
target_include_directories(kastarri_examples PRIVATE
  ${KASTARRI_REFERENCE_TOOLS} ${PROJECT_SOURCE_DIR}/tests ${PROJECT_SOURCE_DIR}/src)
target_compile_options(kastarri_examples PRIVATE -msse2 -mfpmath=sse -O0)
target_link_libraries(kastarri_examples PRIVATE kastarri)

set(KASTARRI_REFERENCE ${PROJECT_BINARY_DIR}/reference.html)
file(GLOB sources CONFIGURE_DEPENDS
  ${KASTARRI_REFERENCE_TOOLS}/*.py ${KASTARRI_REFERENCE_TOOLS}/*.html ${KASTARRI_REFERENCE_TOOLS}/*.js ${KASTARRI_REFERENCE_TOOLS}/page.css)
add_custom_command(OUTPUT ${KASTARRI_REFERENCE}
  COMMAND kastarri_examples > worked_examples.json
  COMMAND Python3::Interpreter ${KASTARRI_REFERENCE_TOOLS}/build.py worked_examples.json ${KASTARRI_REFERENCE}
    --version ${PROJECT_VERSION}
  DEPENDS kastarri_examples ${sources} ${KASTARRI_TABLES}
    ${PROJECT_SOURCE_DIR}/tools/not_built.py ${PROJECT_SOURCE_DIR}/tools/rules.py
    ${PROJECT_SOURCE_DIR}/docs/choices.md ${PROJECT_SOURCE_DIR}/bench/costs.csv
  COMMENT "Writing the reference of all intrinsics"
  VERBATIM)
add_custom_target(reference ALL DEPENDS ${KASTARRI_REFERENCE})
kastarri_install(FILES ${KASTARRI_REFERENCE} DESTINATION ${KASTARRI_DOCUMENTS})
