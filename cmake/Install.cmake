include(CMakePackageConfigHelpers)

install(TARGETS cimage64 varnoth64 EXPORT Varnoth64Targets
  LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR}
  ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR}
  RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR}
  INCLUDES DESTINATION ${VARNOTH_INCLUDE_INSTALL_DIR})
install(FILES Varnoth64.h DESTINATION ${VARNOTH_INCLUDE_INSTALL_DIR})
foreach(dir imagelib frame pyramid holograms channels geometry coding)
  install(DIRECTORY ${dir}/ DESTINATION ${VARNOTH_INCLUDE_INSTALL_DIR}/${dir}
    FILES_MATCHING PATTERN "*.h" PATTERN "*Internal*" EXCLUDE PATTERN "*-inl.h" EXCLUDE)
endforeach()

install(EXPORT Varnoth64Targets NAMESPACE Varnoth64::
  DESTINATION ${CMAKE_INSTALL_LIBDIR}/cmake/Varnoth64)
configure_package_config_file(cmake/Varnoth64Config.cmake.in
  ${CMAKE_CURRENT_BINARY_DIR}/Varnoth64Config.cmake
  INSTALL_DESTINATION ${CMAKE_INSTALL_LIBDIR}/cmake/Varnoth64)
write_basic_package_version_file(${CMAKE_CURRENT_BINARY_DIR}/Varnoth64ConfigVersion.cmake
  COMPATIBILITY SameMinorVersion)
install(FILES ${CMAKE_CURRENT_BINARY_DIR}/Varnoth64Config.cmake
  ${CMAKE_CURRENT_BINARY_DIR}/Varnoth64ConfigVersion.cmake
  DESTINATION ${CMAKE_INSTALL_LIBDIR}/cmake/Varnoth64)

# The .pc file finds the prefix from its own place, so an install moved with --prefix still works.
file(RELATIVE_PATH VARNOTH_PC_TO_PREFIX "/${CMAKE_INSTALL_LIBDIR}/pkgconfig" "/")
configure_file(cmake/varnoth64.pc.in ${CMAKE_CURRENT_BINARY_DIR}/varnoth64.pc @ONLY)
install(FILES ${CMAKE_CURRENT_BINARY_DIR}/varnoth64.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
