# The width of the programs that the library is for, and all in the build that depends on it.
# Within another project it is that of the project's programs, if nothing is said.
set(bits 32)
if(NOT PROJECT_IS_TOP_LEVEL AND CMAKE_CXX_SIZEOF_DATA_PTR EQUAL 8)
  set(bits 64)
endif()
set(KASTARRI_BITS ${bits} CACHE STRING "Width of the programs that the library is for: 32 (i386) or 64 (x86-64)")
set_property(CACHE KASTARRI_BITS PROPERTY STRINGS 32 64)

if(KASTARRI_BITS EQUAL 32)
  set(KASTARRI_DEBIAN_ARCHITECTURE i386)
  set(KASTARRI_MULTIARCH i386-linux-gnu)
  set(KASTARRI_DEFAULT_LIBDIR lib)
  set(KASTARRI_LIBC 2.12)  # with indirect functions on 32-bit x86
  # Old programs keep the stack aligned to 4 bytes only.
  set(KASTARRI_STACK -mstackrealign)
elseif(KASTARRI_BITS EQUAL 64)
  set(KASTARRI_DEBIAN_ARCHITECTURE amd64)
  set(KASTARRI_MULTIARCH x86_64-linux-gnu)
  set(KASTARRI_DEFAULT_LIBDIR lib/${KASTARRI_MULTIARCH})  # beside the 32-bit library below the same prefix
  set(KASTARRI_LIBC 2.14)  # with today's memcpy
  set(KASTARRI_STACK)
else()
  message(FATAL_ERROR "KASTARRI_BITS is ${KASTARRI_BITS}; known are 32 and 64")
endif()
set(KASTARRI_WIDTH -m${KASTARRI_BITS})

# A library that tests and benchmarks are linked with, of this width; the compiler's default may be the other.
function(kastarri_find_library variable name)
  find_library(${variable} ${name} PATHS /usr/lib/${KASTARRI_MULTIARCH} NO_DEFAULT_PATH REQUIRED)
endfunction()
