# Test programs for the built library. They need GoogleTest. Release builds do not contain them.
option(TAVOSSO_TEST_PROGRAMS "Build the test programs" ON)
if(NOT TAVOSSO_TEST_PROGRAMS)
    return()
endif()

find_package(GTest REQUIRED)

add_library(test_support STATIC support/conversion.cpp support/encoding.cpp support/failure.cpp support/files.cpp
            support/openssl_errors.cpp support/token.cpp)
tavosso_options(test_support)
target_compile_definitions(test_support PRIVATE TAVOSSO_WINBIND=$<BOOL:${TAVOSSO_WINBIND}>)
target_link_libraries(test_support PUBLIC failure_table OpenSSL::Crypto PkgConfig::JSONCPP)

# Compiles a source of several programs once. An object library, not an archive: it is always linked, so it replaces
# functions that the library calls.
function(tavosso_objects name source)
    add_library(${name} OBJECT ${source})
    tavosso_options(${name})
    target_link_libraries(${name} PUBLIC test_support)
endfunction()

foreach(interposed calls clock crypto_calls memory platform_calls process releases transport)
    tavosso_objects(interposed_${interposed} support/interposed/${interposed}.cpp)
endforeach()
# Sanitizers allocate memory before they support instrumented code.
foreach(interposed calls memory releases)
    target_compile_options(interposed_${interposed} PRIVATE -fno-sanitize=all)
endforeach()
tavosso_objects(refused_calls support/refused_calls.cpp)
tavosso_objects(system_log support/system_log.cpp)

# all_LABEL_tests builds the test programs of one label, because building all takes minutes.
function(tavosso_label_program label name)
    if(NOT TARGET all_${label}_tests)
        add_custom_target(all_${label}_tests)
    endif()
    add_dependencies(all_${label}_tests ${name})
endfunction()

# Runs a program's tests in one process in private namespaces, because starting these takes longer than most tests.
function(tavosso_add_test label name program)
    tavosso_label_program(${label} ${program})
    add_test(NAME ${label}.${name} COMMAND ${PROJECT_SOURCE_DIR}/tools/private-root $<TARGET_FILE:${program}>)
    # qemu is up to fifty times slower.
    set_tests_properties(${label}.${name} PROPERTIES LABELS ${label} TIMEOUT $<IF:$<BOOL:${CMAKE_CROSSCOMPILING}>,3000,600>)
endfunction()

function(tavosso_test label name)
    add_executable(${name} ${ARGN})
    tavosso_options(${name})
    target_link_libraries(${name} PRIVATE tavosso test_support GTest::gmock_main)
    tavosso_add_test(${label} ${name} ${name})
endfunction()
