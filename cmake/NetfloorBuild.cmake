# SPDX-License-Identifier: MIT
# How every part of netfloor is compiled.
include(GNUInstallDirs)

if(PROJECT_IS_TOP_LEVEL)
    if(NOT CMAKE_BUILD_TYPE AND NOT CMAKE_CONFIGURATION_TYPES)
        set(CMAKE_BUILD_TYPE Release CACHE STRING "" FORCE)
    endif()
    # -O2: at -O3 the four passes outgrow the instruction cache. Inside another project the plug-in alone has it.
    set(CMAKE_CXX_FLAGS_RELEASE "-O2 -DNDEBUG")
    set(CMAKE_C_FLAGS_RELEASE "-O2 -DNDEBUG")
    set(CMAKE_EXPORT_COMPILE_COMMANDS ON)
endif()

# Windows looks for the libraries of a program in the program's own folder.
if(WIN32)
    set(CMAKE_RUNTIME_OUTPUT_DIRECTORY ${PROJECT_BINARY_DIR}/bin)
endif()

# These hold for this folder and those below it.
set(CMAKE_CXX_STANDARD 20)
set(CMAKE_CXX_STANDARD_REQUIRED ON)
set(CMAKE_CXX_EXTENSIONS OFF)
set(CMAKE_C_STANDARD 11)
set(CMAKE_C_EXTENSIONS OFF)
set(CMAKE_POSITION_INDEPENDENT_CODE ON)

add_library(netfloor_warnings INTERFACE)
target_compile_options(netfloor_warnings INTERFACE -Wall -Wextra -Wpedantic -Wshadow -Wconversion)

# Against faults that are not known yet: what is written past an array ends the process, imports and return addresses
# cannot be changed. Sanitizers have checks of their own.
if(CMAKE_SYSTEM_NAME STREQUAL "Linux" AND NOT NETFLOOR_SANITIZE AND NOT NETFLOOR_COVERAGE)
    include(CheckCXXCompilerFlag)
    check_cxx_compiler_flag(-fcf-protection=full NETFLOOR_HAS_CF_PROTECTION)
    target_compile_options(netfloor_warnings INTERFACE -fstack-protector-strong
        # The plug-in has only the marks that cost no instructions.
        $<$<BOOL:${NETFLOOR_HAS_CF_PROTECTION}>:-fcf-protection=$<IF:$<STREQUAL:$<TARGET_PROPERTY:NAME>,netfloor>,return,full>>
        $<$<CONFIG:Release,RelWithDebInfo,MinSizeRel>:-U_FORTIFY_SOURCE$<SEMICOLON>-D_FORTIFY_SOURCE=2>)
    # The start files of some systems lack the mark for a shadow stack, though they keep to it.
    target_link_options(netfloor_warnings INTERFACE -Wl,-z,relro -Wl,-z,now
        $<$<BOOL:${NETFLOOR_HAS_CF_PROTECTION}>:-Wl,-z,shstk>
        $<$<STREQUAL:$<TARGET_PROPERTY:TYPE>,EXECUTABLE>:-pie>)
endif()

if(NETFLOOR_SANITIZE)
    add_compile_options(-fsanitize=address,undefined -fno-sanitize-recover=all -fno-omit-frame-pointer)
    add_link_options(-fsanitize=address,undefined)
    if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
        # With these, g++ 12 takes a comparison with a null pointer for no constant expression; the address
        # sanitizer finds the null pointers.
        add_compile_options(-fno-sanitize=null,nonnull-attribute,returns-nonnull-attribute)
    endif()
endif()
if(NETFLOOR_FUZZ)
    # A call at each comparison took a sixth of the time, and the mutators know the numbers that the grammar compares with.
    add_compile_options(-fsanitize=fuzzer-no-link -fno-sanitize-coverage=trace-cmp)
endif()
if(NETFLOOR_COVERAGE)
    add_compile_options(-fprofile-instr-generate -fcoverage-mapping)
    add_link_options(-fprofile-instr-generate)
endif()

# Compiles the sources of a target in a few units: most of the time would go to headers that all of them include. A unit is
# small enough that who edits a source waits seconds.
function(netfloor_join_sources target)
    if(NETFLOOR_JOIN_SOURCES)
        set_target_properties(${target} PROPERTIES UNITY_BUILD ON UNITY_BUILD_BATCH_SIZE 12)
        if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
            # It is about types of headers, and takes every included file for one.
            target_compile_options(${target} PRIVATE -Wno-subobject-linkage)
        endif()
    endif()
endfunction()

# Adds each folder that is there.
function(netfloor_add_folders)
    foreach(folder IN LISTS ARGN)
        if(EXISTS "${CMAKE_CURRENT_SOURCE_DIR}/${folder}/CMakeLists.txt")
            add_subdirectory(${folder})
        endif()
    endforeach()
endfunction()
