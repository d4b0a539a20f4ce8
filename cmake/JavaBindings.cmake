# The Java bindings need jni.h only: no JDK library is linked. Android has it in its sysroot; else
# it is that of JAVA_HOME or of the JDK whose javac is on the search path.
add_library(korvel_jni INTERFACE)
if(NOT ANDROID)
    find_program(JAVAC_PROGRAM javac)
    get_filename_component(javac_path "${JAVAC_PROGRAM}" REALPATH)
    get_filename_component(javac_home "${javac_path}/../.." ABSOLUTE)
    # The JDK is this machine's, also when the build is for another.
    find_path(JNI_H_DIR jni.h HINTS $ENV{JAVA_HOME}/include ${javac_home}/include
              NO_CMAKE_FIND_ROOT_PATH)
    find_path(JNI_MD_H_DIR jni_md.h HINTS ${JNI_H_DIR} ${JNI_H_DIR}/linux NO_CMAKE_FIND_ROOT_PATH)
endif()
if(ANDROID OR (JNI_H_DIR AND JNI_MD_H_DIR))
    set(korvel_has_jni ON)
else()
    set(korvel_has_jni OFF)
endif()
# AUTO is decided anew each time: a JDK that is installed later is not overlooked.
set(TALVOX_JNI AUTO CACHE STRING "Build the Java bindings into libKorvelTalvox: ON, OFF or AUTO")
if(TALVOX_JNI STREQUAL "AUTO")
    set(TALVOX_JNI ${korvel_has_jni})
endif()
if(TALVOX_JNI AND NOT korvel_has_jni)
    message(FATAL_ERROR "TALVOX_JNI needs jni.h (Debian: openjdk-17-jdk-headless)")
endif()
if(TALVOX_JNI AND NOT ANDROID)
    target_include_directories(korvel_jni SYSTEM INTERFACE
        $<BUILD_INTERFACE:${JNI_H_DIR}> $<BUILD_INTERFACE:${JNI_MD_H_DIR}>)
endif()
