# vps_options: the compiler settings that every target of the project links to.
add_library(vps_options INTERFACE)
target_compile_options(vps_options INTERFACE
    -Wall -Wextra -Wpedantic -Wshadow -Wnon-virtual-dtor -Wold-style-cast -Wcast-qual -Wformat=2
    -Wimplicit-fallthrough -Werror -Werror=switch-enum -pthread
    # The source file's name without directories stands in every log line.
    -fmacro-prefix-map=${CMAKE_SOURCE_DIR}/=)
if(VPS_SANITIZE)
    target_compile_options(vps_options INTERFACE -fsanitize=${VPS_SANITIZE} -fno-omit-frame-pointer
                                                 -fno-sanitize-recover=all)
    target_link_options(vps_options INTERFACE -fsanitize=${VPS_SANITIZE})
endif()

# vps_unity(TARGET ...): several files of these targets are compiled as one. Their templates and headers cost most of a build,
# and are read once for all. Names in anonymous namespaces have to differ within such a target; a file whose names are the
# same as in its siblings by design is compiled apart (SKIP_UNITY_BUILD_INCLUSION).
option(VPS_UNITY "Compile several files of the larger targets as one" ON)
function(vps_unity)
    if(NOT VPS_UNITY)
        return()
    endif()
    set_target_properties(${ARGN} PROPERTIES UNITY_BUILD ON UNITY_BUILD_BATCH_SIZE 10)
    if(CMAKE_CXX_COMPILER_ID STREQUAL GNU)
        # What is in no header cannot clash; GCC takes every file but the outermost for one.
        foreach(target IN LISTS ARGN)
            target_compile_options(${target} PRIVATE -Wno-subobject-linkage)
        endforeach()
    endif()
endfunction()

if(NOT BUILD_TESTING)
    return()
endif()

# vps_add_test(NAME SOURCES ... LIBS ...): one GoogleTest program, each of its cases a CTest test.
include(GoogleTest)
function(vps_add_test name)
    cmake_parse_arguments(ARG "" "TIMEOUT;TSAN_SUPPRESSIONS" "SOURCES;LIBS" ${ARGN})
    add_executable(${name} ${ARG_SOURCES})
    target_link_libraries(${name} PRIVATE vps_options ${ARG_LIBS} GTest::gmock GTest::gtest_main)
    # Tests are small and many; optimising their templates, and reading these headers for each, would take most of a build's time.
    target_compile_options(${name} PRIVATE -O0 -g0)
    target_precompile_headers(${name} REUSE_FROM test_headers)
    vps_unity(${name})
    if(NOT ARG_TIMEOUT)
        set(ARG_TIMEOUT 120)
    endif()
    if(NOT ARG_TSAN_SUPPRESSIONS)
        set(ARG_TSAN_SUPPRESSIONS tsan.supp)
    endif()
    # Libraries that were not built for the thread sanitizer have locks that it cannot see.
    # Those that may take long begin first.
    gtest_discover_tests(${name} DISCOVERY_TIMEOUT 60 PROPERTIES TIMEOUT ${ARG_TIMEOUT} COST ${ARG_TIMEOUT}
                         ENVIRONMENT "TSAN_OPTIONS=suppressions=${CMAKE_SOURCE_DIR}/tests/${ARG_TSAN_SUPPRESSIONS}")
endfunction()
