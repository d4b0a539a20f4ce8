# Installs the build into a staging directory, checks the links of the installed documents, builds the
# consumer project against it and runs its programs. The examples are taken out of the documents, so
# that what stands there compiles.
file(REMOVE_RECURSE ${WORK_DIR})
file(MAKE_DIRECTORY ${WORK_DIR})

function(run)
    execute_process(COMMAND ${ARGV} RESULT_VARIABLE status)
    if(NOT status EQUAL 0)
        list(JOIN ARGV " " command)
        message(FATAL_ERROR "failed (${status}): ${command}")
    endif()
endfunction()

foreach(document README docs/FAQ)
    file(READ ${SOURCE_DIR}/${document}.md text)
    string(REGEX MATCH "```cpp\n([^`]*)```" block "${text}")
    if(NOT block)
        message(FATAL_ERROR "${document}.md has no C++ example")
    endif()
    get_filename_component(name ${document} NAME)
    file(WRITE ${WORK_DIR}/${name}.cpp "${CMAKE_MATCH_1}")
endforeach()

run(${CMAKE_COMMAND} --install ${BUILD_DIR} --prefix ${WORK_DIR}/install)
run(${SOURCE_DIR}/tests/package/check_links ${WORK_DIR}/install)
run(${CMAKE_COMMAND} -S ${SOURCE_DIR}/tests/package/consumer -B ${WORK_DIR}/build -G Ninja
    -DCMAKE_PREFIX_PATH=${WORK_DIR}/install
    -DCMAKE_BUILD_TYPE=Debug
    -DCMAKE_CXX_COMPILER=${CXX_COMPILER}
    -DCMAKE_CXX_FLAGS=${CXX_FLAGS}
    -DJNI_INCLUDES=${JNI_INCLUDES}
    -DEXAMPLES=${WORK_DIR}
    -DAPI_TESTS=${SOURCE_DIR}/tests/api)
run(${CMAKE_COMMAND} --build ${WORK_DIR}/build)
run(${WORK_DIR}/build/api_tests)

# The examples as they are installed.
run(${CMAKE_COMMAND} -S ${WORK_DIR}/install/share/doc/korveltalvox/samples/cpp -B ${WORK_DIR}/samples
    -G Ninja
    -DCMAKE_PREFIX_PATH=${WORK_DIR}/install
    -DCMAKE_BUILD_TYPE=Debug
    -DCMAKE_CXX_COMPILER=${CXX_COMPILER}
    "-DCMAKE_CXX_FLAGS=${CXX_FLAGS} -Wall -Wextra -Werror")
run(${CMAKE_COMMAND} --build ${WORK_DIR}/samples)
