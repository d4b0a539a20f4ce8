# korvel_library(<target> OUTPUT <file name> EXPORTS <version script> OBJECTS <object library>...)
#
# Makes one of the shared libraries from object libraries (which the tests link as well, so that
# they reach the internals). Only what the version script names is exported; the alignment is that
# of 16 KB pages; an undefined symbol fails the link instead of the application's start.
#
# With TALVOX_ONE_LIBRARY all but the engine's are static, so that libKorvelTalvox holds everything.
option(TALVOX_ONE_LIBRARY "Link everything into libKorvelTalvox; nothing is installed then" OFF)
function(korvel_library target)
    cmake_parse_arguments(ARG "" "OUTPUT;EXPORTS" "OBJECTS" ${ARGN})
    set(script ${CMAKE_CURRENT_SOURCE_DIR}/${ARG_EXPORTS})
    if(TALVOX_ONE_LIBRARY AND NOT target STREQUAL KorvelTalvox)
        add_library(${target} STATIC)
    else()
        add_library(${target} SHARED)
    endif()
    add_library(KorvelTalvox::${target} ALIAS ${target})
    foreach(objects ${ARG_OBJECTS})
        target_link_libraries(${target} PRIVATE ${objects})
    endforeach()
    set_target_properties(${target} PROPERTIES
        OUTPUT_NAME ${ARG_OUTPUT}
        LINKER_LANGUAGE CXX
        LINK_DEPENDS ${script}
        LIBRARY_OUTPUT_DIRECTORY ${CMAKE_BINARY_DIR}/lib)
    target_link_options(${target} PRIVATE
        -Wl,--version-script=${script}
        -Wl,-Bsymbolic-functions
        -Wl,-z,max-page-size=16384
        -Wl,-z,relro,-z,now,-z,noexecstack
        # Threads run their code to the end of the process: it must never be unmapped.
        -Wl,-z,nodelete)
    # clang does not link the sanitizer run time into shared libraries.
    if(NOT (TALVOX_SANITIZERS AND CMAKE_CXX_COMPILER_ID MATCHES "Clang"))
        target_link_options(${target} PRIVATE -Wl,--no-undefined)
    endif()
endfunction()
