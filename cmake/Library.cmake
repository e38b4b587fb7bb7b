# The library. Vector families are compiled once a target, the scalar core once.

set(KASTARRI_FLAGS_sse2 -msse2)
set(KASTARRI_FLAGS_avx2 -mavx2 -mfma -mf16c)
set(KASTARRI_FLAGS_avx512 -mavx512f -mavx512bw -mavx512dq -mavx512vl -mfma -mf16c -mprefer-vector-width=512)
if(CMAKE_CXX_COMPILER_ID STREQUAL GNU)
  # A register is stored in pieces as wide as those in which the next intrinsic loads it: narrower ones
  # would not forward from the store to the load.
  list(APPEND KASTARRI_FLAGS_avx2 -mmove-max=256 -mstore-max=256)
  list(APPEND KASTARRI_FLAGS_avx512 -mmove-max=512 -mstore-max=512)
endif()
set(KASTARRI_KNOWN_TARGETS avx512 avx2 sse2)  # best first

# What a program that uses the library is compiled with, beside its width. Without SSE2, which a 32-bit one may lack, g++
# copies a register in pieces that no vector load is forwarded from, and scalar floats go through the x87.
set(KASTARRI_USER_FLAGS -msse2 -mfpmath=sse)

# A source of a vector family is compiled for every target, and so are the conversions, which move whole
# registers; the rest of the frame and the scalar core are compiled once.
file(GLOB KASTARRI_VECTOR_SOURCES CONFIGURE_DEPENDS
  ${PROJECT_SOURCE_DIR}/src/integer/*.cpp ${PROJECT_SOURCE_DIR}/src/memory/*.cpp
  ${PROJECT_SOURCE_DIR}/src/multiply/*.cpp ${PROJECT_SOURCE_DIR}/src/float/*.cpp)
list(APPEND KASTARRI_VECTOR_SOURCES ${PROJECT_SOURCE_DIR}/src/frame/conversions.cpp)
# Floats are written in registers already. g++ would join two pointers that are kept side by side to one vector, stored
# in halves and loaded whole, which is not forwarded: in 64-bit programs a predicated operation waited for it.
if(CMAKE_CXX_COMPILER_ID STREQUAL GNU)
  file(GLOB float_sources ${PROJECT_SOURCE_DIR}/src/float/*.cpp)
  set_source_files_properties(${float_sources} PROPERTIES COMPILE_OPTIONS -fno-tree-slp-vectorize)
endif()
# Tables, and what families export beside their intrinsics, once too.
file(GLOB KASTARRI_SCALAR_SOURCES CONFIGURE_DEPENDS ${PROJECT_SOURCE_DIR}/src/scalar/*.cpp
  ${PROJECT_SOURCE_DIR}/src/tables/*.cpp ${PROJECT_SOURCE_DIR}/src/*/helpers/*.cpp)
list(APPEND KASTARRI_SCALAR_SOURCES ${PROJECT_SOURCE_DIR}/src/frame/library.cpp ${PROJECT_SOURCE_DIR}/src/frame/failure.cpp)

foreach(target IN LISTS KASTARRI_TARGETS)
  if(NOT target IN_LIST KASTARRI_KNOWN_TARGETS)
    message(FATAL_ERROR "KASTARRI_TARGETS: unknown target '${target}'; known are ${KASTARRI_KNOWN_TARGETS}")
  endif()
endforeach()
list(LENGTH KASTARRI_TARGETS KASTARRI_TARGET_COUNT)
if(KASTARRI_TARGET_COUNT EQUAL 0)
  message(FATAL_ERROR "KASTARRI_TARGETS is empty; known are ${KASTARRI_KNOWN_TARGETS}")
endif()
if(KASTARRI_SANITIZE AND KASTARRI_TARGET_COUNT GREATER 1)
  message(FATAL_ERROR "KASTARRI_SANITIZE needs a single target in KASTARRI_TARGETS")
endif()

# What every source of the library is compiled with. clang unrolls a loop over few lanes before it looks for vectors, and
# then finds none: it is to unroll what has been made of vectors, up to the four of 128 bits that a register takes. And
# where the first lane that a loop loads has just been stored it takes that load out of the loop, whose other lanes then
# fill no vectors.
function(kastarri_compile_library target)
  target_include_directories(${target} PRIVATE ${PROJECT_SOURCE_DIR}/src)
  target_include_directories(${target} PUBLIC $<BUILD_INTERFACE:${PROJECT_SOURCE_DIR}/include>)
  target_compile_options(${target} PRIVATE
    -O3 -mfpmath=sse -ffp-contract=off -fno-exceptions -fno-rtti -fno-threadsafe-statics
    -fvisibility=hidden -mno-mmx ${KASTARRI_STACK} -Wconversion -Wmissing-declarations -Wno-psabi
    "$<$<CXX_COMPILER_ID:Clang>:-Wmissing-prototypes;SHELL:-mllvm -unroll-full-max-count=4;SHELL:-mllvm -enable-load-in-loop-pre=false>")
  target_compile_options(${target} INTERFACE ${KASTARRI_WIDTH} ${KASTARRI_USER_FLAGS})
  target_link_options(${target} INTERFACE ${KASTARRI_WIDTH})
  set_target_properties(${target} PROPERTIES POSITION_INDEPENDENT_CODE ON)
endfunction()

# The header that tells the sources which targets there are, best first: KASTARRI_FOR_TARGETS(X, ...)
# is X(target, ...) for each.
function(kastarri_build_targets directory)
  set(calls "")
  foreach(target IN LISTS KASTARRI_KNOWN_TARGETS)
    if(target IN_LIST ARGN)
      string(APPEND calls " X(${target}, __VA_ARGS__)")
    endif()
  endforeach()
  file(CONFIGURE OUTPUT ${directory}/build_targets.h CONTENT
    "#define KASTARRI_FOR_TARGETS(X, ...)${calls}\n")
endfunction()

# A shared library kastarri for the given targets, dispatching between them even if there is one only.
# Objects of the targets are shared by all such libraries.
function(kastarri_dispatching_library name)
  set(directory ${CMAKE_CURRENT_BINARY_DIR}/${name}.dir)
  kastarri_build_targets(${directory} ${ARGN})
  add_library(${name} SHARED ${KASTARRI_SCALAR_SOURCES} ${PROJECT_SOURCE_DIR}/src/frame/dispatch.cpp)
  foreach(target IN LISTS ARGN)
    target_sources(${name} PRIVATE $<TARGET_OBJECTS:kastarri_${target}>)
  endforeach()
  kastarri_finish_library(${name} ${directory})
  target_compile_options(${name} PRIVATE -msse2)
endfunction()

function(kastarri_finish_library name directory)
  kastarri_compile_library(${name})
  target_include_directories(${name} PRIVATE ${directory})
  set_target_properties(${name} PROPERTIES
    OUTPUT_NAME kastarri VERSION ${PROJECT_VERSION} SOVERSION ${PROJECT_VERSION_MAJOR}
    LINK_DEPENDS ${PROJECT_SOURCE_DIR}/cmake/exports.map)
  target_link_options(${name} PRIVATE
    -Wl,--version-script=${PROJECT_SOURCE_DIR}/cmake/exports.map -Wl,-z,text -Wl,-z,noexecstack)
  if(NOT KASTARRI_SANITIZE)
    # Nothing but libc at run time: no C++ library, and the compiler's own helpers from its archive.
    set_target_properties(${name} PROPERTIES LINKER_LANGUAGE C)
    target_link_options(${name} PRIVATE -static-libgcc -Wl,--as-needed -Wl,--no-undefined)
  endif()
endfunction()

if(KASTARRI_TARGET_COUNT GREATER 1)
  foreach(target IN LISTS KASTARRI_TARGETS)
    add_library(kastarri_${target} OBJECT ${KASTARRI_VECTOR_SOURCES})
    kastarri_compile_library(kastarri_${target})
    # Only dispatch.cpp and a build for one target define what the public headers declare.
    target_compile_options(kastarri_${target} PRIVATE ${KASTARRI_FLAGS_${target}} -Wno-missing-declarations
      $<$<CXX_COMPILER_ID:Clang>:-Wno-missing-prototypes>)
    target_compile_definitions(kastarri_${target} PRIVATE KASTARRI_NAMESPACE=kastarri_${target})
  endforeach()
  kastarri_dispatching_library(kastarri ${KASTARRI_TARGETS})
else()
  kastarri_build_targets(${CMAKE_CURRENT_BINARY_DIR}/kastarri.dir ${KASTARRI_TARGETS})
  add_library(kastarri SHARED ${KASTARRI_SCALAR_SOURCES} ${KASTARRI_VECTOR_SOURCES})
  kastarri_finish_library(kastarri ${CMAKE_CURRENT_BINARY_DIR}/kastarri.dir)
  target_compile_options(kastarri PRIVATE ${KASTARRI_FLAGS_${KASTARRI_TARGETS}})
endif()
add_library(kastarri::kastarri ALIAS kastarri)

if(KASTARRI_BUILD_STATIC)
  include(${CMAKE_CURRENT_LIST_DIR}/Static.cmake)
endif()
