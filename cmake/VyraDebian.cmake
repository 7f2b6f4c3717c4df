# Debian packages, created by CPack: one for each component. scripts/package builds them.
#
# They install below /usr; the system does not find the libraries of a build with another prefix.
set(VYRA_DEBIAN_DIR ${CMAKE_CURRENT_LIST_DIR}/debian)
set(VYRA_DEBIAN_REVISION 1)
set(VYRA_DEBIAN_VERSION ${PROJECT_VERSION}-${VYRA_DEBIAN_REVISION})
set(VYRA_PACKAGE_MAINTAINER "vyra-opencl maintainers <maintainers@vyra-opencl.example>" CACHE STRING
    "Maintainer of the Debian packages: name <address>")

set(CPACK_GENERATOR DEB)
set(CPACK_VERBATIM_VARIABLES ON)
set(CPACK_STRIP_FILES ON)
set(CPACK_PACKAGE_CONTACT ${VYRA_PACKAGE_MAINTAINER})
# Each package's description has its own first line.
set(CPACK_PACKAGE_DESCRIPTION_SUMMARY "")
set(CPACK_INSTALL_DEFAULT_DIRECTORY_PERMISSIONS ${CMAKE_INSTALL_DEFAULT_DIRECTORY_PERMISSIONS})
set(CPACK_PACKAGING_INSTALL_PREFIX /usr)

set(CPACK_DEB_COMPONENT_INSTALL ON)
set(CPACK_COMPONENTS_ALL Library Evaluator Development glshare Tools)
set(CPACK_DEBIAN_ENABLE_COMPONENT_DEPENDS ON)
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_COMPRESSION_TYPE xz)
set(CPACK_DEBIAN_PACKAGE_SOURCE vyra-opencl)
set(CPACK_DEBIAN_PACKAGE_RELEASE ${VYRA_DEBIAN_REVISION})
set(CPACK_DEBIAN_PACKAGE_CONTROL_STRICT_PERMISSION ON)
# Dependencies come from the linked libraries; the project's own are found in the build directory.
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS ON)
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS_PRIVATE_DIRS ${CMAKE_LIBRARY_OUTPUT_DIRECTORY})
set(CPACK_DEBIAN_PACKAGE_GENERATE_SHLIBS ON)
set(CPACK_DEBIAN_PACKAGE_GENERATE_SHLIBS_POLICY ">=")

# vyra_debian_package(COMPONENT NAME DESCRIPTION): one package, with its copyright and changelogs.
function(vyra_debian_package component name description)
    string(TOUPPER ${component} key)
    set(CPACK_DEBIAN_${key}_PACKAGE_NAME ${name} PARENT_SCOPE)
    set(CPACK_DEBIAN_${key}_DESCRIPTION "${description}" PARENT_SCOPE)
    set(documents ${CMAKE_INSTALL_DATADIR}/doc/${name})
    install(FILES ${VYRA_DEBIAN_DIR}/copyright DESTINATION ${documents} COMPONENT ${component})
    if(VYRA_CHANGELOGS)
        install(FILES ${VYRA_CHANGELOGS} DESTINATION ${documents} COMPONENT ${component})
    endif()
endfunction()

# Debian requires compressed changelogs, and the same bytes from the same text.
file(STRINGS ${VYRA_DEBIAN_DIR}/changelog newest_entry LIMIT_COUNT 1)
if(NOT newest_entry MATCHES "\\(${VYRA_DEBIAN_VERSION}\\)")
    message(SEND_ERROR "cmake/debian/changelog has no entry for ${VYRA_DEBIAN_VERSION}")
endif()
if(VYRA_GZIP)
    set(VYRA_CHANGELOGS
        ${PROJECT_BINARY_DIR}/packaging/changelog.Debian.gz ${PROJECT_BINARY_DIR}/packaging/changelog.gz)
    execute_process(COMMAND ${VYRA_GZIP} -9nc ${VYRA_DEBIAN_DIR}/changelog
        OUTPUT_FILE ${PROJECT_BINARY_DIR}/packaging/changelog.Debian.gz COMMAND_ERROR_IS_FATAL ANY)
    execute_process(COMMAND ${VYRA_GZIP} -9nc ${PROJECT_SOURCE_DIR}/CHANGELOG.md
        OUTPUT_FILE ${PROJECT_BINARY_DIR}/packaging/changelog.gz COMMAND_ERROR_IS_FATAL ANY)
    set_property(DIRECTORY APPEND PROPERTY CMAKE_CONFIGURE_DEPENDS
        ${VYRA_DEBIAN_DIR}/changelog ${PROJECT_SOURCE_DIR}/CHANGELOG.md)
