# What `cmake --install` puts in place: the headers, the shared library with its catalogue beside it
# (the library looks for "messages" in its own folder), the tools, a CMake package with the imported
# target zelserverapi::zelserverapi, and a pkg-config file. The catalogue's own rule lives with it in
# messages/.
include(CMakePackageConfigHelpers)

set(ZEL_PACKAGE_DIR ${CMAKE_INSTALL_LIBDIR}/cmake/zelserverapi)

install(DIRECTORY ${PROJECT_SOURCE_DIR}/include/zelserverapi
  DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}
  FILES_MATCHING PATTERN "*.h")

install(TARGETS zelserverapi EXPORT zelserverapiTargets
  LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR}
  ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR}
  RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR}
  INCLUDES DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})

foreach(tool zelserverd zelctl)
  if(TARGET ${tool})
    # Installed tools find the installed library wherever the prefix is.
    set_property(TARGET ${tool} PROPERTY INSTALL_RPATH "$ORIGIN/../${CMAKE_INSTALL_LIBDIR}")
    install(TARGETS ${tool} RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR})
  endif()
endforeach()

install(EXPORT zelserverapiTargets
  NAMESPACE zelserverapi::
  DESTINATION ${ZEL_PACKAGE_DIR})

configure_package_config_file(${CMAKE_CURRENT_LIST_DIR}/zelserverapiConfig.cmake.in
  ${PROJECT_BINARY_DIR}/zelserverapiConfig.cmake
  INSTALL_DESTINATION ${ZEL_PACKAGE_DIR})
# Until the first major version every minor version may change the interface.
write_basic_package_version_file(${PROJECT_BINARY_DIR}/zelserverapiConfigVersion.cmake
  COMPATIBILITY SameMinorVersion)
install(FILES
  ${PROJECT_BINARY_DIR}/zelserverapiConfig.cmake
  ${PROJECT_BINARY_DIR}/zelserverapiConfigVersion.cmake
  DESTINATION ${ZEL_PACKAGE_DIR})

# The prefix is written relative to the file itself, so `cmake --install --prefix` anywhere works.
file(RELATIVE_PATH ZEL_PC_TO_PREFIX /${CMAKE_INSTALL_LIBDIR}/pkgconfig /)
string(REGEX REPLACE "/$" "" ZEL_PC_TO_PREFIX "${ZEL_PC_TO_PREFIX}")
configure_file(${CMAKE_CURRENT_LIST_DIR}/zelserverapi.pc.in ${PROJECT_BINARY_DIR}/zelserverapi.pc @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/zelserverapi.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
