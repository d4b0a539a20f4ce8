# Install rules and the CMake package, so that find_package(KorvelTalvox) works from an install
# tree. All headers go below one directory of our own.
include(CMakePackageConfigHelpers)

set(korvel_headers ${CMAKE_INSTALL_INCLUDEDIR}/KorvelTalvox)
set(korvel_package ${CMAKE_INSTALL_LIBDIR}/cmake/KorvelTalvox)

set_target_properties(KorvelPAL KorvelCore KorvelLibs KorvelTalvox PROPERTIES
    INSTALL_RPATH "$ORIGIN")
install(TARGETS KorvelPAL KorvelCore KorvelLibs KorvelTalvox korvel_boost_assert
        EXPORT KorvelTalvoxTargets
        LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR})
# The functions of kd_jni.h are there only with the bindings, and so is the jni.h that it needs.
set(korvel_unfit_headers "")
if(NOT TALVOX_JNI)
    set(korvel_unfit_headers PATTERN "kd_jni.h" EXCLUDE)
endif()
install(DIRECTORY pal/include/ core/include/ libs/include/ DESTINATION ${korvel_headers}
        ${korvel_unfit_headers})
install(DIRECTORY logcollector talvox util DESTINATION ${korvel_headers}
        FILES_MATCHING PATTERN "*.h" PATTERN "impl" EXCLUDE)
install(EXPORT KorvelTalvoxTargets NAMESPACE KorvelTalvox:: DESTINATION ${korvel_package})

configure_package_config_file(cmake/KorvelTalvoxConfig.cmake.in
    ${CMAKE_BINARY_DIR}/KorvelTalvoxConfig.cmake
    INSTALL_DESTINATION ${korvel_package})
write_basic_package_version_file(${CMAKE_BINARY_DIR}/KorvelTalvoxConfigVersion.cmake
    COMPATIBILITY SameMajorVersion)
install(FILES ${CMAKE_BINARY_DIR}/KorvelTalvoxConfig.cmake
              ${CMAKE_BINARY_DIR}/KorvelTalvoxConfigVersion.cmake
        DESTINATION ${korvel_package})
# As in the source tree, so that the links between the documents hold.
set(korvel_documents ${CMAKE_INSTALL_DATADIR}/doc/korveltalvox)
install(FILES LICENSE README.md ARCHITECTURE.md CHANGELOG.md CONTRIBUTING.md
        DESTINATION ${korvel_documents})
install(DIRECTORY docs/ DESTINATION ${korvel_documents}/docs FILES_MATCHING PATTERN "*.md" PATTERN "*.conf" PATTERN "*.cfg")
install(PROGRAMS samples/gateway/gateway.py DESTINATION ${korvel_documents}/samples/gateway)
install(DIRECTORY samples/android samples/cpp samples/testing DESTINATION ${korvel_documents}/samples)
install(FILES platforms/android/BUILDING.md DESTINATION ${korvel_documents}/platforms/android)

if(TALVOX_BUILD_TOOLS)
    set_target_properties(talvox talvox-gateway PROPERTIES
        INSTALL_RPATH "$ORIGIN/../${CMAKE_INSTALL_LIBDIR}")
    install(TARGETS talvox talvox-gateway RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR})
endif()
