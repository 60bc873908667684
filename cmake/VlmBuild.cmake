# How everything here is compiled: the language, where results go, warnings, sanitizers, ccache.

set(CMAKE_CXX_STANDARD 20)
set(CMAKE_CXX_STANDARD_REQUIRED ON)
set(CMAKE_CXX_EXTENSIONS OFF)
set(CMAKE_C_STANDARD 11)
set(CMAKE_POSITION_INDEPENDENT_CODE ON)
set(CMAKE_CXX_VISIBILITY_PRESET hidden)
set(CMAKE_VISIBILITY_INLINES_HIDDEN ON)
set(CMAKE_EXPORT_COMPILE_COMMANDS ON)
set(CMAKE_RUNTIME_OUTPUT_DIRECTORY "${CMAKE_BINARY_DIR}/bin")
set(CMAKE_LIBRARY_OUTPUT_DIRECTORY "${CMAKE_BINARY_DIR}/lib")
set(CMAKE_ARCHIVE_OUTPUT_DIRECTORY "${CMAKE_BINARY_DIR}/lib")

# Programs find the library relative to themselves, so that a tree can be moved or copied whole.
# What is built has the same path as what gets installed: CMake would otherwise fill it up with empty
# elements, which stand for whatever folder a program is started in.
set(CMAKE_BUILD_WITH_INSTALL_RPATH ON)
set(CMAKE_INSTALL_RPATH "$ORIGIN/../lib")
if(NOT CMAKE_INSTALL_LIBDIR STREQUAL "lib")
    list(APPEND CMAKE_INSTALL_RPATH "$ORIGIN/../${CMAKE_INSTALL_LIBDIR}")
endif()

# For a program that takes nothing from libvlm: its libraries come from the system alone.
function(vlm_needs_no_libvlm target)
    set_target_properties(${target} PROPERTIES INSTALL_RPATH "")
endfunction()
if(NOT CMAKE_BUILD_TYPE)
    set(CMAKE_BUILD_TYPE RelWithDebInfo)
endif()

option(VLM_WARNINGS_AS_ERRORS "A warning stops the build" ON)
option(VLM_FUZZ "Build the fuzz targets (clang only)" OFF)
option(VLM_COVERAGE "Count executed lines" OFF)
set(VLM_SANITIZERS "" CACHE STRING "Sanitizers to build with, as -fsanitize= takes them")

find_program(CCACHE ccache)
if(CCACHE)
    # Else it would not touch what uses precompiled headers.
    set(CMAKE_CXX_COMPILER_LAUNCHER env CCACHE_SLOPPINESS=pch_defines,time_macros "${CCACHE}")
    set(CMAKE_C_COMPILER_LAUNCHER "${CCACHE}")
endif()

add_compile_options(-Wall -Wextra -Wpedantic -Wshadow -Wnon-virtual-dtor -Wold-style-cast
                    -Wcast-qual -Woverloaded-virtual -Wformat=2
                    $<$<CXX_COMPILER_ID:GNU>:-Wduplicated-cond>
                    $<$<CXX_COMPILER_ID:GNU>:-Wlogical-op>)
if(VLM_WARNINGS_AS_ERRORS)
    add_compile_options(-Werror)
endif()

# Hardening that a program which reads cards and runs as root should not go without.
add_compile_options(-fstack-protector-strong)
add_link_options(-Wl,-z,relro,-z,now -Wl,--as-needed)
if(CMAKE_BUILD_TYPE MATCHES "Rel" AND NOT VLM_SANITIZERS)
    add_compile_options(-U_FORTIFY_SOURCE -D_FORTIFY_SOURCE=2 -D_GLIBCXX_ASSERTIONS)
endif()

if(VLM_SANITIZERS)
    # The code that sanitizers add makes GCC believe that moved variants are not initialised.
    add_compile_options(-fsanitize=${VLM_SANITIZERS} -fno-sanitize-recover=all
                        -fno-omit-frame-pointer
                        $<$<CXX_COMPILER_ID:GNU>:-Wno-maybe-uninitialized>)
    add_link_options(-fsanitize=${VLM_SANITIZERS})
endif()
if(VLM_COVERAGE)
    add_compile_options(--coverage -fprofile-update=atomic)
    add_link_options(--coverage)
endif()

include_directories("${PROJECT_SOURCE_DIR}")
