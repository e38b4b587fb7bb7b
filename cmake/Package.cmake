# Archives that can be unpacked anywhere (cpack -G TGZ), and Debian packages, as Debian divides libraries: libkastarri<major> with what programs load, which other major
# versions can stand beside, and libkastarri-dev with all that programs are made with.
set(KASTARRI_MAINTAINER "The kastarri authors <maintainers@kastarri.invalid>" CACHE STRING "Maintainer of the packages")

set(runtime_package libkastarri${PROJECT_VERSION_MAJOR})
set(devel_package libkastarri-dev)
find_program(KASTARRI_GZIP gzip REQUIRED)
execute_process(COMMAND ${KASTARRI_GZIP} -9nc ${PROJECT_SOURCE_DIR}/CHANGELOG.md
  OUTPUT_FILE ${CMAKE_CURRENT_BINARY_DIR}/changelog.gz COMMAND_ERROR_IS_FATAL ANY)
foreach(component IN ITEMS runtime devel)
  set(documents ${CMAKE_INSTALL_DATAROOTDIR}/doc/${${component}_package})
  kastarri_install(FILES ${PROJECT_SOURCE_DIR}/LICENSE RENAME copyright DESTINATION ${documents} COMPONENT ${component})
  kastarri_install(FILES ${CMAKE_CURRENT_BINARY_DIR}/changelog.gz DESTINATION ${documents} COMPONENT ${component})
endforeach()

# The loader's cache is renewed, and other packages learn what to depend on.
file(CONFIGURE OUTPUT package/triggers CONTENT "activate-noawait ldconfig\n")
file(CONFIGURE OUTPUT package/shlibs CONTENT
  "libkastarri ${PROJECT_VERSION_MAJOR} ${runtime_package} (>= ${PROJECT_VERSION})\n")

set(CPACK_GENERATOR DEB)
set(CPACK_PACKAGE_FILE_NAME kastarri-${PROJECT_VERSION}-linux-${KASTARRI_DEBIAN_ARCHITECTURE})
set(CPACK_PACKAGE_CONTACT ${KASTARRI_MAINTAINER})
set(CPACK_COMPONENTS_ALL runtime devel)
set(CPACK_DEB_COMPONENT_INSTALL ON)
set(CPACK_STRIP_FILES ON)
set(CPACK_INSTALL_DEFAULT_DIRECTORY_PERMISSIONS
  OWNER_READ OWNER_WRITE OWNER_EXECUTE GROUP_READ GROUP_EXECUTE WORLD_READ WORLD_EXECUTE)
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_PACKAGE_ARCHITECTURE ${KASTARRI_DEBIAN_ARCHITECTURE})
set(CPACK_DEBIAN_PACKAGE_CONTROL_STRICT_PERMISSION TRUE)

# Packages of both widths stand beside each other: what they have in common is the same file. CPack knows no
# such field before CMake 3.31; it writes what follows the section as it is.
set(beside_the_other "\nMulti-Arch: same")

set(what "Every intrinsic of one DSP core, with its 512-bit vectors, accumulators,
predicates and floats, bit for bit, for programs on the PC.")
set(CPACK_DEBIAN_RUNTIME_PACKAGE_NAME ${runtime_package})
set(CPACK_DEBIAN_RUNTIME_PACKAGE_SECTION libs${beside_the_other})
set(CPACK_DEBIAN_RUNTIME_PACKAGE_DEPENDS "libc6 (>= ${KASTARRI_LIBC})")
set(CPACK_DEBIAN_RUNTIME_PACKAGE_CONTROL_EXTRA
  ${CMAKE_CURRENT_BINARY_DIR}/package/triggers ${CMAKE_CURRENT_BINARY_DIR}/package/shlibs)
set(CPACK_DEBIAN_RUNTIME_DESCRIPTION "intrinsics of a DSP core as a library\n${what}\n.
This package has the shared library, which programs need to run.")
set(CPACK_DEBIAN_DEVEL_PACKAGE_NAME ${devel_package})
set(CPACK_DEBIAN_DEVEL_PACKAGE_SECTION libdevel${beside_the_other})
# For kastarri-profile: any Python will do, of whichever architecture; its counting library needs a newer libc.
set(CPACK_DEBIAN_DEVEL_PACKAGE_DEPENDS "${runtime_package} (= ${PROJECT_VERSION}), libc6 (>= 2.34), python3:any")
set(CPACK_DEBIAN_DEVEL_DESCRIPTION "intrinsics of a DSP core as a library (development)\n${what}\n.
This package has what programs are made with: headers, libraries to link, files for
CMake and pkg-config, printers for gdb, the profiler, the checker of kernels and the reference page.")
include(CPack)
