# orvo_add_tests(<name> <source>...): the test program orvo_<name>_tests, one entry of ctest.
find_package(GTest REQUIRED)

# Compiled once and reused by every test program: the headers that each of them includes.
add_library(orvo_test_support STATIC
    ${PROJECT_SOURCE_DIR}/tests/support/TestMain.cpp
    ${PROJECT_SOURCE_DIR}/tests/support/Watchdog.cpp)
target_link_libraries(orvo_test_support PUBLIC orvo orvo_compiler GTest::gtest Threads::Threads)
target_include_directories(orvo_test_support PUBLIC "${PROJECT_SOURCE_DIR}")
# The library is what is tested at full speed. Tests instantiate templates for every type: optimised and instrumented,
# one such source takes minutes.
target_compile_options(orvo_test_support PUBLIC "$<IF:$<BOOL:${ORVO_SANITIZE}>,-O0,-O1>")
if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
    # GCC 12 warns of "literal" + std::string (its bug 105651).
    target_compile_options(orvo_test_support PUBLIC -Wno-restrict -Wno-stringop-overflow -Wno-array-bounds)
endif()
target_precompile_headers(orvo_test_support PRIVATE
    <gtest/gtest.h> <algorithm> <cmath> <cstdint> <functional> <map> <memory> <sstream> <string> <vector>)

# What tests in a context share: hosts' contexts, replaced entry points, snapshots of state.
find_package(X11 REQUIRED)
add_library(orvo_gl_test_support STATIC
    ${PROJECT_SOURCE_DIR}/tests/support/gl/EGLHostContext.cpp
    ${PROJECT_SOURCE_DIR}/tests/support/gl/GLHooks.cpp
    ${PROJECT_SOURCE_DIR}/tests/support/gl/GLState.cpp
    ${PROJECT_SOURCE_DIR}/tests/support/gl/GLTest.cpp
    ${PROJECT_SOURCE_DIR}/tests/support/gl/GLXHostContext.cpp
    ${PROJECT_SOURCE_DIR}/tests/support/gl/HostContext.cpp
    ${PROJECT_SOURCE_DIR}/tests/support/gl/XServer.cpp)
target_link_libraries(orvo_gl_test_support PUBLIC orvo_test_support PkgConfig::EPOXY X11::X11)

function(orvo_add_tests name)
    set(target "orvo_${name}_tests")
    add_executable(${target} ${ARGN})
    target_link_libraries(${target} PRIVATE orvo_test_support)
    target_precompile_headers(${target} REUSE_FROM orvo_test_support)
    add_test(NAME ${name} COMMAND ${target})
    # Failures alone are printed: where only the beginning of a log is kept, they are there.
    set(environment "GTEST_BRIEF=1")
    if(ORVO_SANITIZE)
        # Ten times slower: fewer of them, on the same roads.
        list(APPEND environment "ORVO_RANDOM_GRAPHS=800")
    endif()
    set_tests_properties(${name} PROPERTIES TIMEOUT 900 ENVIRONMENT "${environment}")
endfunction()

# orvo_add_gl_tests(<name> <source>...): the same for tests in a context.
function(orvo_add_gl_tests name)
    orvo_add_tests(${name} ${ARGN})
    target_link_libraries(orvo_${name}_tests PRIVATE orvo_gl_test_support)
    # The OpenGL driver is not instrumented: how its threads agree with each other, thread sanitizer does not see. What
    # the driver calls does not count, then; the library and oneTBB do.
    if(ORVO_SANITIZE STREQUAL "thread")
        set_tests_properties(${name} PROPERTIES ENVIRONMENT_MODIFICATION
            "TSAN_OPTIONS=string_append::ignore_noninstrumented_modules=1")
    endif()
endfunction()
