# Installation: the library, its public headers, a CMake package and a pkg-config file.
include(CMakePackageConfigHelpers)

install(TARGETS quillmarch_edit EXPORT quillmarch_edit_targets
        LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR}
        RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR})

get_property(public_headers GLOBAL PROPERTY QUILLMARCH_PUBLIC_HEADERS)
foreach(header IN LISTS public_headers)
    get_filename_component(folder ${header} DIRECTORY)
    install(FILES ${PROJECT_SOURCE_DIR}/${header} DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/quillmarch/${folder})
endforeach()

set(package_folder ${CMAKE_INSTALL_LIBDIR}/cmake/quillmarch_edit)
install(EXPORT quillmarch_edit_targets NAMESPACE quillmarch:: DESTINATION ${package_folder})
configure_package_config_file(${PROJECT_SOURCE_DIR}/cmake/quillmarch_edit-config.cmake.in
    ${PROJECT_BINARY_DIR}/quillmarch_edit-config.cmake INSTALL_DESTINATION ${package_folder})
write_basic_package_version_file(${PROJECT_BINARY_DIR}/quillmarch_edit-config-version.cmake
    COMPATIBILITY SameMajorVersion)
install(FILES ${PROJECT_BINARY_DIR}/quillmarch_edit-config.cmake
              ${PROJECT_BINARY_DIR}/quillmarch_edit-config-version.cmake
        DESTINATION ${package_folder})

# The file finds its prefix from where it lies, so that an installation can be moved.
file(RELATIVE_PATH QUILLMARCH_PC_TO_PREFIX /${CMAKE_INSTALL_LIBDIR}/pkgconfig /)
string(REGEX REPLACE "/$" "" QUILLMARCH_PC_TO_PREFIX "${QUILLMARCH_PC_TO_PREFIX}")
configure_file(${PROJECT_SOURCE_DIR}/cmake/quillmarch_edit.pc.in ${PROJECT_BINARY_DIR}/quillmarch_edit.pc @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/quillmarch_edit.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
if(TARGET qmedit)
    install(TARGETS qmedit RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR})
endif()
