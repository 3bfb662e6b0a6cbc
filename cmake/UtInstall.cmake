# Installs headers, libraries and a CMake package, so that a plug-in project can say
# find_package(ut) and link ut::ut.
include(CMakePackageConfigHelpers)

set_target_properties(ut_platform PROPERTIES EXPORT_NAME platform)
set_target_properties(ut_sdk PROPERTIES EXPORT_NAME sdk)
set_target_properties(ut_host PROPERTIES EXPORT_NAME host)

install(TARGETS ut ut_sdk ut_platform ut_host EXPORT utTargets
        RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR}
        LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR}
        ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR})
install(DIRECTORY ${PROJECT_SOURCE_DIR}/include/ DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})
install(DIRECTORY ${PROJECT_SOURCE_DIR}/src/platform/${UT_HOME}/include/ DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})
install(DIRECTORY ${UT_GENERATED_INCLUDE}/ DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})

set(UT_CMAKE_DIR ${CMAKE_INSTALL_LIBDIR}/cmake/ut)
install(EXPORT utTargets NAMESPACE ut:: DESTINATION ${UT_CMAKE_DIR})
configure_package_config_file(${PROJECT_SOURCE_DIR}/cmake/utConfig.cmake.in
                              ${CMAKE_BINARY_DIR}/utConfig.cmake INSTALL_DESTINATION ${UT_CMAKE_DIR})
write_basic_package_version_file(${CMAKE_BINARY_DIR}/utConfigVersion.cmake COMPATIBILITY SameMinorVersion)
install(FILES ${CMAKE_BINARY_DIR}/utConfig.cmake ${CMAKE_BINARY_DIR}/utConfigVersion.cmake
        DESTINATION ${UT_CMAKE_DIR})
