# Installation: the two shared libraries with their public headers, the command-line tools, a
# CMake package (find_package(SsoClient) gives SsoClient::ssoclient) and a pkg-config file
# (ssoclient.pc). Every file written here is relocatable: `cmake --install --prefix P` may pick
# the prefix after the build.
include(GNUInstallDirs)
include(CMakePackageConfigHelpers)

set(SSOCLIENT_PACKAGE_DIR ${CMAKE_INSTALL_LIBDIR}/cmake/SsoClient)

# libssoclient finds libtamber beside itself, wherever the prefix is.
set_target_properties(ssoclient PROPERTIES INSTALL_RPATH "$ORIGIN")
install(TARGETS tamber ssoclient EXPORT SsoClientTargets
  LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR}
  INCLUDES DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})
install(DIRECTORY ${PROJECT_SOURCE_DIR}/lib/public/ DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}
  FILES_MATCHING PATTERN "*.h")

install(EXPORT SsoClientTargets NAMESPACE SsoClient:: DESTINATION ${SSOCLIENT_PACKAGE_DIR})
configure_package_config_file(${CMAKE_CURRENT_LIST_DIR}/SsoClientConfig.cmake.in
  ${PROJECT_BINARY_DIR}/SsoClientConfig.cmake
  INSTALL_DESTINATION ${SSOCLIENT_PACKAGE_DIR})
# Before 1.0 a new minor version may break the interface.
write_basic_package_version_file(${PROJECT_BINARY_DIR}/SsoClientConfigVersion.cmake
  COMPATIBILITY SameMinorVersion)
install(FILES ${PROJECT_BINARY_DIR}/SsoClientConfig.cmake ${PROJECT_BINARY_DIR}/SsoClientConfigVersion.cmake
  DESTINATION ${SSOCLIENT_PACKAGE_DIR})

# The .pc file finds its prefix from its own place, however deep the library folder is.
file(RELATIVE_PATH SSOCLIENT_PC_TO_PREFIX /prefix/${CMAKE_INSTALL_LIBDIR}/pkgconfig /prefix)
string(REGEX REPLACE "/$" "" SSOCLIENT_PC_TO_PREFIX ${SSOCLIENT_PC_TO_PREFIX})
configure_file(${CMAKE_CURRENT_LIST_DIR}/ssoclient.pc.in ${PROJECT_BINARY_DIR}/ssoclient.pc @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/ssoclient.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)

# The command-line tools live in folders of their own and may be absent from a checkout.
foreach(tool ssoclient_cli ssoclient-sts)
  if(TARGET ${tool})
    install(TARGETS ${tool} RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR})
  endif()
endforeach()
