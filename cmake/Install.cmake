# What is installed, and how other projects find it: a CMake package and pkg-config files. Every rule goes through
# kastarri_install, which is install() where this project is to be installed.
#
# Two components: `runtime` is the library that programs load; all the rest is `devel`, which is also
# the component of every rule that names none.
set(CMAKE_INSTALL_DEFAULT_COMPONENT_NAME devel)

# Debian's multiarch directory would be that of the compiler's default, 64 bits. Within another project it is the project
# that says where libraries go.
if(PROJECT_IS_TOP_LEVEL)
  set(CMAKE_INSTALL_LIBDIR ${KASTARRI_DEFAULT_LIBDIR} CACHE STRING "Where libraries go, below the prefix")
endif()
include(GNUInstallDirs)
foreach(directory IN ITEMS CMAKE_INSTALL_LIBDIR CMAKE_INSTALL_INCLUDEDIR)
  if(IS_ABSOLUTE "${${directory}}")
    message(FATAL_ERROR "${directory} must be relative to the prefix, so that what is installed can be moved")
  endif()
endforeach()

# The files of CMake and pkg-config lie with the library of a width. Those of the 32-bit one lie where both look
# whatever they build for: who says nothing of a width finds it, unless there is one for the compiler's own. The
# pkg-config of another architecture looks among the libraries alone.
set(KASTARRI_CMAKE_DIR ${CMAKE_INSTALL_LIBDIR}/cmake/kastarri)
set(KASTARRI_PKGCONFIG_DIRS ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
if(KASTARRI_BITS EQUAL 32)
  set(KASTARRI_CMAKE_DIR lib/cmake/kastarri)
  list(APPEND KASTARRI_PKGCONFIG_DIRS lib/pkgconfig)
  list(REMOVE_DUPLICATES KASTARRI_PKGCONFIG_DIRS)
endif()

function(kastarri_install)
  if(KASTARRI_INSTALL)
    install(${ARGV})
  endif()
endfunction()

# Headers, and the documents in the places from which they name each other.
set(KASTARRI_DOCUMENTS ${CMAKE_INSTALL_DATAROOTDIR}/doc/kastarri)
kastarri_install(DIRECTORY ${PROJECT_SOURCE_DIR}/include/ DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})
kastarri_install(DIRECTORY ${PROJECT_SOURCE_DIR}/docs ${PROJECT_SOURCE_DIR}/examples DESTINATION ${KASTARRI_DOCUMENTS})
kastarri_install(FILES ${PROJECT_SOURCE_DIR}/README.md ${PROJECT_SOURCE_DIR}/CHANGELOG.md DESTINATION ${KASTARRI_DOCUMENTS})

# kastarri_install_library(<target> <component of find_package> <file of pkg-config> <library> [<flag> ...])
function(kastarri_install_library target component module library)
  kastarri_install(TARGETS ${target} EXPORT kastarri-${component}
    ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR}
    LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR} COMPONENT runtime NAMELINK_COMPONENT devel
    INCLUDES DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})
  kastarri_install(EXPORT kastarri-${component} NAMESPACE kastarri:: DESTINATION ${KASTARRI_CMAKE_DIR})
  list(JOIN ARGN " " flags)
  get_target_property(link_flags ${target} INTERFACE_LINK_OPTIONS)
  list(JOIN link_flags " " link_flags)
  foreach(directory IN LISTS KASTARRI_PKGCONFIG_DIRS)
    file(RELATIVE_PATH to_prefix /prefix/${directory} /prefix)
    configure_file(${PROJECT_SOURCE_DIR}/cmake/kastarri.pc.in ${directory}/${module}.pc @ONLY)
    kastarri_install(FILES ${CMAKE_CURRENT_BINARY_DIR}/${directory}/${module}.pc DESTINATION ${directory})
  endforeach()
endfunction()

kastarri_install_library(kastarri shared kastarri kastarri ${KASTARRI_USER_FLAGS})
if(KASTARRI_BUILD_STATIC)
  kastarri_install_library(kastarri_static static kastarri-static kastarri_static ${KASTARRI_STATIC_FLAGS})
endif()

# By the rules of semantic versioning, before 1.0.0 a new minor version may break what was.
if(PROJECT_VERSION_MAJOR EQUAL 0)
  set(compatibility SameMinorVersion)
else()
  set(compatibility SameMajorVersion)
endif()
include(CMakePackageConfigHelpers)
# Independent of the architecture as far as CMake knows it: a width that the library is not for is its own matter.
write_basic_package_version_file(kastarri-version.cmake COMPATIBILITY ${compatibility} ARCH_INDEPENDENT)
kastarri_install(FILES ${CMAKE_CURRENT_BINARY_DIR}/kastarri-version.cmake DESTINATION ${KASTARRI_CMAKE_DIR})
foreach(file IN ITEMS kastarri-config.cmake kastarri-config-version.cmake)
  configure_file(${PROJECT_SOURCE_DIR}/cmake/${file}.in ${file} @ONLY)
  kastarri_install(FILES ${CMAKE_CURRENT_BINARY_DIR}/${file} DESTINATION ${KASTARRI_CMAKE_DIR})
endforeach()
