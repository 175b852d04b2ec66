# Installs the library, its public headers and the CMake package "orvo"; the same package works from the build tree.
include(CMakePackageConfigHelpers)

get_property(orvo_headers GLOBAL PROPERTY ORVO_HEADERS)
foreach(header IN LISTS orvo_headers ITEMS orvo/orvo.h)
    get_filename_component(folder "${header}" DIRECTORY)
    install(FILES "${PROJECT_SOURCE_DIR}/${header}" DESTINATION "${CMAKE_INSTALL_INCLUDEDIR}/${folder}")
endforeach()
install(FILES "${PROJECT_BINARY_DIR}/generated/orvo/core/Export.h"
    DESTINATION "${CMAKE_INSTALL_INCLUDEDIR}/orvo/core")

# The layers are objects inside the library: nothing of them is exported.
set_target_properties(orvo PROPERTIES EXPORT_NAME orvo)
install(TARGETS orvo EXPORT orvoTargets
    LIBRARY DESTINATION "${CMAKE_INSTALL_LIBDIR}"
    RUNTIME DESTINATION "${CMAKE_INSTALL_BINDIR}")

set(orvo_package_dir "${CMAKE_INSTALL_LIBDIR}/cmake/orvo")
install(EXPORT orvoTargets NAMESPACE orvo:: DESTINATION "${orvo_package_dir}")
export(EXPORT orvoTargets NAMESPACE orvo:: FILE "${PROJECT_BINARY_DIR}/orvoTargets.cmake")

configure_package_config_file(
    "${PROJECT_SOURCE_DIR}/cmake/orvoConfig.cmake.in"
    "${PROJECT_BINARY_DIR}/orvoConfig.cmake"
    INSTALL_DESTINATION "${orvo_package_dir}")
write_basic_package_version_file(
    "${PROJECT_BINARY_DIR}/orvoConfigVersion.cmake" COMPATIBILITY SameMajorVersion)
install(FILES
    "${PROJECT_BINARY_DIR}/orvoConfig.cmake"
    "${PROJECT_BINARY_DIR}/orvoConfigVersion.cmake"
    DESTINATION "${orvo_package_dir}")
