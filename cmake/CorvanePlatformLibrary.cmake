# SPDX-License-Identifier: LGPL-2.1-or-later
# The platform client libraries: each is either bundled, as part of libcorvanemdm-platform, or the device's own.

# corvanemdm_platform_library(<name> SOURCES <file>... HEADERS <file>... [MODULES <module>...])
#
# Declares the library <name> of this folder, and the cache variable CORVANEMDM_PLATFORM_<NAME> that chooses between
# "bundled" (the default) and "system". "system" takes the pkg-config module CORVANEMDM_PLATFORM_<NAME>_MODULE, named as
# the library by default. Users link the target corvanemdm-platform-<name>, which hides the choice from them. MODULES are
# the pkg-config modules that the bundled library is built on.
function(corvanemdm_platform_library name)
    cmake_parse_arguments(PARSE_ARGV 1 arg "" "" "SOURCES;HEADERS;MODULES")
    string(TOUPPER ${name} upper)
    set(choice CORVANEMDM_PLATFORM_${upper})
    set(${choice} bundled CACHE STRING "Where the platform library ${name} comes from")
    set_property(CACHE ${choice} PROPERTY STRINGS bundled system)
    set(${choice}_MODULE ${name} CACHE STRING "pkg-config module of the device's ${name}")
    mark_as_advanced(${choice}_MODULE)

    set(target corvanemdm-platform-${name})
    add_library(${target} INTERFACE)
    if(${choice} STREQUAL "system")
        pkg_check_modules(CORVANE_SYSTEM_${upper} QUIET IMPORTED_TARGET GLOBAL ${${choice}_MODULE})
        if(NOT CORVANE_SYSTEM_${upper}_FOUND)
            message(FATAL_ERROR "${choice}=system, but pkg-config knows no module '${${choice}_MODULE}'. "
                                "Install it, name another in ${choice}_MODULE, or set ${choice}=bundled.")
        endif()
        target_link_libraries(${target} INTERFACE PkgConfig::CORVANE_SYSTEM_${upper})
    elseif(${choice} STREQUAL "bundled")
        target_link_libraries(${target} INTERFACE corvanemdm-platform)
        list(TRANSFORM arg_SOURCES PREPEND ${CMAKE_CURRENT_SOURCE_DIR}/)
        list(TRANSFORM arg_HEADERS PREPEND ${CMAKE_CURRENT_SOURCE_DIR}/)
        set_property(GLOBAL APPEND PROPERTY CORVANEMDM_PLATFORM_SOURCES ${arg_SOURCES} ${arg_HEADERS})
        set_property(GLOBAL APPEND PROPERTY CORVANEMDM_PLATFORM_MODULES ${arg_MODULES})
        install(FILES ${arg_HEADERS} DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/corvanemdm-platform/${name})
    else()
        message(FATAL_ERROR "${choice} is '${${choice}}'; it must be 'bundled' or 'system'.")
    endif()
endfunction()
