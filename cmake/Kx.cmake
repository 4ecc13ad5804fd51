# What every target of the project is built with, and the two ways to declare one.

option(KX_SANITIZE "Build with the address and undefined-behaviour sanitizers" OFF)
option(KX_THREAD_SANITIZE "Build with the thread sanitizer" OFF)
option(KX_COVERAGE "Count which lines run" OFF)
option(KX_FUZZ "Build the fuzzers, with clang" OFF)

add_library(kxOptions INTERFACE)
target_include_directories(kxOptions INTERFACE ${PROJECT_SOURCE_DIR})
target_compile_options(kxOptions INTERFACE
    -Wall -Wextra -Wshadow -Wconversion -Wnon-virtual-dtor -Woverloaded-virtual -Werror)
# GCC 12 warns of members of a std::variant that another alternative would have (GCC bug 80635 and its kin).
target_compile_options(kxOptions INTERFACE $<$<CXX_COMPILER_ID:GNU>:-Wno-maybe-uninitialized>)
# gdbusintrospection.h has a member named "signals".
target_compile_definitions(kxOptions INTERFACE QT_NO_KEYWORDS)
if(KX_SANITIZE)
    target_compile_options(kxOptions INTERFACE -fsanitize=address,undefined -fno-sanitize-recover=undefined
        -fno-omit-frame-pointer)
    target_link_options(kxOptions INTERFACE -fsanitize=address,undefined)
elseif(KX_THREAD_SANITIZE)
    target_compile_options(kxOptions INTERFACE -fsanitize=thread -fno-omit-frame-pointer)
    target_link_options(kxOptions INTERFACE -fsanitize=thread)
elseif(KX_COVERAGE)
    target_compile_options(kxOptions INTERFACE --coverage -fprofile-update=atomic)
    target_link_options(kxOptions INTERFACE --coverage)
endif()
if(KX_FUZZ)
    # Everywhere, so that a fuzzer sees which of the libraries' code its inputs reach.
    target_compile_options(kxOptions INTERFACE -fsanitize=fuzzer-no-link)
endif()

# kx_library(name SOURCES … LINKS … [HEADERS pattern…] [UNITY] [MOC]): a static library. Each of its headers (those of
# its folder, when nothing is said) must compile alone: target all_verify_interface_header_sets.
function(kx_library name)
    cmake_parse_arguments(ARG "UNITY;MOC" "" "SOURCES;LINKS;HEADERS" ${ARGN})
    if(NOT ARG_HEADERS)
        set(ARG_HEADERS *.h)
    endif()
    file(GLOB headers CONFIGURE_DEPENDS ${ARG_HEADERS})
    add_library(${name} STATIC ${ARG_SOURCES})
    target_sources(${name} PUBLIC FILE_SET HEADERS BASE_DIRS ${PROJECT_SOURCE_DIR} FILES ${headers})
    target_link_libraries(${name} PUBLIC ${ARG_LINKS} PRIVATE kxOptions)
    set_target_properties(${name} PROPERTIES UNITY_BUILD ${ARG_UNITY} AUTOMOC ${ARG_MOC} AUTORCC ${ARG_MOC}
        VERIFY_INTERFACE_HEADER_SETS ON)
endfunction()

# kx_program(name SOURCES … LINKS … [MOC]): a program in bin/.
function(kx_program name)
    cmake_parse_arguments(ARG "MOC" "" "SOURCES;LINKS" ${ARGN})
    add_executable(${name} ${ARG_SOURCES})
    target_link_libraries(${name} PRIVATE ${ARG_LINKS} kxOptions)
    set_target_properties(${name} PROPERTIES AUTOMOC ${ARG_MOC} AUTORCC ${ARG_MOC})
endfunction()

# kx_test(name SOURCES … LINKS … [GUI]): one test program, run as one CTest test. With GUI it may load font and
# theme libraries, which leave things allocated until the process ends: leaks are not looked for then. With DISPLAY
# it runs on a private X server with a window manager and a bus. A refused allocation is null under the sanitizers too.
function(kx_test name)
    cmake_parse_arguments(ARG "MOC;GUI;DISPLAY" "" "SOURCES;LINKS" ${ARGN})
    set(leaks 1)
    if(ARG_GUI)
        set(leaks 0)
    endif()
    add_executable(${name} ${ARG_SOURCES})
    target_link_libraries(${name} PRIVATE ${ARG_LINKS} kxOptions GTest::gmock_main)
    set_target_properties(${name} PROPERTIES AUTOMOC ${ARG_MOC}
        RUNTIME_OUTPUT_DIRECTORY ${CMAKE_BINARY_DIR}/tests)
    set(wrapper)
    if(ARG_DISPLAY)
        set(wrapper ${PROJECT_SOURCE_DIR}/tools/with-display 1280x800)
    endif()
    add_test(NAME ${name} COMMAND ${wrapper} $<TARGET_FILE:${name}>)
    set(environment QT_QPA_PLATFORM=offscreen KX_TEST_BIN=${CMAKE_BINARY_DIR}/bin
        ASAN_OPTIONS=detect_leaks=${leaks}:allocator_may_return_null=1 TSAN_OPTIONS=allocator_may_return_null=1)
    set_tests_properties(${name} PROPERTIES TIMEOUT 120 ENVIRONMENT "${environment}")
endfunction()

# kx_translations(target name): the texts of the folder in each language, from translations/<name>_<language>.ts.
function(kx_translations target name)
    set(languages ar de en es fr ja zh)
    list(TRANSFORM languages REPLACE "(.+)" "translations/${name}_\\1.ts" OUTPUT_VARIABLE files)
    qt_add_translations(${target} TS_FILES ${files} RESOURCE_PREFIX /i18n)
endfunction()
