# One target per layer. A layer names the layers below it, and nothing else is on its link line; tests/house checks the
# includes.

add_library(sorn_flags INTERFACE)
target_compile_options(sorn_flags INTERFACE
    -Wall -Wextra -Wshadow -Wconversion -Wsign-conversion -Wold-style-cast -Wnon-virtual-dtor -Woverloaded-virtual -Werror
    -fno-semantic-interposition)  # calls within a source file go straight, not through the table of the shared object

# What a shared object of ours is linked with: its own calls and tables reach its own functions directly.
set(SORN_SHARED_LINK_OPTIONS -Wl,-Bsymbolic-functions)

# All sources of the calling directory as one set of objects, which a shared library then takes up.
function(sorn_layer name)
    cmake_parse_arguments(arg "" "" "BELOW" ${ARGN})
    file(GLOB sources CONFIGURE_DEPENDS ${CMAKE_CURRENT_SOURCE_DIR}/*.cpp)
    add_library(${name} OBJECT ${sources})
    target_compile_options(${name} PRIVATE -fno-exceptions)
    target_link_libraries(${name} PRIVATE sorn_flags PUBLIC ${arg_BELOW})
endfunction()
