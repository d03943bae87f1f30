include(CheckCXXCompilerFlag)
include(CheckPIESupported)

option(TAVOSSO_HARDENING "Harden binaries: RELRO, immediate binding, PIE, stack protection, control-flow protection" ON)
option(TAVOSSO_SANITIZE "Build everything with AddressSanitizer and UndefinedBehaviorSanitizer" OFF)
option(TAVOSSO_FUZZ "Build everything for libFuzzer, and the fuzz targets (clang only)" OFF)

check_cxx_compiler_flag(-fcf-protection=full TAVOSSO_HAS_CF_PROTECTION)
check_pie_supported(LANGUAGES CXX)

# Options of every target.
function(tavosso_options target)
    target_compile_features(${target} PRIVATE cxx_std_17)
    set_target_properties(${target} PROPERTIES CXX_EXTENSIONS OFF)
    target_include_directories(${target} PRIVATE ${PROJECT_SOURCE_DIR})
    # Without -Wno-psabi, g++ for 32-bit ARM mentions each call whose convention differs from that of g++ 6.
    target_compile_options(${target} PRIVATE -Wall -Wextra -Wshadow -Wconversion -Wno-psabi)
    if(TAVOSSO_HARDENING)
        # Not _FORTIFY_SOURCE: it renames the library's calls, and the packager sets it.
        target_compile_options(${target} PRIVATE -fstack-protector-strong -fstack-clash-protection
            $<$<BOOL:${TAVOSSO_HAS_CF_PROTECTION}>:-fcf-protection=full>
            $<$<STREQUAL:${CMAKE_SYSTEM_PROCESSOR},aarch64>:-mbranch-protection=standard>)
        target_link_options(${target} PRIVATE LINKER:-z,relro LINKER:-z,now LINKER:-z,noexecstack
            $<$<BOOL:${TAVOSSO_HAS_CF_PROTECTION}>:LINKER:-z,shstk>)
    endif()
    if(TAVOSSO_SANITIZE)
        target_compile_options(${target} PRIVATE -fsanitize=address,undefined -fno-sanitize-recover=all
            -fno-omit-frame-pointer)
        target_link_options(${target} PRIVATE -fsanitize=address,undefined)
    endif()
    if(TAVOSSO_FUZZ)
        # Edge coverage; _GLIBCXX_ASSERTIONS checks every index.
        target_compile_options(${target} PRIVATE -fsanitize=fuzzer-no-link)
        target_compile_definitions(${target} PRIVATE _GLIBCXX_ASSERTIONS)
    endif()
endfunction()

# Sets a run path relative to the installed file, so any prefix works without environment variables. Debian packages are
# built with CMAKE_SKIP_RPATH: the loader finds their folders.
function(tavosso_find_library_from target destination)
    file(RELATIVE_PATH to_library /${destination} /${CMAKE_INSTALL_LIBDIR})
    set_target_properties(${target} PROPERTIES INSTALL_RPATH $ORIGIN/${to_library})
endfunction()

# Options of served programs and of objects linked into them: PIE, independent of the compiler's default.
function(tavosso_program_options target)
    tavosso_options(${target})
    if(TAVOSSO_HARDENING)
        set_target_properties(${target} PROPERTIES POSITION_INDEPENDENT_CODE ON)
    endif()
endfunction()

# Options of a library. It exports only the names in cmake/libNAME.map. Programs can replace exported functions.
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
