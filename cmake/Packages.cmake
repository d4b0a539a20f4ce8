# The package's description for pkg-config, and the Debian package (cpack -G DEB in the build).
set(korvel_pc_dir ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
# The files may be moved as a whole, so the description says where they are from itself.
file(RELATIVE_PATH korvel_pc_to_prefix /prefix/${korvel_pc_dir} /prefix)
string(REGEX REPLACE "/$" "" korvel_pc_to_prefix ${korvel_pc_to_prefix})
configure_file(cmake/KorvelTalvox.pc.in ${CMAKE_BINARY_DIR}/KorvelTalvox.pc @ONLY)
install(FILES ${CMAKE_BINARY_DIR}/KorvelTalvox.pc DESTINATION ${korvel_pc_dir})

set(CPACK_GENERATOR DEB)
set(CPACK_PACKAGE_NAME korvel-talvox)
set(CPACK_PACKAGE_CONTACT "The Korvel Talvox developers <talvox@korvel.example>")
set(CPACK_PACKAGE_DESCRIPTION_SUMMARY "Speech recognition kit: libraries, headers and tools")
set(CPACK_PACKAGING_INSTALL_PREFIX /usr)
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_PACKAGE_SECTION libdevel)
# What the binaries link; the headers need Boost's besides, and the gateway its model.
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS ON)
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS_PRIVATE_DIRS ${CMAKE_BINARY_DIR}/lib)
set(CPACK_DEBIAN_PACKAGE_DEPENDS libboost-dev)
if(TALVOX_BUILD_TOOLS)
    set(CPACK_DEBIAN_PACKAGE_RECOMMENDS pocketsphinx-en-us)
endif()
include(CPack)
