# Shows that EngineQtFree.cmake can fail: in a scratch tree of engine sources
# it passes while they include only Qt Core, standard and project headers,
# fails on each way of naming a Qt Widgets or Gui header, and leaves the
# dialogs and the open panel (built into the application) alone.
#
#   cmake -DCHECKER=<EngineQtFree.cmake> -DSCRATCH=<folder to use>
#         -DQT_WIDGETS_DIR=<...> -DQT_GUI_DIR=<...> -P EngineQtFreeSelfTest.cmake

foreach(variable CHECKER SCRATCH QT_WIDGETS_DIR QT_GUI_DIR)
    if(NOT ${variable})
        message(FATAL_ERROR "${variable} is not set")
    endif()
endforeach()

# The clean tree: allowed includes in every engine folder, widgets where
# widgets belong.
function(write_clean_tree root)
    file(REMOVE_RECURSE "${root}")
    file(WRITE "${root}/src/support/Clean.h" "#pragma once\n#include <QString>\n#include <QtCore/QObject>\n#include <vector>\n")
    file(WRITE "${root}/src/sound/Clean.cpp" "#include \"sound/Clean.h\"\n#include <QCoreApplication>\n")
    file(WRITE "${root}/src/edit/Clean.cpp" "// #include <QWidget> in a comment is no include\n#include \"support/Status.h\"\n")
    file(WRITE "${root}/src/files/Clean.cpp" "#include <libavformat/avformat.h>\n#include <QFile>\n")
    file(WRITE "${root}/src/playback/Clean.cpp" "#include <SDL.h>\n#include <QThread>\n")
    file(WRITE "${root}/src/edit/dialogs/FadeDialog.cpp" "#include <QDialog>\n#include <QPainter>\n")
    file(WRITE "${root}/src/files/panel/OpenPanel.cpp" "#include <QtWidgets/QFileDialog>\n")
    file(WRITE "${root}/src/views/SampleView.cpp" "#include <QWidget>\n#include <QImage>\n")
endfunction()

function(run_checker root result output)
    execute_process(
        COMMAND ${CMAKE_COMMAND} -DSOURCE_ROOT=${root} -DQT_WIDGETS_DIR=${QT_WIDGETS_DIR}
                -DQT_GUI_DIR=${QT_GUI_DIR} -P ${CHECKER}
        RESULT_VARIABLE code OUTPUT_VARIABLE out ERROR_VARIABLE out)
    set(${result} ${code} PARENT_SCOPE)
    set(${output} "${out}" PARENT_SCOPE)
endfunction()

set(root "${SCRATCH}/tree")
write_clean_tree("${root}")
run_checker("${root}" code out)
if(NOT code EQUAL 0)
    message(FATAL_ERROR "A clean engine was refused:\n${out}")
endif()

# file | line | the header the checker must name
set(offenders
    "src/support/Offender.h|#include <QImage>|QImage"
    "src/sound/Offender.cpp|#  include <QtWidgets/QWidget>|QtWidgets/QWidget"
    "src/edit/Offender.cpp|#include \"qpainter.h\"|qpainter.h"
    "src/edit/vocoder/Offender.cpp|#include <QColor>|QColor"
    "src/files/Offender.cpp|#include <QtGui>|QtGui"
    "src/playback/Offender.h|  #include <QGuiApplication>|QGuiApplication"
    "src/playback/Offender.cpp|#include <QtOpenGL/QOpenGLBuffer>|QtOpenGL/QOpenGLBuffer"
    "src/files/Offender.h|#include <QApplication>|QApplication")
foreach(offender ${offenders})
    string(REPLACE "|" ";" parts "${offender}")
    list(GET parts 0 file)
    list(GET parts 1 line)
    list(GET parts 2 header)
    write_clean_tree("${root}")
    file(WRITE "${root}/${file}" "#pragma once\n${line}\n")
    run_checker("${root}" code out)
    if(code EQUAL 0)
        message(FATAL_ERROR "${file} with '${line}' passed the check")
    endif()
    string(FIND "${out}" "${file}: ${header}" at)
    if(at EQUAL -1)
        message(FATAL_ERROR "The check of ${file} failed without naming '${header}':\n${out}")
    endif()
endforeach()
file(REMOVE_RECURSE "${root}")
list(LENGTH offenders count)
message(STATUS "The check passes a clean engine and catches all ${count} offenders")
