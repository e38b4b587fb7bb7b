# The static library: one target, without dispatch. Its integer, multiply and memory intrinsics, moves and conversions
# can be inlined into kernels at link time, by the compiler that built it. GCC's objects hold machine code besides, for
# links without; clang's are bitcode alone, so that all links have to be told of it.
# Vectors of floats can be inlined with AVX-512, where every operation is an instruction that carries its rounding.
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

if(CMAKE_CXX_COMPILER_ID STREQUAL Clang)
  set(KASTARRI_STATIC_LTO -flto=thin)
  set(KASTARRI_STATIC_CODE)
  set(KASTARRI_STATIC_LINK_FLAGS -flto=thin)
else()
  set(KASTARRI_STATIC_LTO -flto)
  set(KASTARRI_STATIC_CODE -ffat-lto-objects -Wno-attributes)
  set(KASTARRI_STATIC_LINK_FLAGS)
endif()

# A kernel is compiled for the same machine: without, nothing may be inlined into it. How wide copies are g++ alone can
# be told, and kernels gain nothing: intrinsics move whole registers.
function(kastarri_static_flags variable target)
  set(flags ${KASTARRI_FLAGS_${target}} -mfpmath=sse)
  list(FILTER flags EXCLUDE REGEX "^-m(move|store)-max=")
  set(${variable} ${flags} PARENT_SCOPE)
endfunction()

# The static library `name` for one target.
function(kastarri_static_library name target)
  set(inlined ${KASTARRI_VECTOR_SOURCES})
  if(target STREQUAL avx512)
    list(FILTER inlined EXCLUDE REGEX "/src/float/scalars.cpp$")
  else()
    list(FILTER inlined EXCLUDE REGEX "/src/float/")
  endif()
  set(called ${KASTARRI_VECTOR_SOURCES} ${KASTARRI_SCALAR_SOURCES})
  list(REMOVE_ITEM called ${inlined})
  add_library(${name}_called OBJECT ${called})
  add_library(${name} STATIC ${inlined} $<TARGET_OBJECTS:${name}_called>)
  kastarri_build_targets(${CMAKE_CURRENT_BINARY_DIR}/${name}.dir ${target})
  foreach(part IN ITEMS ${name} ${name}_called)
    kastarri_compile_library(${part})
    target_include_directories(${part} PRIVATE ${CMAKE_CURRENT_BINARY_DIR}/${name}.dir)
    target_compile_options(${part} PRIVATE ${KASTARRI_FLAGS_${target}})
  endforeach()
  kastarri_static_flags(flags ${target})
  target_compile_options(${name} INTERFACE ${flags})
  # Realigning the stack is of the options that a function and what is inlined into it have to share.
  target_compile_options(${name} PRIVATE -mno-stackrealign ${KASTARRI_STATIC_LTO} ${KASTARRI_STATIC_CODE})
  target_link_options(${name} INTERFACE ${KASTARRI_STATIC_LINK_FLAGS})
  target_compile_definitions(${name} PRIVATE KASTARRI_INLINE_ENTRIES)
endfunction()

kastarri_static_library(kastarri_static ${KASTARRI_STATIC_TARGET})
kastarri_static_flags(KASTARRI_STATIC_FLAGS ${KASTARRI_STATIC_TARGET})
add_library(kastarri::static ALIAS kastarri_static)
set_target_properties(kastarri_static PROPERTIES EXPORT_NAME static)
