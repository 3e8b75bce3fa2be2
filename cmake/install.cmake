# SPDX-License-Identifier: Apache-2.0
# What a packager and a program that links the library find below the prefix, wherever that is moved to.
include(CMakePackageConfigHelpers)

install(TARGETS vesk2 EXPORT vesk2Targets)
install(TARGETS vesk2_static EXPORT vesk2StaticTargets OPTIONAL)  # where it was built
install(DIRECTORY include/ DESTINATION ${CMAKE_INSTALL_INCLUDEDIR} FILES_MATCHING PATTERN "*.h*")

# For CMake: vesk2::vesk2, and vesk2::static.
set_target_properties(vesk2_static PROPERTIES EXPORT_NAME static)
set(config_dir ${CMAKE_INSTALL_LIBDIR}/cmake/vesk2)
configure_package_config_file(cmake/vesk2Config.cmake.in ${CMAKE_BINARY_DIR}/vesk2Config.cmake
                              INSTALL_DESTINATION ${config_dir} PATH_VARS CMAKE_INSTALL_LIBDIR)
write_basic_package_version_file(${CMAKE_BINARY_DIR}/vesk2ConfigVersion.cmake COMPATIBILITY SameMajorVersion)
install(FILES ${CMAKE_BINARY_DIR}/vesk2Config.cmake ${CMAKE_BINARY_DIR}/vesk2ConfigVersion.cmake
        DESTINATION ${config_dir})
install(EXPORT vesk2Targets NAMESPACE vesk2:: DESTINATION ${config_dir})
install(EXPORT vesk2StaticTargets NAMESPACE vesk2:: DESTINATION ${config_dir})

# For everything else: vesk2.pc, which finds the prefix from where it lies itself.
file(RELATIVE_PATH prefix_from_pc ${CMAKE_INSTALL_FULL_LIBDIR}/pkgconfig ${CMAKE_INSTALL_PREFIX})
string(REGEX REPLACE "/$" "" prefix_from_pc ${prefix_from_pc})
foreach(kind LIB INCLUDE)
  file(RELATIVE_PATH pc_${kind}DIR ${CMAKE_INSTALL_PREFIX} ${CMAKE_INSTALL_FULL_${kind}DIR})
endforeach()
configure_file(cmake/vesk2.pc.in ${CMAKE_BINARY_DIR}/vesk2.pc @ONLY)
install(FILES ${CMAKE_BINARY_DIR}/vesk2.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)

# For people.
install(FILES README.md CHANGELOG.md SECURITY.md LICENSE DESTINATION ${CMAKE_INSTALL_DOCDIR})
install(DIRECTORY docs/ DESTINATION ${CMAKE_INSTALL_DOCDIR} FILES_MATCHING PATTERN "*.md" PATTERN man EXCLUDE)
install(FILES docs/answer.schema.json DESTINATION ${CMAKE_INSTALL_DATADIR}/vesk2)
install(DIRECTORY examples DESTINATION ${CMAKE_INSTALL_DOCDIR})
