# The static library: one target, without dispatch. With GCC its integer, multiply and memory intrinsics, moves
# and conversions can be inlined into kernels at link time; the objects hold machine code besides, for links without.
# So can vectors of floats with AVX-512, where every operation is an instruction that carries its rounding.
#
# Floats of the other targets and the scalar core stay calls. How the compiler may treat floating-point arithmetic is up
# to the flags of the function that it is inlined into, and the rules of those targets count on theirs. The core finds
# its state in assembler statements, which the optimiser at link time does not read.
if(NOT KASTARRI_STATIC_TARGET IN_LIST KASTARRI_KNOWN_TARGETS)
  message(FATAL_ERROR
    "KASTARRI_STATIC_TARGET: unknown target '${KASTARRI_STATIC_TARGET}'; known are ${KASTARRI_KNOWN_TARGETS}")
endif()
if(KASTARRI_SANITIZE)
  message(FATAL_ERROR "KASTARRI_BUILD_STATIC: the static library is not built with sanitizers")
endif()

set(inlined ${KASTARRI_VECTOR_SOURCES})
if(KASTARRI_STATIC_TARGET STREQUAL avx512)
  list(FILTER inlined EXCLUDE REGEX "/src/float/scalars.cpp$")
else()
  list(FILTER inlined EXCLUDE REGEX "/src/float/")
endif()
set(called ${KASTARRI_VECTOR_SOURCES} ${KASTARRI_SCALAR_SOURCES})
list(REMOVE_ITEM called ${inlined})

add_library(kastarri_static_called OBJECT ${called})
add_library(kastarri_static STATIC ${inlined} $<TARGET_OBJECTS:kastarri_static_called>)
add_library(kastarri::static ALIAS kastarri_static)
set_target_properties(kastarri_static PROPERTIES EXPORT_NAME static)

kastarri_build_targets(${CMAKE_CURRENT_BINARY_DIR}/kastarri_static.dir ${KASTARRI_STATIC_TARGET})
foreach(target IN ITEMS kastarri_static kastarri_static_called)
  kastarri_compile_library(${target})
  target_include_directories(${target} PRIVATE ${CMAKE_CURRENT_BINARY_DIR}/kastarri_static.dir)
  target_compile_options(${target} PRIVATE ${KASTARRI_FLAGS_${KASTARRI_STATIC_TARGET}})
endforeach()

# A kernel is compiled for the same machine: without, nothing may be inlined into it.
set(KASTARRI_STATIC_FLAGS ${KASTARRI_FLAGS_${KASTARRI_STATIC_TARGET}} -mfpmath=sse)
# Those that every compiler has; only g++ knows how wide copies may be.
set(KASTARRI_STATIC_COMMON_FLAGS ${KASTARRI_STATIC_FLAGS})
list(FILTER KASTARRI_STATIC_COMMON_FLAGS EXCLUDE REGEX "^-m(move|store)-max=")
set(gnu_flags ${KASTARRI_STATIC_FLAGS})
list(REMOVE_ITEM gnu_flags ${KASTARRI_STATIC_COMMON_FLAGS})
target_compile_options(kastarri_static INTERFACE ${KASTARRI_STATIC_COMMON_FLAGS} "$<$<CXX_COMPILER_ID:GNU>:${gnu_flags}>")

if(CMAKE_CXX_COMPILER_ID STREQUAL GNU)
  # Realigning the stack is of the options that a function and what is inlined into it have to share.
  target_compile_options(kastarri_static PRIVATE -flto -ffat-lto-objects -mno-stackrealign -Wno-attributes)
  target_compile_definitions(kastarri_static PRIVATE KASTARRI_INLINE_ENTRIES)
endif()
