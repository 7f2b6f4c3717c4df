# The CMake package and the pkg-config files, with which other projects find the installed library,
# and the examples. Included after the project's folders.
include(CMakePackageConfigHelpers)

set(VYRA_CMAKE_PACKAGE_DIR ${CMAKE_INSTALL_LIBDIR}/cmake/VyraOpenCL)
install(EXPORT VyraOpenCLTargets
    NAMESPACE VyraOpenCL::
    DESTINATION ${VYRA_CMAKE_PACKAGE_DIR}
    COMPONENT Development)
configure_package_config_file(
    ${CMAKE_CURRENT_LIST_DIR}/VyraOpenCLConfig.cmake.in
    ${PROJECT_BINARY_DIR}/packaging/VyraOpenCLConfig.cmake
    INSTALL_DESTINATION ${VYRA_CMAKE_PACKAGE_DIR}
    NO_SET_AND_CHECK_MACRO)
write_basic_package_version_file(
    ${PROJECT_BINARY_DIR}/packaging/VyraOpenCLConfigVersion.cmake COMPATIBILITY SameMajorVersion)
install(FILES
    ${PROJECT_BINARY_DIR}/packaging/VyraOpenCLConfig.cmake
    ${PROJECT_BINARY_DIR}/packaging/VyraOpenCLConfigVersion.cmake
    DESTINATION ${VYRA_CMAKE_PACKAGE_DIR}
    COMPONENT Development)

# The files name the prefix relative to their own folder, so that an installation can be moved.
set(VYRA_PKG_CONFIG_DIR ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
file(RELATIVE_PATH VYRA_PREFIX_FROM_PKG_CONFIG
    ${CMAKE_INSTALL_FULL_LIBDIR}/pkgconfig ${CMAKE_INSTALL_PREFIX})
string(REGEX REPLACE "/$" "" VYRA_PREFIX_FROM_PKG_CONFIG ${VYRA_PREFIX_FROM_PKG_CONFIG})
foreach(library vyra-opencl vyra-host vyra-evaluator)
    configure_file(${CMAKE_CURRENT_LIST_DIR}/${library}.pc.in
        ${PROJECT_BINARY_DIR}/packaging/${library}.pc @ONLY)
    install(FILES ${PROJECT_BINARY_DIR}/packaging/${library}.pc
        DESTINATION ${VYRA_PKG_CONFIG_DIR}
        COMPONENT Development)
endforeach()

set(VYRA_EXAMPLES_DIR ${CMAKE_INSTALL_DATADIR}/doc/libvyra-opencl-dev/examples)
install(FILES
    ${PROJECT_SOURCE_DIR}/examples/smallest_evaluator.cpp
    ${PROJECT_SOURCE_DIR}/examples/published_evaluator.cpp
    DESTINATION ${VYRA_EXAMPLES_DIR}
    COMPONENT Development)
install(DIRECTORY
    ${PROJECT_SOURCE_DIR}/examples/custom_deformer
    ${PROJECT_SOURCE_DIR}/examples/evaluator
    ${PROJECT_SOURCE_DIR}/examples/hot_reload
    ${PROJECT_SOURCE_DIR}/examples/with-cmake
    ${PROJECT_SOURCE_DIR}/examples/with-pkg-config
    DESTINATION ${VYRA_EXAMPLES_DIR}
    COMPONENT Development)

# The guides, without the parts for readers of the source. Writing them needs Python.
find_package(Python3 COMPONENTS Interpreter)
if(Python3_FOUND)
    set(VYRA_GUIDES ${PROJECT_BINARY_DIR}/packaging/guides)
    execute_process(
        COMMAND ${Python3_EXECUTABLE} ${CMAKE_CURRENT_LIST_DIR}/installed_guides.py ${PROJECT_SOURCE_DIR} ${VYRA_GUIDES}
        COMMAND_ERROR_IS_FATAL ANY)
    file(GLOB guides ${PROJECT_SOURCE_DIR}/docs/*.md)
    set_property(DIRECTORY APPEND PROPERTY CMAKE_CONFIGURE_DEPENDS
        ${guides} ${CMAKE_CURRENT_LIST_DIR}/installed_guides.py)
    install(DIRECTORY ${VYRA_GUIDES}
        DESTINATION ${CMAKE_INSTALL_DATADIR}/doc/libvyra-opencl-dev COMPONENT Development)
endif()

find_program(VYRA_GZIP gzip)
include(VyraManPages)
include(VyraDebian)
