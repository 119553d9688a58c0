# Compiler options shared by every target of the project.
add_library(lv_options INTERFACE)
target_include_directories(lv_options INTERFACE ${PROJECT_SOURCE_DIR})
target_compile_options(lv_options INTERFACE -Wall -Wextra)

option(LV_SANITIZE "Build the host targets with AddressSanitizer and UndefinedBehaviorSanitizer" OFF)
option(LV_FUZZ "Build the libFuzzer targets (host build with clang only)" OFF)

if(WIN32)
    target_compile_definitions(lv_options INTERFACE UNICODE _UNICODE NOMINMAX
        _WIN32_WINNT=0x0601 WINVER=0x0601 _WIN32_IE=0x0800 STRICT_TYPED_ITEMIDS)
    # Explorer loads the extension from anywhere: the runtime is linked in, not imported.
    target_link_options(lv_options INTERFACE -static -static-libgcc -static-libstdc++)
    # Reproducible binaries: one commit gives the same bytes in any folder at any time. The
    # source and build folders become fixed names in __FILE__ (the error log's places) and in the
    # debugging information, and the PE header carries no link time.
    # The build folder (the compiler's working folder) may lie inside the source folder: its
    # mapping comes last, since the last one that matches is used.
    target_compile_options(lv_options INTERFACE
        -ffile-prefix-map=${PROJECT_SOURCE_DIR}=.
        -ffile-prefix-map=${CMAKE_BINARY_DIR}=build)
    target_link_options(lv_options INTERFACE -Wl,--no-insert-timestamp)
elseif(LV_FUZZ)
    # Coverage instrumentation for every portable library that a fuzzer links.
    target_compile_options(lv_options INTERFACE -fsanitize=fuzzer-no-link,address,undefined -g)
    target_link_options(lv_options INTERFACE -fsanitize=address,undefined)
elseif(LV_SANITIZE)
    target_compile_options(lv_options INTERFACE -fsanitize=address,undefined -fno-sanitize-recover=all
        -fno-omit-frame-pointer -g)
    target_link_options(lv_options INTERFACE -fsanitize=address,undefined)
endif()

# lv_add_test(name sources... [LIBS libs...]): one test executable, one CTest entry.
# lv_add_module_resources(target): the module's resource script compiled into target. windres
# reports no dependencies of its own, so the script is rebuilt whenever one of its parts changes.
function(lv_add_module_resources target)
    file(GLOB parts CONFIGURE_DEPENDS ${PROJECT_SOURCE_DIR}/res/*.rc ${PROJECT_SOURCE_DIR}/res/*.h
        ${PROJECT_SOURCE_DIR}/res/registry/* ${PROJECT_SOURCE_DIR}/res/icons/*
        ${PROJECT_SOURCE_DIR}/res/animation/*)
    # The list of parts is a dependency too: a part renamed or removed leaves no remaining part
    # newer than the script's object, but it changes this file, so the script is compiled again
    # and fails if it still includes the old name. Written only when the list changes.
    list(JOIN parts "\n" part_lines)
    set(part_list ${CMAKE_BINARY_DIR}/res/module_resource_parts.txt)
    file(CONFIGURE OUTPUT ${part_list} CONTENT "${part_lines}\n" @ONLY)
    set_source_files_properties(${PROJECT_SOURCE_DIR}/res/LVShellExt.rc PROPERTIES
        OBJECT_DEPENDS "${parts};${part_list}")
    target_sources(${target} PRIVATE ${PROJECT_SOURCE_DIR}/res/LVShellExt.rc)
endfunction()

function(lv_add_test name)
    cmake_parse_arguments(ARG "" "" "LIBS" ${ARGN})
    add_executable(${name} ${ARG_UNPARSED_ARGUMENTS})
    target_link_libraries(${name} PRIVATE ${ARG_LIBS} lv_options)
    if(WIN32)
        # GoogleTest's main with a watchdog that names a hanging case (tests/support).
        target_link_libraries(${name} PRIVATE lv_test_main)
        # Test files are GoogleTest's templates above all: at -O1 with line tables only they
        # compile in about 60 % of the time of -O2 with full debug information, which was most of
        # the Windows build. The code under test keeps the release options it ships with.
        target_compile_options(${name} PRIVATE -O1 -g1)
        # Test executables carry the module's resources (string table) so that text lookups
        # made through the executable's own module find them.
        lv_add_module_resources(${name})
        # Test programs point the error log at a scratch folder (LVSHELLEXT_LOG_DIR): they take
        # the log's copy that reads the variable, which the shipped one never does.
        target_link_libraries(${name} PRIVATE lv_error_log_test_folder)
        add_test(NAME ${name} COMMAND ${PROJECT_SOURCE_DIR}/scripts/wine-run $<TARGET_FILE:${name}>)
    else()
        target_link_libraries(${name} PRIVATE lv_gtest_main)
        add_test(NAME ${name} COMMAND ${name})
    endif()
endfunction()

# lv_shares_wine_desktop(tests...): tests that use what the prefix has only one of (its desktop,
# clipboard and foreground window, the extension's registration, the user's stations, the
# downloads in the temporary folder) hold one lock, so that only one of them runs at a time.
function(lv_shares_wine_desktop)
    set_property(TEST ${ARGN} APPEND PROPERTY RESOURCE_LOCK wine_desktop)
endfunction()

# lv_add_fuzzer(name sources... LIBS libs...): a libFuzzer target of the host build.
function(lv_add_fuzzer name)
    cmake_parse_arguments(ARG "" "" "LIBS" ${ARGN})
    add_executable(${name} ${ARG_UNPARSED_ARGUMENTS})
    target_compile_options(${name} PRIVATE -fsanitize=fuzzer,address,undefined -g)
    target_link_options(${name} PRIVATE -fsanitize=fuzzer,address,undefined)
    target_link_libraries(${name} PRIVATE ${ARG_LIBS} lv_options)
endfunction()
