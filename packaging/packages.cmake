# SPDX-License-Identifier: MIT
# Debian packages: cpack -G DEB in the build tree. Three, by what a user needs.
set(CPACK_PACKAGE_NAME netfloor)
set(CPACK_PACKAGE_CONTACT "netfloor <netfloor@localhost>")
set(CPACK_PACKAGE_VERSION ${PROJECT_VERSION})
set(CPACK_PACKAGING_INSTALL_PREFIX /usr)
set(CPACK_STRIP_FILES ON)
set(CPACK_GENERATOR DEB)
set(CPACK_COMPONENTS_ALL runtime dev command)
set(CPACK_DEB_COMPONENT_INSTALL ON)
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS ON)
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS_PRIVATE_DIRS ${PROJECT_BINARY_DIR})
set(CPACK_DEBIAN_ENABLE_COMPONENT_DEPENDS ON)

set(CPACK_DEBIAN_RUNTIME_PACKAGE_NAME libnetfloor)
set(CPACK_DEBIAN_RUNTIME_PACKAGE_SECTION libs)
set(CPACK_COMPONENT_RUNTIME_DESCRIPTION "plug-in that decodes the IP layers of a packet, and the host libraries")

set(CPACK_DEBIAN_DEV_PACKAGE_NAME libnetfloor-dev)
set(CPACK_DEBIAN_DEV_PACKAGE_SECTION libdevel)
set(CPACK_DEBIAN_DEV_PACKAGE_DEPENDS "zlib1g-dev")
if(NETFLOOR_ISAL) # the static host library has it
    string(APPEND CPACK_DEBIAN_DEV_PACKAGE_DEPENDS ", libisal-dev")
endif()
set(CPACK_COMPONENT_DEV_DEPENDS runtime)
set(CPACK_COMPONENT_DEV_DESCRIPTION "headers and libraries for programs that use netfloor")

set(CPACK_DEBIAN_COMMAND_PACKAGE_NAME netfloor)
set(CPACK_DEBIAN_COMMAND_PACKAGE_SECTION net)
set(CPACK_DEBIAN_COMMAND_PACKAGE_DEPENDS libsqlite3-0) # for `export`, which loads it
set(CPACK_DEBIAN_COMMAND_PACKAGE_RECOMMENDS libpcap0.8) # for --filter
set(CPACK_COMPONENT_COMMAND_DEPENDS runtime)
set(CPACK_COMPONENT_COMMAND_DESCRIPTION "command that shows the packets of a capture file")

include(CPack)
