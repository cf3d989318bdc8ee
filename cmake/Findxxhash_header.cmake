# xxHash is used as a header only, so that the installed library needs nothing at run time.
find_path(XXHASH_INCLUDE_DIR xxhash.h)
include(FindPackageHandleStandardArgs)
find_package_handle_standard_args(xxhash_header REQUIRED_VARS XXHASH_INCLUDE_DIR)
if(xxhash_header_FOUND AND NOT TARGET xxhash::header)
    add_library(xxhash::header INTERFACE IMPORTED)
    set_target_properties(xxhash::header PROPERTIES INTERFACE_INCLUDE_DIRECTORIES "${XXHASH_INCLUDE_DIR}")
endif()
