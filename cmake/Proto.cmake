# The schema in the language of Protocol Buffers, for tests and benchmarks against libprotobuf; never a part of the
# library. Needs find_package(Protobuf).
find_package(Python3 3.11 REQUIRED COMPONENTS Interpreter)

# Writes NAME.proto in the current build folder, by the given arguments of the generator (catalogue files and options), and
# what protoc makes of it by its option KIND: descriptor_set_out gives NAME.pb (the compiled schema), cpp_out NAME.pb.h and
# NAME.pb.cc. The target NAME_proto makes them all.
function(sorn_proto name kind)
    set(files ${ARGN})
    list(FILTER files EXCLUDE REGEX "^--")
    set(here ${CMAKE_CURRENT_BINARY_DIR})
    file(GLOB generator CONFIGURE_DEPENDS ${PROJECT_SOURCE_DIR}/schema/generator/*.py)
    if(kind STREQUAL "cpp_out")
        set(option --cpp_out=${here})
        set(outputs ${here}/${name}.pb.cc ${here}/${name}.pb.h)
    else()
        set(option --${kind}=${here}/${name}.pb)
        set(outputs ${here}/${name}.pb)
    endif()
    add_custom_command(OUTPUT ${here}/${name}.proto ${outputs}
        COMMAND ${Python3_EXECUTABLE} ${PROJECT_SOURCE_DIR}/schema/generator/generate.py --proto ${here}/${name}.proto ${ARGN}
        COMMAND protobuf::protoc -I ${here} ${option} ${here}/${name}.proto
        DEPENDS ${files} ${generator} COMMENT "Writing the schema of ${name} for libprotobuf" VERBATIM)
    add_custom_target(${name}_proto DEPENDS ${outputs})
endfunction()
