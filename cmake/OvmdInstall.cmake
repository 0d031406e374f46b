# What `cmake --install` puts in place: the library, its headers with the framework's, a CMake
# package (find_package(ovmd), target ovmd::ovmd) and a pkg-config file (ovmd).

include(CMakePackageConfigHelpers)

set(package_dir ${CMAKE_INSTALL_LIBDIR}/cmake/ovmd)
set(package_build_dir ${CMAKE_CURRENT_BINARY_DIR}/package)

install(TARGETS ovmd EXPORT ovmd-targets LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR})
install(DIRECTORY ${PROJECT_SOURCE_DIR}/include/orvale ${PROJECT_SOURCE_DIR}/framework
  DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/ovmd FILES_MATCHING PATTERN "*.h")
install(EXPORT ovmd-targets NAMESPACE ovmd:: DESTINATION ${package_dir})

configure_package_config_file(${PROJECT_SOURCE_DIR}/cmake/ovmd-config.cmake.in
  ${package_build_dir}/ovmd-config.cmake INSTALL_DESTINATION ${package_dir})
write_basic_package_version_file(${package_build_dir}/ovmd-config-version.cmake
  COMPATIBILITY SameMajorVersion)
install(FILES ${package_build_dir}/ovmd-config.cmake ${package_build_dir}/ovmd-config-version.cmake
  DESTINATION ${package_dir})

# Told from where the file stands, so that an installed tree can be moved; folders that were given as
# absolute paths are no part of the tree and stay where they are.
if(IS_ABSOLUTE ${CMAKE_INSTALL_LIBDIR})
  set(pkgconfig_prefix ${CMAKE_INSTALL_PREFIX})
else()
  file(RELATIVE_PATH prefix_from_pkgconfig /${CMAKE_INSTALL_LIBDIR}/pkgconfig /)
  set(pkgconfig_prefix "\${pcfiledir}/${prefix_from_pkgconfig}")
endif()
foreach(name libdir includedir)
  string(TOUPPER CMAKE_INSTALL_${name} folder)
  set(pkgconfig_${name} "\${prefix}")
  cmake_path(APPEND pkgconfig_${name} ${${folder}})
endforeach()
configure_file(${PROJECT_SOURCE_DIR}/cmake/ovmd.pc.in ${package_build_dir}/ovmd.pc @ONLY)
install(FILES ${package_build_dir}/ovmd.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
