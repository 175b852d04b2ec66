# orvo_add_layer(<name> SOURCES <file>... HEADERS <file>... [LAYERS <lower layer>...] [LIBRARIES <target>...])
#
# Makes the object library orvo_<name> from the folder it is called in. Each layer sees the headers of itself and of
# the layers named after LAYERS alone: they are reached through one link per layer in the build tree, so that an
# include of a higher layer does not build.
include(GenerateExportHeader)

function(orvo_add_layer name)
    cmake_parse_arguments(PARSE_ARGV 1 layer "" "" "SOURCES;HEADERS;LAYERS;LIBRARIES")

    set(include_root "${PROJECT_BINARY_DIR}/layers/${name}")
    file(MAKE_DIRECTORY "${include_root}/orvo")
    file(CREATE_LINK "${CMAKE_CURRENT_SOURCE_DIR}" "${include_root}/orvo/${name}" SYMBOLIC)

    set(target "orvo_${name}")
    add_library(${target} OBJECT ${layer_SOURCES} ${layer_HEADERS})
    set_target_properties(${target} PROPERTIES
        POSITION_INDEPENDENT_CODE ON
        CXX_VISIBILITY_PRESET hidden
        UNITY_BUILD "${ORVO_UNITY_BUILD}"
        UNITY_BUILD_BATCH_SIZE 12
        VISIBILITY_INLINES_HIDDEN ON)
    target_compile_definitions(${target} PRIVATE orvo_EXPORTS)
    target_include_directories(${target} PUBLIC
        "$<BUILD_INTERFACE:${include_root}>"
        "$<BUILD_INTERFACE:${PROJECT_BINARY_DIR}/generated>")
    target_link_libraries(${target} PRIVATE orvo_compiler ${layer_LIBRARIES})
    foreach(lower IN LISTS layer_LAYERS)
        if(NOT TARGET orvo_${lower})
            message(FATAL_ERROR "Layer ${name} uses layer ${lower}, which does not stand below it")
        endif()
        target_include_directories(${target} PUBLIC "$<BUILD_INTERFACE:${PROJECT_BINARY_DIR}/layers/${lower}>")
    endforeach()

    set_property(GLOBAL APPEND PROPERTY ORVO_LAYERS ${target})
    list(TRANSFORM layer_HEADERS PREPEND "orvo/${name}/" OUTPUT_VARIABLE public_headers)
    set_property(GLOBAL APPEND PROPERTY ORVO_HEADERS ${public_headers})
endfunction()
