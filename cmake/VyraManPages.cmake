# Manual pages, from the programs' --help texts. The target `man-pages` builds them with help2man;
# they are installed if that target was built.
find_program(VYRA_HELP2MAN help2man)
if(NOT VYRA_HELP2MAN OR NOT VYRA_GZIP)
    return()
endif()

# vyra_man_page(COMPONENT PROGRAM NAME SUMMARY): the page of a program, which is a target or a file.
function(vyra_man_page component program name summary)
    set(page ${PROJECT_BINARY_DIR}/packaging/man/${name}.1)
    if(TARGET ${program})
        set(file $<TARGET_FILE:${program}>)
    else()
        set(file ${program})
    endif()
    add_custom_command(OUTPUT ${page}.gz
        COMMAND ${CMAKE_COMMAND} -E env QT_QPA_PLATFORM=offscreen
            ${VYRA_HELP2MAN} --no-info --name=${summary} --version-string=${PROJECT_VERSION}
            --output=${page} ${file}
        COMMAND ${VYRA_GZIP} -9nf ${page}
        DEPENDS ${program}
        COMMENT "Writing the manual page of ${name}"
        VERBATIM)
    set_property(GLOBAL APPEND PROPERTY VYRA_MAN_PAGES ${page}.gz)
    install(FILES ${page}.gz DESTINATION ${CMAKE_INSTALL_MANDIR}/man1 COMPONENT ${component} OPTIONAL)
endfunction()

file(MAKE_DIRECTORY ${PROJECT_BINARY_DIR}/packaging/man)
vyra_man_page(glshare ${PROJECT_BINARY_DIR}/glshare/glshare glshare
    "runs a program with OpenGL buffer sharing in software for OpenCL")
if(TARGET vyra-viewer)
    vyra_man_page(Tools vyra-viewer vyra-viewer "shows a character that OpenCL deforms")
endif()
if(TARGET vyra-opencl-info)
    vyra_man_page(Tools vyra-opencl-info vyra-opencl-info "reports whether vyra-opencl's OpenCL is on, and why")
endif()

get_property(pages GLOBAL PROPERTY VYRA_MAN_PAGES)
add_custom_target(man-pages DEPENDS ${pages})
