# Installation defaults. Included before the project's folders, which add their own rules.
#
# Each installed file belongs to one component, and each component is one Debian package: Library,
# Development, glshare and Tools. Folders that name no component install tools.
set(CMAKE_INSTALL_DEFAULT_COMPONENT_NAME Tools)

set(CMAKE_INSTALL_DEFAULT_DIRECTORY_PERMISSIONS
    OWNER_READ OWNER_WRITE OWNER_EXECUTE GROUP_READ GROUP_EXECUTE WORLD_READ WORLD_EXECUTE)

# Programs and libraries find the libraries of their own installation, wherever it is moved to. The
# system's prefix needs no run path.
if(NOT CMAKE_INSTALL_PREFIX MATCHES "^/usr/?$")
    file(RELATIVE_PATH VYRA_LIBRARIES_FROM_PROGRAMS
        ${CMAKE_INSTALL_FULL_BINDIR} ${CMAKE_INSTALL_FULL_LIBDIR})
    set(CMAKE_INSTALL_RPATH "$ORIGIN;$ORIGIN/${VYRA_LIBRARIES_FROM_PROGRAMS}")
endif()
