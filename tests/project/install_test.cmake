# Installs the library into a folder of its own, takes the example program out of README.md, builds it there
# once with find_package and once with pkg-config, and runs both.
cmake_minimum_required(VERSION 3.23)

function(run_step what)
    execute_process(COMMAND ${ARGN} RESULT_VARIABLE code OUTPUT_VARIABLE out ERROR_VARIABLE out)
    if(NOT code EQUAL 0)
        message(FATAL_ERROR "${what} failed (${code}):\n${out}")
    endif()
    set(step_output "${out}" PARENT_SCOPE)
endfunction()

file(REMOVE_RECURSE ${WORK})
file(MAKE_DIRECTORY ${WORK}/program ${WORK}/ran)
set(prefix ${WORK}/prefix)
run_step("installing" ${CMAKE_COMMAND} --install ${BUILD} --prefix ${prefix})

file(READ ${SOURCE}/README.md readme)
string(REGEX MATCH "```cpp\n([^`]*)```" block "${readme}")
if(NOT block)
    message(FATAL_ERROR "README.md has no C++ example")
endif()
file(WRITE ${WORK}/program/main.cpp "${CMAKE_MATCH_1}")

file(WRITE ${WORK}/program/CMakeLists.txt "cmake_minimum_required(VERSION 3.23)
project(program LANGUAGES CXX)
find_package(quillmarch_edit 11.1 REQUIRED)
add_executable(program main.cpp)
target_link_libraries(program PRIVATE quillmarch::edit)
")
run_step("configuring with find_package" ${CMAKE_COMMAND} -S ${WORK}/program -B ${WORK}/by_cmake -G Ninja
    -DCMAKE_PREFIX_PATH=${prefix} -DCMAKE_CXX_COMPILER=${COMPILER})
run_step("building with find_package" ${CMAKE_COMMAND} --build ${WORK}/by_cmake)

file(GLOB_RECURSE pc ${prefix}/*.pc)
get_filename_component(pc_folder ${pc} DIRECTORY)
get_filename_component(lib_folder ${pc_folder} DIRECTORY)
run_step("asking pkg-config" ${CMAKE_COMMAND} -E env PKG_CONFIG_PATH=${pc_folder} pkg-config --cflags --libs quillmarch_edit)
string(STRIP "${step_output}" step_output)
separate_arguments(flags UNIX_COMMAND "${step_output}")
run_step("building with pkg-config" ${COMPILER} -std=c++20 ${WORK}/program/main.cpp ${flags}
    -Wl,-rpath,${lib_folder} -o ${WORK}/by_pkg_config)

foreach(program ${WORK}/by_cmake/program ${WORK}/by_pkg_config)
    execute_process(COMMAND ${program} WORKING_DIRECTORY ${WORK}/ran RESULT_VARIABLE code OUTPUT_VARIABLE out ERROR_VARIABLE out)
    if(NOT code EQUAL 0 OR NOT out MATCHES "Rushes: 1 channel, ends at 4.00 s")
        message(FATAL_ERROR "${program} ended with ${code} and said: ${out}")
    endif()
    run_step("asking what it links" ldd ${program})
    if(NOT step_output MATCHES "libquillmarch_edit\\.so\\.11 => ${prefix}")
        message(FATAL_ERROR "${program} does not use the installed library:\n${step_output}")
    endif()
endforeach()
file(REMOVE_RECURSE ${WORK})
