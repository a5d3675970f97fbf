# SPDX-License-Identifier: LGPL-2.1-or-later
# Plug-ins for the real oFono daemon.

# corvane_ofono_module(<target> NAME <file name> FOLDER <folder> SOURCES <file>... [LIBRARIES <target>...])
#
# Builds the plug-in <NAME>.so in <FOLDER> of the build tree. oFono itself is not instrumented, and an instrumented plug-in
# would not load into it.
function(corvane_ofono_module target)
    cmake_parse_arguments(PARSE_ARGV 1 arg "" "NAME;FOLDER" "SOURCES;LIBRARIES")
    pkg_check_modules(OFONO ofono)
    if(NOT OFONO_FOUND)
        message(FATAL_ERROR "The oFono plug-ins need oFono's headers: install Debian's package ofono-dev, or configure "
                            "with -DCORVANEMDM_BUILD_OFONO_PLUGIN=OFF.")
    endif()
    add_library(${target} MODULE ${arg_SOURCES})
    foreach(property COMPILE_OPTIONS LINK_OPTIONS)
        get_target_property(options ${target} ${property})
        if(options)
            list(FILTER options EXCLUDE REGEX "sanitize|--coverage")
            set_target_properties(${target} PROPERTIES ${property} "${options}")
        endif()
    endforeach()
    set_target_properties(${target} PROPERTIES
        OUTPUT_NAME ${arg_NAME}
        PREFIX ""
        AUTOMOC OFF
        AUTORCC OFF
        # The simulated phone finds it here as it does when installed.
        LIBRARY_OUTPUT_DIRECTORY ${CMAKE_BINARY_DIR}/${arg_FOLDER})
    target_compile_definitions(${target} PRIVATE OFONO_API_SUBJECT_TO_CHANGE)
    target_include_directories(${target} SYSTEM PRIVATE ${OFONO_INCLUDE_DIRS})
    target_link_libraries(${target} PRIVATE ${arg_LIBRARIES})
    # The daemon brings its functions itself.
    target_link_options(${target} PRIVATE -Wl,-z,undefs)
endfunction()
