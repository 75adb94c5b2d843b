# Shows that the layering is enforced by the build: a probe compiled as part
# of a layer that includes a header of the layer above must fail for want of
# that file, while the same include compiled as part of the upper layer
# builds. The probes are targets of the build tree, left out of "all".
#
#   cmake -DBUILD_DIR=<build tree> -DACCEPTED=<target> -DREJECTED=<target>
#         -DHEADER=<layer/Header.h> -P LayerProbe.cmake

foreach(variable BUILD_DIR ACCEPTED REJECTED HEADER)
    if(NOT ${variable})
        message(FATAL_ERROR "${variable} is not set")
    endif()
endforeach()

function(build_probe target result output)
    execute_process(COMMAND ${CMAKE_COMMAND} --build ${BUILD_DIR} --target ${target}
        RESULT_VARIABLE code OUTPUT_VARIABLE out ERROR_VARIABLE out)
    set(${result} ${code} PARENT_SCOPE)
    set(${output} "${out}" PARENT_SCOPE)
endfunction()

# First the include where it belongs, so that a failure below cannot come from
# the header itself.
build_probe(${ACCEPTED} code out)
if(NOT code EQUAL 0)
    message(FATAL_ERROR "${ACCEPTED} (including ${HEADER} from its own layer) did not build:\n${out}")
endif()

build_probe(${REJECTED} code out)
if(code EQUAL 0)
    message(FATAL_ERROR "${REJECTED} built: a lower layer reached ${HEADER}")
endif()
# gcc and clang word a missing include differently.
string(FIND "${out}" "${HEADER}" named)
if(named EQUAL -1 OR NOT out MATCHES "No such file or directory|file not found")
    message(FATAL_ERROR "${REJECTED} failed, but not for want of ${HEADER}:\n${out}")
endif()
message(STATUS "${REJECTED} cannot include ${HEADER}; ${ACCEPTED} can")
