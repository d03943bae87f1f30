include(CheckCXXCompilerFlag)
include(CheckPIESupported)

option(TAVOSSO_HARDENING "Harden what is built: RELRO, immediate binding, PIE, stack protection, control-flow protection" ON)
option(TAVOSSO_SANITIZE "Build everything with AddressSanitizer and UndefinedBehaviorSanitizer" OFF)
option(TAVOSSO_FUZZ "Build everything for libFuzzer (clang alone), and the fuzz targets with it" OFF)

check_cxx_compiler_flag(-fcf-protection=full TAVOSSO_HAS_CF_PROTECTION)
check_pie_supported(LANGUAGES CXX)

# What everything is built with.
function(tavosso_options target)
    target_compile_features(${target} PRIVATE cxx_std_17)
    set_target_properties(${target} PROPERTIES CXX_EXTENSIONS OFF)
    target_include_directories(${target} PRIVATE ${PROJECT_SOURCE_DIR})
    target_compile_options(${target} PRIVATE -Wall -Wextra -Wshadow -Wconversion)
    if(TAVOSSO_HARDENING)
        # Not _FORTIFY_SOURCE: it renames the calls that the library makes, and belongs to the packager's flags.
        target_compile_options(${target} PRIVATE -fstack-protector-strong -fstack-clash-protection
            $<$<BOOL:${TAVOSSO_HAS_CF_PROTECTION}>:-fcf-protection=full>)
        target_link_options(${target} PRIVATE LINKER:-z,relro LINKER:-z,now LINKER:-z,noexecstack
            $<$<BOOL:${TAVOSSO_HAS_CF_PROTECTION}>:LINKER:-z,shstk>)
    endif()
    if(TAVOSSO_SANITIZE)
        target_compile_options(${target} PRIVATE -fsanitize=address,undefined -fno-sanitize-recover=all
            -fno-omit-frame-pointer)
        target_link_options(${target} PRIVATE -fsanitize=address,undefined)
    endif()
    if(TAVOSSO_FUZZ)
        # Counts the edges that an input reaches; _GLIBCXX_ASSERTIONS holds every index against its container's bounds.
        target_compile_options(${target} PRIVATE -fsanitize=fuzzer-no-link)
        target_compile_definitions(${target} PRIVATE _GLIBCXX_ASSERTIONS)
    endif()
endfunction()

# Where an installed file finds the library: relative to itself, so that any prefix works without environment variables.
# A Debian package is built with CMAKE_SKIP_RPATH, since its libraries are in the loader's own folders.
function(tavosso_find_library_from target destination)
    file(RELATIVE_PATH to_library /${destination} /${CMAKE_INSTALL_LIBDIR})
    set_target_properties(${target} PROPERTIES INSTALL_RPATH $ORIGIN/${to_library})
endfunction()

# A program that is served, and what is linked into it: loaded at any address, whatever the compiler does by itself.
function(tavosso_program_options target)
    tavosso_options(${target})
    if(TAVOSSO_HARDENING)
        set_target_properties(${target} PROPERTIES POSITION_INDEPENDENT_CODE ON)
    endif()
endfunction()

# A library exports what stands in its NAME.map and nothing else. Calls between its exported functions stay
# interposable: programs may put their own in front.
function(tavosso_library_options target)
    tavosso_options(${target})
    set(map ${PROJECT_SOURCE_DIR}/cmake/lib${target}.map)
    set_target_properties(${target} PROPERTIES
        CXX_VISIBILITY_PRESET hidden
        VISIBILITY_INLINES_HIDDEN ON
        LINK_DEPENDS ${map})
    target_compile_options(${target} PRIVATE -fsemantic-interposition)
    target_link_options(${target} PRIVATE LINKER:--version-script=${map} )
    if(NOT TAVOSSO_SANITIZE)
        target_link_options(${target} PRIVATE LINKER:--no-undefined)
    endif()
endfunction()
