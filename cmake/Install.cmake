# What is installed, and how other projects find it: a CMake package and pkg-config files.
#
# Two components: `runtime` is the library that programs load; all the rest is `devel`, which is also
# the component of every rule that names none.
set(CMAKE_INSTALL_DEFAULT_COMPONENT_NAME devel)

# Debian's multiarch directory would be that of the compiler's default, 64 bits.
set(CMAKE_INSTALL_LIBDIR lib CACHE STRING "Where libraries go, below the prefix")
include(GNUInstallDirs)
foreach(directory IN ITEMS CMAKE_INSTALL_LIBDIR CMAKE_INSTALL_INCLUDEDIR)
  if(IS_ABSOLUTE "${${directory}}")
    message(FATAL_ERROR "${directory} must be relative to the prefix, so that what is installed can be moved")
  endif()
endforeach()

# Where CMake and pkg-config look whatever the architecture they look for: who forgets that the library is
# 32-bit, or sets it later, finds it nevertheless.
set(KASTARRI_CMAKE_DIR lib/cmake/kastarri)
set(KASTARRI_PKGCONFIG_DIR lib/pkgconfig)

install(DIRECTORY ${PROJECT_SOURCE_DIR}/include/ DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})

# kastarri_install(<target> <component of find_package> <file of pkg-config> <library> [<flag> ...])
function(kastarri_install target component module library)
  install(TARGETS ${target} EXPORT kastarri-${component}
    ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR}
    LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR} COMPONENT runtime NAMELINK_COMPONENT devel
    INCLUDES DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})
  install(EXPORT kastarri-${component} NAMESPACE kastarri:: DESTINATION ${KASTARRI_CMAKE_DIR})
  list(JOIN ARGN " " flags)
  configure_file(${PROJECT_SOURCE_DIR}/cmake/kastarri.pc.in ${module}.pc @ONLY)
  install(FILES ${CMAKE_CURRENT_BINARY_DIR}/${module}.pc DESTINATION ${KASTARRI_PKGCONFIG_DIR})
endfunction()

kastarri_install(kastarri shared kastarri kastarri ${KASTARRI_USER_FLAGS})
if(KASTARRI_BUILD_STATIC)
  kastarri_install(kastarri_static static kastarri-static kastarri_static ${KASTARRI_STATIC_FLAGS})
endif()

# By the rules of semantic versioning, before 1.0.0 a new minor version may break what was.
if(PROJECT_VERSION_MAJOR EQUAL 0)
  set(compatibility SameMinorVersion)
else()
  set(compatibility SameMajorVersion)
endif()
include(CMakePackageConfigHelpers)
# Independent of the architecture: what the compiler has to be able to do is tested in kastarri-config.cmake.
write_basic_package_version_file(kastarri-config-version.cmake COMPATIBILITY ${compatibility} ARCH_INDEPENDENT)
install(FILES ${PROJECT_SOURCE_DIR}/cmake/kastarri-config.cmake
  ${CMAKE_CURRENT_BINARY_DIR}/kastarri-config-version.cmake DESTINATION ${KASTARRI_CMAKE_DIR})
