# Fails when a source names a message field with a bare string literal
# instead of a constant of support/MessageFields.h: a field spelt twice can
# drift apart between its sender and its receiver without any compiler
# noticing.
#
#   cmake -DSOURCE_ROOT=<folder holding the sources to check> -P FieldNamesNamed.cmake

if(NOT DEFINED SOURCE_ROOT OR NOT IS_DIRECTORY "${SOURCE_ROOT}")
    message(FATAL_ERROR "SOURCE_ROOT must name a folder, not '${SOURCE_ROOT}'")
endif()

file(GLOB_RECURSE sources "${SOURCE_ROOT}/*.cpp" "${SOURCE_ROOT}/*.h")
set(pattern "(Add|Find)(Int32|Int64|Bool|Float|Pointer|String|Path)\\(\"|(HasField|RemoveField|CountValues)\\(\"")
set(offenders)
foreach(source ${sources})
    file(STRINGS "${source}" lines REGEX "${pattern}")
    foreach(line ${lines})
        string(STRIP "${line}" line)
        list(APPEND offenders "${source}: ${line}")
    endforeach()
endforeach()
list(LENGTH sources count)
if(count EQUAL 0)
    message(FATAL_ERROR "no sources under ${SOURCE_ROOT}")
endif()
if(offenders)
    list(JOIN offenders "\n" text)
    message(FATAL_ERROR "message fields named by bare strings:\n${text}")
endif()
message(STATUS "${count} sources name their message fields by constants")
