# What every target of the project is built with.

find_program(QUILLMARCH_CCACHE ccache)
if(QUILLMARCH_CCACHE AND NOT CMAKE_CXX_COMPILER_LAUNCHER)
    set(CMAKE_CXX_COMPILER_LAUNCHER ${QUILLMARCH_CCACHE})
endif()

if(QUILLMARCH_SANITIZE)
    add_compile_options(-fsanitize=${QUILLMARCH_SANITIZE} -fno-sanitize-recover=all -fno-omit-frame-pointer)
    add_link_options(-fsanitize=${QUILLMARCH_SANITIZE})
endif()

if(QUILLMARCH_FUZZ)
    # What the fuzzers steer by: the library tells them which of its branches an input takes.
    add_compile_options(-fsanitize=fuzzer-no-link)
endif()

# quillmarch_warnings(<target>): the warnings for everything written here; errors with QUILLMARCH_WERROR.
function(quillmarch_warnings target)
    target_compile_options(${target} PRIVATE
        -Wall -Wextra -Wpedantic $<$<BOOL:${QUILLMARCH_WERROR}>:-Werror> -Wshadow -Wconversion -Wnon-virtual-dtor -Wold-style-cast
        -Wcast-align -Woverloaded-virtual -Wformat=2 -Wimplicit-fallthrough)
    if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU" AND CMAKE_CXX_COMPILER_VERSION VERSION_LESS 13)
        # When it optimises, gcc 12 sees overlapping copies and unset values in std::string that are not there
        # (its bug 105651 and its like); clang and later versions of gcc keep watch.
        target_compile_options(${target} PRIVATE -Wno-restrict -Wno-maybe-uninitialized)
    endif()
endfunction()

# quillmarch_shared_library(<target>): version and linking of a library that is installed.
function(quillmarch_shared_library target)
    set_target_properties(${target} PROPERTIES VERSION ${PROJECT_VERSION} SOVERSION ${PROJECT_VERSION_MAJOR})
    # A call within the library goes straight to the library's own function: nobody puts another in its place.
    target_compile_options(${target} PRIVATE -fno-semantic-interposition)
    if(NOT APPLE)
        target_link_options(${target} PRIVATE -Wl,-Bsymbolic-functions)
    endif()
    if(NOT QUILLMARCH_SANITIZE AND NOT APPLE)
        # What is declared and not defined is found here, not in the program of whoever links the library.
        target_link_options(${target} PRIVATE -Wl,--no-undefined)
    endif()
endfunction()

# quillmarch_headers(<target> HEADERS file...): lists the headers of this folder that are installed with a library.
function(quillmarch_headers target)
    cmake_parse_arguments(arg "" "" "HEADERS" ${ARGN})
    file(RELATIVE_PATH room ${PROJECT_SOURCE_DIR} ${CMAKE_CURRENT_SOURCE_DIR})
    foreach(header IN LISTS arg_HEADERS)
        set_property(TARGET ${target} APPEND PROPERTY QUILLMARCH_PUBLIC_HEADERS ${room}/${header})
    endforeach()
endfunction()

# quillmarch_compile_together(<target> SOURCES file...): with QUILLMARCH_UNITY, compiles sources of this folder eight at a
# time. Such a build takes half as long; a change to one file costs more.
function(quillmarch_compile_together target)
    cmake_parse_arguments(arg "" "" "SOURCES" ${ARGN})
    if(NOT QUILLMARCH_UNITY)
        return()
    endif()
    set_target_properties(${target} PROPERTIES UNITY_BUILD ON UNITY_BUILD_MODE GROUP)
    if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
        # To the compiler a source that is included by another is a header, where unnamed namespaces are suspect.
        target_compile_options(${target} PRIVATE -Wno-subobject-linkage)
    endif()
    string(MAKE_C_IDENTIFIER "${CMAKE_CURRENT_SOURCE_DIR}" room)
    set(number 0)
    foreach(source IN LISTS arg_SOURCES)
        math(EXPR group "${number} / 8")
        math(EXPR number "${number} + 1")
        set_property(SOURCE ${CMAKE_CURRENT_SOURCE_DIR}/${source} TARGET_DIRECTORY ${target}
                     PROPERTY UNITY_GROUP "${room}_${group}")
    endforeach()
endfunction()

# quillmarch_room([SOURCES file...] [HEADERS file...]): adds this folder's sources to the edit library, and its headers.
function(quillmarch_room)
    cmake_parse_arguments(arg "" "" "SOURCES;HEADERS" ${ARGN})
    foreach(source IN LISTS arg_SOURCES)
        target_sources(quillmarch_edit PRIVATE ${CMAKE_CURRENT_SOURCE_DIR}/${source})
    endforeach()
    quillmarch_compile_together(quillmarch_edit SOURCES ${arg_SOURCES})
    quillmarch_headers(quillmarch_edit HEADERS ${arg_HEADERS})
endfunction()
