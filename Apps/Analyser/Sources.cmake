# The view, for the program and for the plug-in.
set(analyser_sources Commands.cpp Files.cpp Menu.cpp View.cpp ViewCommands.cpp ViewDrawing.cpp ViewOutput.cpp
    ViewSettings.cpp)
list(TRANSFORM analyser_sources PREPEND ${CMAKE_CURRENT_LIST_DIR}/)
