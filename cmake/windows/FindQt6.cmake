# A replacement for Qt if there is no Qt for Windows: the headers of this machine's Qt, which the library
# compiles against, and a Qt6OpenGL.dll with the one function that the library calls.
if(TARGET Qt6::OpenGL)
    set(Qt6_FOUND TRUE)
    return()
endif()

find_path(VYRA_QT_HEADERS QtOpenGL/QOpenGLWindow
    PATHS /usr/include/x86_64-linux-gnu/qt6 NO_DEFAULT_PATH NO_CMAKE_FIND_ROOT_PATH)
set(Qt6_VERSION "")
if(VYRA_QT_HEADERS)
    file(STRINGS ${VYRA_QT_HEADERS}/QtCore/qtcoreversion.h version REGEX "define QTCORE_VERSION_STR")
    string(REGEX MATCH "[0-9.]+" Qt6_VERSION "${version}")
endif()
set(Qt6_Gui_FOUND TRUE)
set(Qt6_OpenGL_FOUND TRUE)
include(FindPackageHandleStandardArgs)
find_package_handle_standard_args(Qt6
    REQUIRED_VARS VYRA_QT_HEADERS VERSION_VAR Qt6_VERSION HANDLE_COMPONENTS)

add_library(vyra-qt-headers INTERFACE)
target_include_directories(vyra-qt-headers SYSTEM INTERFACE
    ${VYRA_QT_HEADERS} ${VYRA_QT_HEADERS}/QtCore ${VYRA_QT_HEADERS}/QtGui ${VYRA_QT_HEADERS}/QtOpenGL)
# Without this, each object refers to a symbol of QtCore.
target_compile_definitions(vyra-qt-headers INTERFACE QT_NO_VERSION_TAGGING)

add_library(vyra-qt-opengl SHARED ${CMAKE_CURRENT_LIST_DIR}/Qt6OpenGL.cpp)
target_link_libraries(vyra-qt-opengl INTERFACE vyra-qt-headers)
set_target_properties(vyra-qt-opengl PROPERTIES
    PREFIX "" OUTPUT_NAME Qt6OpenGL RUNTIME_OUTPUT_DIRECTORY ${PROJECT_BINARY_DIR}/bin)

add_library(Qt6::OpenGL ALIAS vyra-qt-opengl)
