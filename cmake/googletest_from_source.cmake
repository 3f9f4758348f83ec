# GoogleTest and GoogleMock built from Debian's source package (googletest) for a cross build, under
# the names find_package(GTest) gives on the build machine (its own build defines the GTest:: aliases).
set(ZEL_GOOGLETEST_SOURCE /usr/src/googletest CACHE PATH "GoogleTest sources")
set(INSTALL_GTEST OFF CACHE BOOL "" FORCE)
set(BUILD_GMOCK ON CACHE BOOL "" FORCE)
add_subdirectory(${ZEL_GOOGLETEST_SOURCE} ${PROJECT_BINARY_DIR}/googletest EXCLUDE_FROM_ALL)
