# Installation: library, headers, CMake package (krCoreLib::krCoreLib) and a
# pkg-config file.
include(CMakePackageConfigHelpers)

install(TARGETS krCoreLib EXPORT krCoreLibTargets
  LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR}
  ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR}
  RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR}
  INCLUDES DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})
install(DIRECTORY ${PROJECT_SOURCE_DIR}/include/krCoreLib ${PROJECT_SOURCE_DIR}/platform/include/krCoreLib
  DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}
  FILES_MATCHING PATTERN "*.h")

set(KR_CMAKE_DIR ${CMAKE_INSTALL_LIBDIR}/cmake/krCoreLib)
install(EXPORT krCoreLibTargets NAMESPACE krCoreLib:: DESTINATION ${KR_CMAKE_DIR})
configure_package_config_file(${PROJECT_SOURCE_DIR}/cmake/krCoreLibConfig.cmake.in
  ${PROJECT_BINARY_DIR}/krCoreLibConfig.cmake INSTALL_DESTINATION ${KR_CMAKE_DIR})
write_basic_package_version_file(${PROJECT_BINARY_DIR}/krCoreLibConfigVersion.cmake
  COMPATIBILITY SameMajorVersion)
install(FILES ${PROJECT_BINARY_DIR}/krCoreLibConfig.cmake ${PROJECT_BINARY_DIR}/krCoreLibConfigVersion.cmake
  DESTINATION ${KR_CMAKE_DIR})

# The .pc file finds the prefix relative to its own folder, so the installed
# tree can be moved (cmake --install --prefix anywhere).
file(RELATIVE_PATH KR_PC_PREFIX_FROM_PCDIR "/root/${CMAKE_INSTALL_LIBDIR}/pkgconfig" "/root")
configure_file(${PROJECT_SOURCE_DIR}/cmake/krCoreLib.pc.in ${PROJECT_BINARY_DIR}/krCoreLib.pc @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/krCoreLib.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
