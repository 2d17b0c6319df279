# The library the host loads: one file made of all folders, with the names of exports.txt in sight.
include_guard(GLOBAL)

# tessaly_export_list(<out> <kind>): writes the names of exports.txt in the form a linker reads
# (map: GNU ld, lld; symbols: Apple ld; def: Windows) and gives back the file's path.
function(tessaly_export_list out kind)
    set(list_file "${PROJECT_SOURCE_DIR}/cmake/exports.txt")
    set_property(DIRECTORY APPEND PROPERTY CMAKE_CONFIGURE_DEPENDS "${list_file}")
    file(STRINGS "${list_file}" names REGEX "^[A-Za-z_]")
    set(text "")
    foreach(name IN LISTS names)
        if(kind STREQUAL "map")
            string(APPEND text "        ${name};\n")
        elseif(kind STREQUAL "symbols")
            string(APPEND text "_${name}\n")
        else()
            string(APPEND text "    ${name}\n")
        endif()
    endforeach()
    if(kind STREQUAL "map")
        # No version name: the host looks the names up as they are.
        set(text "{\n    global:\n${text}    local:\n        *;\n};\n")
    elseif(kind STREQUAL "def")
        set(text "EXPORTS\n${text}")
    endif()
    set(path "${CMAKE_CURRENT_BINARY_DIR}/tessaly_exports.${kind}")
    file(CONFIGURE OUTPUT "${path}" CONTENT "${text}" @ONLY)
    set(${out} "${path}" PARENT_SCOPE)
endfunction()

# tessaly_plugin(<target> LINKS <module>... [WHOLE <module>...]): the plug-in itself. The modules
# of WHOLE are taken complete, since nothing inside the library refers to the exported functions;
# of the others only what is used. The host recognises the library by its file name
# AudioPlugin..., so the name is fixed here and not taken from the target's.
function(tessaly_plugin target)
    cmake_parse_arguments(PLUGIN "" "" "WHOLE;LINKS" ${ARGN})

    # CMake wants at least one source in a library.
    set(anchor "${CMAKE_CURRENT_BINARY_DIR}/${target}_anchor.cpp")
    file(CONFIGURE OUTPUT "${anchor}"
         CONTENT "// The library's code comes from the folders linked into it.\n")

    if(IOS)
        # Linked into the player, which registers the entry by hand: no file to load, no exports.
        add_library(${target} STATIC "${anchor}")
        target_link_libraries(${target} PUBLIC ${PLUGIN_WHOLE} ${PLUGIN_LINKS})
        set_target_properties(${target} PROPERTIES OUTPUT_NAME AudioPluginTessaly)
        return()
    elseif(APPLE)
        add_library(${target} MODULE "${anchor}")
        set_target_properties(${target} PROPERTIES BUNDLE TRUE BUNDLE_EXTENSION bundle)
    else()
        add_library(${target} SHARED "${anchor}")
    endif()
    set_target_properties(${target} PROPERTIES
        OUTPUT_NAME AudioPluginTessaly
        BUILD_WITH_INSTALL_RPATH TRUE
        INSTALL_RPATH ""
        LINKER_LANGUAGE CXX)
    foreach(module IN LISTS PLUGIN_WHOLE)
        target_link_libraries(${target} PRIVATE $<LINK_LIBRARY:WHOLE_ARCHIVE,${module}>)
    endforeach()
    target_link_libraries(${target} PRIVATE ${PLUGIN_LINKS})

    if(WIN32)
        tessaly_export_list(exports def)
        target_sources(${target} PRIVATE "${exports}")
        set_target_properties(${target} PROPERTIES PREFIX "")
        if(MINGW)
            target_link_options(${target} PRIVATE -static)
        endif()
    elseif(APPLE)
        tessaly_export_list(exports symbols)
        target_link_options(${target} PRIVATE
            "-Wl,-exported_symbols_list,${exports}" -Wl,-dead_strip)
        set_target_properties(${target} PROPERTIES LINK_DEPENDS "${exports}")
    else()
        tessaly_export_list(exports map)
        # Players ship with many C++ runtimes, so the library brings its own, out of sight, and
        # asks for nothing but the C library: the weak hooks that a static runtime tests for and
        # does without are settled here. Segments of 16 KB load on devices with 16 KB pages.
        target_link_options(${target} PRIVATE
            "-Wl,--version-script=${exports}"
            -Wl,--gc-sections
            -Wl,-z,max-page-size=16384 -Wl,-z,common-page-size=16384
            -Wl,-z,noexecstack -Wl,-z,relro -Wl,-z,now)
        set_target_properties(${target} PROPERTIES LINK_DEPENDS "${exports}")
        if(NOT TESSALY_SANITIZE)
            # A sanitizer's runtime lives in the program, and needs the shared C++ runtime.
            target_link_options(${target} PRIVATE
                -Wl,--no-undefined -Wl,-z,nodynamic-undefined-weak
                -static-libstdc++ -static-libgcc)
        endif()
        if(ANDROID)
            target_link_libraries(${target} PRIVATE log)
        endif()
    endif()
endfunction()
