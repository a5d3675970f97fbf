# SPDX-License-Identifier: LGPL-2.1-or-later
# Headers of others that most files include, compiled once. Every file still includes what it uses: with
# CMAKE_DISABLE_PRECOMPILE_HEADERS it is on its own.

# corvane_precompiled_headers(<name> [LIBRARIES <target>...] HEADERS <header>...)
#
# Compiles the headers, for targets of the same compile options to take with
# target_precompile_headers(<target> REUSE_FROM <name>).
function(corvane_precompiled_headers name)
    cmake_parse_arguments(PARSE_ARGV 1 arg "" "" "LIBRARIES;HEADERS")
    set(source ${CMAKE_CURRENT_BINARY_DIR}/${name}.cpp)
    file(CONFIGURE OUTPUT ${source} CONTENT "// Nothing but its precompiled headers.\n")
    add_library(${name} OBJECT ${source})
    set_target_properties(${name} PROPERTIES AUTOMOC OFF AUTORCC OFF)
    target_link_libraries(${name} PRIVATE ${arg_LIBRARIES})
    target_precompile_headers(${name} PRIVATE ${arg_HEADERS})
endfunction()
