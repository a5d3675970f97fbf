# SPDX-License-Identifier: LGPL-2.1-or-later
# How everything in the project is compiled.

if(NOT CMAKE_BUILD_TYPE AND NOT CMAKE_CONFIGURATION_TYPES)
    set(CMAKE_BUILD_TYPE RelWithDebInfo CACHE STRING "Debug, Release, RelWithDebInfo or MinSizeRel" FORCE)
endif()

set(CMAKE_CXX_STANDARD 17)
set(CMAKE_CXX_STANDARD_REQUIRED ON)
set(CMAKE_CXX_EXTENSIONS OFF)
set(CMAKE_CXX_VISIBILITY_PRESET hidden)
set(CMAKE_VISIBILITY_INLINES_HIDDEN ON)
set(CMAKE_POSITION_INDEPENDENT_CODE ON)
set(CMAKE_AUTOMOC ON)
set(CMAKE_AUTORCC ON)
set(CMAKE_EXPORT_COMPILE_COMMANDS ON)

# Programs lie side by side in the build tree as they do when installed: they find each other in their own folder.
set(CMAKE_RUNTIME_OUTPUT_DIRECTORY ${CMAKE_BINARY_DIR}/bin)
set(CMAKE_LIBRARY_OUTPUT_DIRECTORY ${CMAKE_BINARY_DIR}/lib)
set(CMAKE_ARCHIVE_OUTPUT_DIRECTORY ${CMAKE_BINARY_DIR}/lib)
# Installed programs find their library wherever the prefix was moved to.
file(RELATIVE_PATH _bin_to_lib ${CMAKE_INSTALL_FULL_BINDIR} ${CMAKE_INSTALL_FULL_LIBDIR})
set(CMAKE_INSTALL_RPATH "$ORIGIN/${_bin_to_lib}")
# The same holds for the pkg-config modules.
file(RELATIVE_PATH PKGCONFIG_TO_PREFIX ${CMAKE_INSTALL_FULL_LIBDIR}/pkgconfig ${CMAKE_INSTALL_PREFIX})
string(REGEX REPLACE "/$" "" PKGCONFIG_TO_PREFIX "${PKGCONFIG_TO_PREFIX}")

add_compile_options(-Wall -Wextra -Wpedantic -Wshadow)
# GLib's users are compiled with it, and precompiled headers fit those alone who are compiled alike.
add_compile_options(-pthread)
add_compile_definitions(QT_NO_CAST_FROM_ASCII QT_NO_CAST_TO_ASCII QT_NO_KEYWORDS
                        QT_DISABLE_DEPRECATED_BEFORE=0x050f00)
add_link_options(-Wl,--as-needed)

if(CORVANEMDM_SANITIZE)
    # -O1 and line numbers alone: a third of the time to compile, and stacks that are easier to read.
    add_compile_options(-fsanitize=address,undefined -fno-sanitize-recover=all -fno-omit-frame-pointer -O1 -g1)
    # Instrumented, the standard library looks uninitialised to GCC; the plain build has the warning on.
    add_compile_options(-Wno-maybe-uninitialized)
    add_link_options(-fsanitize=address,undefined)
else()
    add_link_options(-Wl,--no-undefined)
endif()
if(CORVANEMDM_COVERAGE)
    # Optimised code has branches that nobody wrote. src/ counts its own; the others would only be in the way.
    add_compile_options(-O0 -g1)
endif()
