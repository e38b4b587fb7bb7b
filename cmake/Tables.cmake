# The tables of rows, the shapes and kinds of row that they are read with, and what reads them: the files that every
# generated one depends on.
file(GLOB KASTARRI_TABLES CONFIGURE_DEPENDS ${PROJECT_SOURCE_DIR}/src/*.def ${PROJECT_SOURCE_DIR}/src/*/*.def
  ${PROJECT_SOURCE_DIR}/src/*/*shapes.h ${PROJECT_SOURCE_DIR}/src/*/row_kinds.h ${PROJECT_SOURCE_DIR}/src/frame/host_ints.h
  ${PROJECT_SOURCE_DIR}/tools/generate_headers.py ${PROJECT_SOURCE_DIR}/tools/read_tables.py)
