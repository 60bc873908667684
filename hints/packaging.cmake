# Installing libvlm: the library (component libvlm), and what other programs are built against it
# with (component devel): headers, a pkg-config file and a CMake package. Nothing installed knows
# its prefix, so the tree may be moved as a whole.
include(CMakePackageConfigHelpers)

install(TARGETS vlm EXPORT vlmTargets
    LIBRARY DESTINATION "${CMAKE_INSTALL_LIBDIR}" COMPONENT libvlm NAMELINK_COMPONENT devel
    FILE_SET HEADERS DESTINATION "${CMAKE_INSTALL_INCLUDEDIR}/vlm" COMPONENT devel)

set(package_folder "${CMAKE_INSTALL_LIBDIR}/cmake/vlm")
install(EXPORT vlmTargets NAMESPACE vlm:: DESTINATION "${package_folder}" COMPONENT devel)
configure_package_config_file(vlmConfig.cmake.in vlmConfig.cmake
    INSTALL_DESTINATION "${package_folder}")
write_basic_package_version_file(vlmConfigVersion.cmake COMPATIBILITY SameMinorVersion)
install(FILES
    "${CMAKE_CURRENT_BINARY_DIR}/vlmConfig.cmake"
    "${CMAKE_CURRENT_BINARY_DIR}/vlmConfigVersion.cmake"
    DESTINATION "${package_folder}" COMPONENT devel)

# Folders are relative to the pkg-config file, unless they were configured as absolute ones.
set(pkgconfig_folder "${CMAKE_INSTALL_LIBDIR}/pkgconfig")
file(RELATIVE_PATH up_to_prefix
    "${CMAKE_INSTALL_FULL_LIBDIR}/pkgconfig" "${CMAKE_INSTALL_PREFIX}")
string(REGEX REPLACE "/$" "" up_to_prefix "${up_to_prefix}")
cmake_path(APPEND library_folder "\${prefix}" "${CMAKE_INSTALL_LIBDIR}")
cmake_path(APPEND include_folder "\${prefix}" "${CMAKE_INSTALL_INCLUDEDIR}/vlm")
configure_file(libvlm.pc.in libvlm.pc @ONLY)
install(FILES "${CMAKE_CURRENT_BINARY_DIR}/libvlm.pc"
    DESTINATION "${pkgconfig_folder}" COMPONENT devel)
