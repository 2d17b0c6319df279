# Language level, floating-point rules, warnings and sanitizers, the same for every target.
set(CMAKE_CXX_STANDARD 20)
set(CMAKE_CXX_STANDARD_REQUIRED ON)
set(CMAKE_CXX_EXTENSIONS OFF)
set(CMAKE_POSITION_INDEPENDENT_CODE ON)
set(CMAKE_CXX_VISIBILITY_PRESET hidden)
set(CMAKE_VISIBILITY_INLINES_HIDDEN ON)

if(MSVC)
    add_compile_options(/W4 /permissive- /fp:precise /utf-8)
    if(TESSALY_WARNINGS_AS_ERRORS)
        add_compile_options(/WX)
    endif()
else()
    # Rounding decides integer delays and table indices: no contraction into fused operations.
    add_compile_options(
        -ffp-contract=off
        -Wall -Wextra -Wpedantic -Wshadow -Wconversion -Wno-sign-conversion -Wdouble-promotion
        -Wold-style-cast -Wcast-align -Wformat=2 -Wundef -Woverloaded-virtual)
    if(TESSALY_WARNINGS_AS_ERRORS)
        add_compile_options(-Werror)
    endif()
endif()

if(TESSALY_SANITIZE)
    add_compile_options(-fsanitize=${TESSALY_SANITIZE} -fno-omit-frame-pointer
                        -fno-sanitize-recover=all)
    add_link_options(-fsanitize=${TESSALY_SANITIZE})
endif()

# tessaly_module(<folder> SOURCES ... LINKS ...): one static library a folder of NativeCode.
# Targets are named tessaly_<folder>; includes are written from NativeCode, "engine/biquad.h".
function(tessaly_module folder)
    cmake_parse_arguments(MODULE "" "" "SOURCES;LINKS" ${ARGN})
    add_library(tessaly_${folder} STATIC ${MODULE_SOURCES})
    target_include_directories(tessaly_${folder} PUBLIC ${PROJECT_SOURCE_DIR}/NativeCode)
    target_link_libraries(tessaly_${folder} PUBLIC ${MODULE_LINKS})
    if(TESSALY_TRACE)
        target_compile_definitions(tessaly_${folder} PUBLIC TESSALY_TRACE=1)
    endif()
endfunction()
