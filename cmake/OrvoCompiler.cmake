# Flags shared by every target of the project, carried by the interface target orvo_compiler.

set(CMAKE_EXPORT_COMPILE_COMMANDS ON)

find_program(ORVO_CCACHE ccache)
if(ORVO_CCACHE AND NOT CMAKE_CXX_COMPILER_LAUNCHER)
    set(CMAKE_CXX_COMPILER_LAUNCHER "${ORVO_CCACHE}")
endif()

add_library(orvo_compiler INTERFACE)
target_compile_features(orvo_compiler INTERFACE cxx_std_20)
target_compile_options(orvo_compiler INTERFACE
    -Wall -Wextra -Wpedantic -Wshadow -Wnon-virtual-dtor -Wcast-qual -Wswitch-enum
    # A fused multiply would push values over thresholds that are stated for separate operations.
    -ffp-contract=off
    # Reported paths are relative to the source root, also for headers reached through a layer's link.
    "-ffile-prefix-map=${PROJECT_SOURCE_DIR}/="
    "-ffile-prefix-map=${PROJECT_BINARY_DIR}/layers/core/="
    "-ffile-prefix-map=${PROJECT_BINARY_DIR}/layers/ogl/="
    "-ffile-prefix-map=${PROJECT_BINARY_DIR}/layers/colour_engine/="
    "-ffile-prefix-map=${PROJECT_BINARY_DIR}/layers/data_flow/="
    "-ffile-prefix-map=${PROJECT_BINARY_DIR}/layers/image_runtime/="
    "-ffile-prefix-map=${PROJECT_BINARY_DIR}/layers/image_flow/="
    "-ffile-prefix-map=${PROJECT_BINARY_DIR}/layers/filter_graph/=")
if(ORVO_WARNINGS_AS_ERRORS)
    target_compile_options(orvo_compiler INTERFACE -Werror)
endif()

# For the sources that hold kernels of one instruction set, chosen at run time by what the processor has.
set(ORVO_AVX2_OPTIONS -mavx2 -mf16c)
set(ORVO_AVX512_OPTIONS -mavx512f -mavx512bw -mavx512dq -mavx512vl -mf16c)
if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
    # GCC 12 warns of uninitialised values inside its own intrinsics (its bug 105593).
    list(APPEND ORVO_AVX512_OPTIONS -Wno-uninitialized -Wno-maybe-uninitialized)
endif()

if(ORVO_SANITIZE STREQUAL "address")
    set(orvo_sanitizer_flags -fsanitize=address,undefined -fno-sanitize-recover=all -fno-omit-frame-pointer)
elseif(ORVO_SANITIZE STREQUAL "thread")
    set(orvo_sanitizer_flags -fsanitize=thread -fno-omit-frame-pointer)
elseif(ORVO_SANITIZE)
    message(FATAL_ERROR "ORVO_SANITIZE must be empty, address or thread, and is ${ORVO_SANITIZE}")
endif()
if(ORVO_SANITIZE)
    target_compile_options(orvo_compiler INTERFACE ${orvo_sanitizer_flags})
    target_link_options(orvo_compiler INTERFACE ${orvo_sanitizer_flags})
endif()
