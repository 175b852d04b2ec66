# Each public header compiles alone, as clean C++17, the way a host includes it.
get_property(headers GLOBAL PROPERTY ORVO_HEADERS)
set(sources "")
foreach(header IN LISTS headers ITEMS orvo/orvo.h)
    string(MAKE_C_IDENTIFIER "${header}" name)
    set(source "${PROJECT_BINARY_DIR}/header_checks/${name}.cpp")
    file(CONFIGURE OUTPUT "${source}" CONTENT "#include <${header}>\n")
    list(APPEND sources "${source}")
endforeach()

add_library(orvo_header_checks OBJECT ${sources})
target_include_directories(orvo_header_checks PRIVATE
    "${PROJECT_SOURCE_DIR}" "${PROJECT_BINARY_DIR}/generated")
set_target_properties(orvo_header_checks PROPERTIES
    CXX_STANDARD 17 CXX_STANDARD_REQUIRED ON CXX_EXTENSIONS OFF CXX_CLANG_TIDY "")
target_compile_options(orvo_header_checks PRIVATE -O0 -Wall -Wextra -Wpedantic -Werror)
