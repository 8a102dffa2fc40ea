# Flags that hold for every target of the repository.
set(CMAKE_CXX_STANDARD 20)
set(CMAKE_CXX_STANDARD_REQUIRED ON)
set(CMAKE_CXX_EXTENSIONS OFF)
set(CMAKE_POSITION_INDEPENDENT_CODE ON)
set(CMAKE_CXX_VISIBILITY_PRESET hidden)
set(CMAKE_VISIBILITY_INLINES_HIDDEN ON)
set(CMAKE_EXPORT_COMPILE_COMMANDS ON)

include(CheckPIESupported)
check_pie_supported(LANGUAGES CXX)

add_library(vornovs_warnings INTERFACE)
target_compile_options(vornovs_warnings INTERFACE
    -Wall -Wextra -Wpedantic -Wshadow -Wconversion -Wsign-conversion -Wold-style-cast
    -Wnon-virtual-dtor -Woverloaded-virtual -Wcast-qual -Wformat=2 -Wundef
    $<$<CXX_COMPILER_ID:GNU>:-Wduplicated-cond -Wlogical-op -Wuseless-cast>
    $<$<BOOL:${VORNOVS_WERROR}>:-Werror>)

add_compile_options(-fstack-protector-strong -fstack-clash-protection)
if(CMAKE_SYSTEM_PROCESSOR MATCHES "x86_64|i.86")
    add_compile_options(-fcf-protection=full)
endif()
# Fortification needs the optimizer; the compilers say so when it is missing.
add_compile_options($<$<CONFIG:Release,RelWithDebInfo>:-U_FORTIFY_SOURCE>
                    $<$<CONFIG:Release,RelWithDebInfo>:-D_FORTIFY_SOURCE=2>)
add_link_options(LINKER:-z,relro LINKER:-z,now LINKER:-z,noexecstack LINKER:--as-needed)
# The sanitizers' runtimes leave symbols to the program that loads the library.
if(NOT CMAKE_CXX_FLAGS MATCHES "-fsanitize")
    add_link_options(LINKER:-z,defs)
endif()

# This check opens descriptors to find out whether it may read where it looks, and clients may have
# none left; the preset ubsan keeps it.
if(CMAKE_CXX_FLAGS MATCHES "-fsanitize=address,undefined")
    add_compile_options(-fno-sanitize=vptr)
endif()

# What a library offers is compared with a recorded baseline by its types, which the release build's
# debugging information has for these targets; packages are stripped of it.
function(vornovs_describe_types)
    foreach(target ${ARGN})
        target_compile_options(${target} PRIVATE $<$<CONFIG:RelWithDebInfo>:-g2>)
    endforeach()
endfunction()

# Exports of a library: only what the version script in packaging/ names.
function(vornovs_export target script)
    vornovs_describe_types(${target})
    target_link_options(${target} PRIVATE "LINKER:--version-script=${script}")
    set_target_properties(${target} PROPERTIES LINK_DEPENDS "${script}")
endfunction()