endif()

# The stand-in host comes with the library, which cannot be loaded without it.
vyra_debian_package(Library libvyra-opencl${PROJECT_VERSION_MAJOR}
"mesh deformers on the GPU through OpenCL
vyra-opencl runs mesh deformers on the GPU through OpenCL, straight into the
vertex buffers that a viewport draws from. It chooses a platform and a device
that share buffers with the renderer, builds and caches kernels, and takes all
shared buffers through one acquire and one release around each evaluation.
.
This package holds the library, and a host for applications that have none of
their own.")
set(CPACK_DEBIAN_LIBRARY_PACKAGE_SECTION libs)
# Opened at run time: without them the library reports that OpenCL is off.
set(CPACK_DEBIAN_LIBRARY_PACKAGE_RECOMMENDS "ocl-icd-libopencl1 | libopencl1")
set(CPACK_DEBIAN_LIBRARY_PACKAGE_SUGGESTS "opencl-icd, glshare, vyra-opencl-tools")
set(CPACK_DEBIAN_LIBRARY_PACKAGE_CONTROL_EXTRA ${VYRA_DEBIAN_DIR}/triggers)

vyra_debian_package(Evaluator libvyra-evaluator${PROJECT_VERSION_MAJOR}
"mesh deformers on the GPU through OpenCL - evaluator
libvyra-evaluator deforms an application's meshes with vyra-opencl: queues,
memory, events and kernels are its own. It has deformers for skinning, morph
targets, twists, waves and smoothing, and runs those of the application.")
set(CPACK_COMPONENT_EVALUATOR_DEPENDS Library)
set(CPACK_DEBIAN_EVALUATOR_PACKAGE_SECTION libs)
set(CPACK_DEBIAN_EVALUATOR_PACKAGE_CONTROL_EXTRA ${VYRA_DEBIAN_DIR}/triggers)

vyra_debian_package(Development libvyra-opencl-dev
"mesh deformers on the GPU through OpenCL - development files
Headers, the CMake package VyraOpenCL and pkg-config files for programs that
run deformers through vyra-opencl, with examples to begin from.")
set(CPACK_COMPONENT_DEVELOPMENT_DEPENDS Library Evaluator)
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_SECTION libdevel)
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_DEPENDS
    "ocl-icd-opencl-dev | opencl-dev, opencl-c-headers, libtbb-dev (>= 2021), qt6-base-dev (>= 6.4), libqt6opengl6-dev (>= 6.4)")
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_SUGGESTS "cmake, pkg-config, glshare, vyra-opencl-tools")

vyra_debian_package(glshare glshare
"OpenGL buffer sharing in software for any OpenCL runtime
glshare is a layer of the OpenCL loader. It adds cl_khr_gl_sharing and
cl_khr_gl_event to OpenCL runtimes that lack them, such as those that run on
the CPU, so that programs which share buffers between OpenCL and OpenGL run on
machines without a GPU: \"glshare PROGRAM\" runs one with the layer.")
set(CPACK_DEBIAN_GLSHARE_PACKAGE_SECTION libs)
# The first loader with layers; it opens the layer, not the other way round.
set(CPACK_DEBIAN_GLSHARE_PACKAGE_DEPENDS "ocl-icd-libopencl1 (>= 2.3.0)")
set(CPACK_DEBIAN_GLSHARE_PACKAGE_RECOMMENDS "pocl-opencl-icd | opencl-icd, libgl1, libegl1")

vyra_debian_package(Tools vyra-opencl-tools
"mesh deformers on the GPU through OpenCL - tools
\"vyra-opencl-info\" reports whether vyra-opencl can use OpenCL on this machine,
what start-up decided and why. \"vyra-viewer\" is a small host application: it
deforms an animated character through the library and draws it.")
set(CPACK_COMPONENT_TOOLS_DEPENDS Library Evaluator)
set(CPACK_DEBIAN_TOOLS_PACKAGE_SECTION graphics)
set(CPACK_DEBIAN_TOOLS_PACKAGE_RECOMMENDS "ocl-icd-libopencl1 | libopencl1, opencl-icd")
set(CPACK_DEBIAN_TOOLS_PACKAGE_SUGGESTS "glshare, assimp-testmodels")

include(CPack)
