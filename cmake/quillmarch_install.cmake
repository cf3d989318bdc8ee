# Installation: the libraries, their public headers, a CMake package with a component for each library but the first,
# and a pkg-config file for each.
include(CMakePackageConfigHelpers)

set(package_folder ${CMAKE_INSTALL_LIBDIR}/cmake/quillmarch_edit)
# The pkg-config files find their prefix from where they lie, so that an installation can be moved.
file(RELATIVE_PATH QUILLMARCH_PC_TO_PREFIX /${CMAKE_INSTALL_LIBDIR}/pkgconfig /)
string(REGEX REPLACE "/$" "" QUILLMARCH_PC_TO_PREFIX "${QUILLMARCH_PC_TO_PREFIX}")

# quillmarch_install_library(<target> <description> [<required pkg-config modules>])
function(quillmarch_install_library library description)
    install(TARGETS ${library} EXPORT ${library}_targets
            LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR}
            RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR})
    install(EXPORT ${library}_targets NAMESPACE quillmarch:: DESTINATION ${package_folder})
    get_target_property(headers ${library} QUILLMARCH_PUBLIC_HEADERS)
    foreach(header IN LISTS headers)
        get_filename_component(folder ${header} DIRECTORY)
        install(FILES ${PROJECT_SOURCE_DIR}/${header} DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/quillmarch/${folder})
    endforeach()
    set(requires ${ARGN})
    configure_file(${PROJECT_SOURCE_DIR}/cmake/quillmarch.pc.in ${PROJECT_BINARY_DIR}/${library}.pc @ONLY)
    install(FILES ${PROJECT_BINARY_DIR}/${library}.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
endfunction()

quillmarch_install_library(quillmarch_edit "${PROJECT_DESCRIPTION}")
quillmarch_install_library(quillmarch_interchange "Timelines of other tools to and from Quillmarch edits"
    "quillmarch_edit = ${PROJECT_VERSION}")

configure_package_config_file(${PROJECT_SOURCE_DIR}/cmake/quillmarch_edit-config.cmake.in
    ${PROJECT_BINARY_DIR}/quillmarch_edit-config.cmake INSTALL_DESTINATION ${package_folder})
write_basic_package_version_file(${PROJECT_BINARY_DIR}/quillmarch_edit-config-version.cmake
    COMPATIBILITY SameMajorVersion)
install(FILES ${PROJECT_BINARY_DIR}/quillmarch_edit-config.cmake
              ${PROJECT_BINARY_DIR}/quillmarch_edit-config-version.cmake
        DESTINATION ${package_folder})
if(TARGET qmedit)
    install(TARGETS qmedit RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR})
endif()
