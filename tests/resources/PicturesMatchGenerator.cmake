# The committed button pictures are exactly what their generator draws:
# runs it into SCRATCH and compares file by file, both ways.
#   cmake -DPYTHON=... -DGENERATOR=... -DPICTURES=... -DSCRATCH=... -P PicturesMatchGenerator.cmake
file(REMOVE_RECURSE ${SCRATCH})
file(MAKE_DIRECTORY ${SCRATCH})
execute_process(COMMAND ${PYTHON} ${GENERATOR} ${SCRATCH} RESULT_VARIABLE result)
if(NOT result EQUAL 0)
    message(FATAL_ERROR "the generator failed: ${result}")
endif()
file(GLOB drawn RELATIVE ${SCRATCH} ${SCRATCH}/*.tga)
file(GLOB committed RELATIVE ${PICTURES} ${PICTURES}/*.tga)
list(SORT drawn)
list(SORT committed)
if(NOT drawn STREQUAL committed)
    message(FATAL_ERROR "the generator draws ${drawn}\nthe resources hold ${committed}")
endif()
foreach(name ${drawn})
    execute_process(COMMAND ${CMAKE_COMMAND} -E compare_files ${SCRATCH}/${name} ${PICTURES}/${name}
        RESULT_VARIABLE different)
    if(different)
        message(FATAL_ERROR "${name} differs from what the generator draws; run scripts/make-transport-pictures")
    endif()
endforeach()
message(STATUS "${drawn}")
