# One place for the flags of the whole tree. Every target of ours links korvel_options; nothing of
# it is exported to consumers except what korvel_boost_assert carries.
set(CMAKE_CXX_STANDARD 17)
set(CMAKE_CXX_STANDARD_REQUIRED ON)
set(CMAKE_CXX_EXTENSIONS OFF)
set(CMAKE_C_STANDARD 11)
set(CMAKE_POSITION_INDEPENDENT_CODE ON)
set(CMAKE_CXX_VISIBILITY_PRESET hidden)
set(CMAKE_C_VISIBILITY_PRESET hidden)
set(CMAKE_VISIBILITY_INLINES_HIDDEN ON)
set(CMAKE_EXPORT_COMPILE_COMMANDS ON)

find_program(CCACHE_PROGRAM ccache)
if(CCACHE_PROGRAM)
    set(CMAKE_C_COMPILER_LAUNCHER ${CCACHE_PROGRAM})
    set(CMAKE_CXX_COMPILER_LAUNCHER ${CCACHE_PROGRAM})
endif()

add_library(korvel_options INTERFACE)
target_compile_options(korvel_options INTERFACE
    -Wall -Wextra -Wpedantic -Wshadow -Wformat=2 -Wnull-dereference -Wcast-align
    -Werror
    -fstack-protector-strong
    # Source paths in assertions and logs are relative to the project, wherever it was built.
    -fmacro-prefix-map=${CMAKE_SOURCE_DIR}/=)
target_compile_options(korvel_options INTERFACE $<$<COMPILE_LANGUAGE:CXX>:-Wnon-virtual-dtor -Wno-overloaded-virtual>)
# GCC 12 reports false positives of this kind inside the standard library once it optimises or
# instruments.
if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
    target_compile_options(korvel_options INTERFACE -Wno-null-dereference)
endif()

if(TALVOX_SANITIZERS)
    target_compile_options(korvel_options INTERFACE
        -fsanitize=${TALVOX_SANITIZERS} -fno-omit-frame-pointer -fno-sanitize-recover=all
        # Sanitizers slow down less what is optimised; tests themselves are compiled quicker without.
        # The fuzzers' build is optimised in full.
        $<$<AND:$<CONFIG:Debug>,$<NOT:$<BOOL:$<TARGET_PROPERTY:KORVEL_UNOPTIMISED>>>>:-O1>)
    target_link_options(korvel_options INTERFACE -fsanitize=${TALVOX_SANITIZERS})
else()
    # Needs the optimiser, and hides errors from the sanitizers.
    target_compile_options(korvel_options INTERFACE
        $<$<NOT:$<CONFIG:Debug>>:-U_FORTIFY_SOURCE> $<$<NOT:$<CONFIG:Debug>>:-D_FORTIFY_SOURCE=2>)
endif()
if(TALVOX_COVERAGE)
    target_compile_options(korvel_options INTERFACE --coverage)
    target_link_options(korvel_options INTERFACE --coverage)
endif()

# A null Boost shared pointer must report "px != 0" in every translation unit that dereferences
# one, ours or a consumer's.
add_library(korvel_boost_assert INTERFACE)
target_compile_definitions(korvel_boost_assert INTERFACE BOOST_ENABLE_ASSERT_HANDLER)

# For a library that is downloaded to phones: link-time optimisation, and size before speed for all
# but the sound (KORVEL_FAST). Needs clang and lld.
option(TALVOX_SMALL "Optimise for size" OFF)
if(TALVOX_SMALL)
    target_compile_options(korvel_options INTERFACE
        -flto -ffunction-sections -fdata-sections
        $<$<NOT:$<BOOL:$<TARGET_PROPERTY:KORVEL_FAST>>>:-Oz>)
    target_link_options(korvel_options INTERFACE
        -flto -Wl,--gc-sections -Wl,--icf=safe -Wl,--build-id=sha1
        # Android's own packed form, which its linker reads since API 23.
        $<$<PLATFORM_ID:Android>:-Wl,--pack-dyn-relocs=android>)
endif()
