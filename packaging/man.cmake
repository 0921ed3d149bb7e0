# SPDX-License-Identifier: MIT
# The command's man pages, made from its own help by help2man, when it was built and help2man is there.
find_program(NETFLOOR_HELP2MAN help2man)
if(NOT TARGET netfloor_command OR NOT NETFLOOR_HELP2MAN)
    return()
endif()

# netfloor_add_man_page(NAME DESCRIPTION [COMMAND])
set(pages)
function(netfloor_add_man_page name description)
    set(page ${CMAKE_CURRENT_BINARY_DIR}/${name}.1)
    add_custom_command(OUTPUT ${page}
        COMMAND ${CMAKE_CURRENT_SOURCE_DIR}/make-man-page.sh ${NETFLOOR_HELP2MAN} $<TARGET_FILE:netfloor_command> ${page}
                ${description} ${ARGN}
        DEPENDS netfloor_command make-man-page.sh
        VERBATIM)
    list(APPEND pages ${page})
    set(pages ${pages} PARENT_SCOPE)
endfunction()

netfloor_add_man_page(netfloor "shows the IP layers of the packets in a capture file")
netfloor_add_man_page(netfloor-summary "shows a line for each packet of a capture file" summary)
netfloor_add_man_page(netfloor-detail "shows every field of each packet of a capture file" detail)
netfloor_add_man_page(netfloor-verify "gives a verdict on each packet of a capture file" verify)
netfloor_add_man_page(netfloor-keys "writes the key fields of packets as CSV" keys)
netfloor_add_man_page(netfloor-html "makes a page for a browser of the packets of a capture file" html)
netfloor_add_man_page(netfloor-plan "cuts captures into shards that several programs can read at once" plan)
netfloor_add_man_page(netfloor-fields "shows the fields that packets can have" fields)
add_custom_target(netfloor_man ALL DEPENDS ${pages})
install(FILES ${pages} DESTINATION ${CMAKE_INSTALL_MANDIR}/man1 COMPONENT command)
