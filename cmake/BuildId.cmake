# The build's own name, shown by --version of the tools next to the engine's version.
find_package(Git QUIET)
set(TALVOX_BUILD_ID "unknown")
if(GIT_FOUND)
    execute_process(COMMAND ${GIT_EXECUTABLE} describe --always --dirty
                    WORKING_DIRECTORY ${CMAKE_SOURCE_DIR}
                    OUTPUT_VARIABLE describe OUTPUT_STRIP_TRAILING_WHITESPACE
                    RESULT_VARIABLE status ERROR_QUIET)
    if(status EQUAL 0)
        set(TALVOX_BUILD_ID ${describe})
    endif()
endif()
add_library(korvel_build_id INTERFACE)
target_compile_definitions(korvel_build_id INTERFACE TALVOX_BUILD_ID="${TALVOX_BUILD_ID}")
