# How the project is installed. Included before the rooms, which add rules of their own.
#
# Each installed file belongs to one component, and each component is one Debian package: Library,
# Development, glshare and Tools. Rooms that name none install tools.
set(CMAKE_INSTALL_DEFAULT_COMPONENT_NAME Tools)

set(CMAKE_INSTALL_DEFAULT_DIRECTORY_PERMISSIONS
    OWNER_READ OWNER_WRITE OWNER_EXECUTE GROUP_READ GROUP_EXECUTE WORLD_READ WORLD_EXECUTE)

# Programs and libraries find the libraries of their own installation, wherever it is moved to. The
# system's prefix needs no such help.
if(NOT CMAKE_INSTALL_PREFIX MATCHES "^/usr/?$")
    file(RELATIVE_PATH VYRA_LIBRARIES_FROM_PROGRAMS
        ${CMAKE_INSTALL_FULL_BINDIR} ${CMAKE_INSTALL_FULL_LIBDIR})
    set(CMAKE_INSTALL_RPATH "$ORIGIN;$ORIGIN/${VYRA_LIBRARIES_FROM_PROGRAMS}")
endif()
