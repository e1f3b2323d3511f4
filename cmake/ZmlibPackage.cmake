# Installation: headers under include/zmlib, the library, a CMake package and zmlib.pc.
include(CMakePackageConfigHelpers)

install(TARGETS zmlib EXPORT zmlibTargets
  LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR}
  ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR}
  RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR})
install(FILES ${ZMLIB_PUBLIC_HEADERS} DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/zmlib)
install(EXPORT zmlibTargets NAMESPACE zmlib:: DESTINATION ${CMAKE_INSTALL_LIBDIR}/cmake/zmlib)

configure_package_config_file(${PROJECT_SOURCE_DIR}/cmake/zmlibConfig.cmake.in
  ${PROJECT_BINARY_DIR}/zmlibConfig.cmake
  INSTALL_DESTINATION ${CMAKE_INSTALL_LIBDIR}/cmake/zmlib)
write_basic_package_version_file(${PROJECT_BINARY_DIR}/zmlibConfigVersion.cmake
  COMPATIBILITY SameMajorVersion)
install(FILES ${PROJECT_BINARY_DIR}/zmlibConfig.cmake ${PROJECT_BINARY_DIR}/zmlibConfigVersion.cmake
  DESTINATION ${CMAKE_INSTALL_LIBDIR}/cmake/zmlib)

if(ZMLIB_SHARED)
  set(ZMLIB_PC_CFLAGS "")
else()
  set(ZMLIB_PC_CFLAGS "-DZMLIB_STATIC")
endif()
file(RELATIVE_PATH ZMLIB_PC_PREFIX_FROM_PCDIR "/p/${CMAKE_INSTALL_LIBDIR}/pkgconfig" "/p")
configure_file(${PROJECT_SOURCE_DIR}/cmake/zmlib.pc.in ${PROJECT_BINARY_DIR}/zmlib.pc @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/zmlib.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
