# Fails when a source of the engine includes a header of Qt Widgets or Qt Gui
# (or of a module built on them). The engine is tested without a display and
# must stay that way; the linker would not notice a header-only use.
#
#   cmake -DSOURCE_ROOT=<folder holding src/> -DQT_WIDGETS_DIR=<.../QtWidgets>
#         -DQT_GUI_DIR=<.../QtGui> -P EngineQtFree.cmake
#
# An include counts when its name starts with a module folder (QtGui/...) or
# names a file of the installed QtWidgets or QtGui folders (<QImage>,
# <qpainter.h>, <QtWidgets>), in angle brackets or in quotes.

foreach(variable SOURCE_ROOT QT_WIDGETS_DIR QT_GUI_DIR)
    if(NOT DEFINED ${variable} OR NOT IS_DIRECTORY "${${variable}}")
        message(FATAL_ERROR "${variable} must name a folder, not '${${variable}}'")
    endif()
endforeach()
# A module folder of the wrong kind would let every include through.
foreach(header QWidget QtWidgets)
    if(NOT EXISTS "${QT_WIDGETS_DIR}/${header}")
        message(FATAL_ERROR "${QT_WIDGETS_DIR} holds no ${header}: not the Qt Widgets headers")
    endif()
endforeach()
foreach(header QImage QtGui)
    if(NOT EXISTS "${QT_GUI_DIR}/${header}")
        message(FATAL_ERROR "${QT_GUI_DIR} holds no ${header}: not the Qt Gui headers")
    endif()
endforeach()

set(engine_folders support sound edit files playback)
# Widgets that live beside the logic they drive; they are built into the
# application, not the engine.
set(ui_folders edit/dialogs files/panel)
set(gui_modules "Widgets|Gui|OpenGL|OpenGLWidgets|PrintSupport|Svg|SvgWidgets|Quick|QuickWidgets")

set(sources)
foreach(folder ${engine_folders})
    file(GLOB_RECURSE found "${SOURCE_ROOT}/src/${folder}/*")
    list(APPEND sources ${found})
endforeach()
set(engine_sources)
foreach(source ${sources})
    set(in_ui FALSE)
    foreach(folder ${ui_folders})
        string(FIND "${source}" "${SOURCE_ROOT}/src/${folder}/" at)
        if(at EQUAL 0)
            set(in_ui TRUE)
        endif()
    endforeach()
    if(NOT in_ui)
        list(APPEND engine_sources "${source}")
    endif()
endforeach()
set(sources ${engine_sources})
list(FILTER sources INCLUDE REGEX "\\.(h|hh|hpp|hxx|c|cc|cpp|cxx|inl|ipp|tpp)$")
if(NOT sources)
    message(FATAL_ERROR "no engine sources under ${SOURCE_ROOT}/src")
endif()

set(offences)
foreach(source ${sources})
    file(STRINGS "${source}" includes REGEX "^[ \t]*#[ \t]*include[ \t]*[<\"][^>\"]+[>\"]")
    foreach(line ${includes})
        string(REGEX REPLACE "^[ \t]*#[ \t]*include[ \t]*[<\"]([^>\"]+)[>\"].*$" "\\1" header "${line}")
        if(header MATCHES "^Qt(${gui_modules})(/|$)"
           OR EXISTS "${QT_WIDGETS_DIR}/${header}" OR EXISTS "${QT_GUI_DIR}/${header}")
            file(RELATIVE_PATH shown "${SOURCE_ROOT}" "${source}")
            list(APPEND offences "${shown}: ${header}")
        endif()
    endforeach()
endforeach()

list(LENGTH sources checked)
if(offences)
    list(JOIN offences "\n  " listed)
    message(FATAL_ERROR "The engine includes Qt Widgets or Gui headers:\n  ${listed}")
endif()
message(STATUS "${checked} engine sources include no Qt Widgets or Gui header")
