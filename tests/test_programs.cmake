# Test programs against the built library. They need GoogleTest; a build of what is shipped, whose files are tested as
# they are, does without.
include(GoogleTest)

option(TAVOSSO_TEST_PROGRAMS "Build the test programs" ON)
if(NOT TAVOSSO_TEST_PROGRAMS)
    return()
endif()

find_package(GTest REQUIRED)

add_library(test_support STATIC support/conversion.cpp support/encoding.cpp support/error_queue.cpp support/failure.cpp support/files.cpp support/token.cpp)
tavosso_options(test_support)
target_compile_definitions(test_support PRIVATE TAVOSSO_WINBIND=$<BOOL:${TAVOSSO_WINBIND}>)
target_link_libraries(test_support PUBLIC OpenSSL::Crypto PkgConfig::JSONCPP)

# Sources that many programs are made with, each compiled once for all of them. Objects and no archive: what a program
# names it has whole, and so takes the place of functions that the library calls.
function(tavosso_objects name source)
    add_library(${name} OBJECT ${source})
    tavosso_options(${name})
    target_link_libraries(${name} PUBLIC test_support)
endfunction()

foreach(interposed calls clock crypto_calls memory platform_calls process releases transport)
    tavosso_objects(interposed_${interposed} interposed/${interposed}.cpp)
endforeach()
# A sanitizer's run time asks for memory before it is ready for code that it looks after.
foreach(interposed calls memory releases)
    target_compile_options(interposed_${interposed} PRIVATE -fno-sanitize=all)
endforeach()
tavosso_objects(refused_calls support/refused_calls.cpp)
tavosso_objects(system_log support/system_log.cpp)

# all_LABEL_tests builds the test programs of one label: all of them together take minutes.
function(tavosso_label_program label name)
    if(NOT TARGET all_${label}_tests)
        add_custom_target(all_${label}_tests)
    endif()
    add_dependencies(all_${label}_tests ${name})
endfunction()

# Makes a program's tests known, each to be run on its own in private namespaces.
function(tavosso_discover_tests label name)
    tavosso_label_program(${label} ${name})
    set_target_properties(${name} PROPERTIES CROSSCOMPILING_EMULATOR ${PROJECT_SOURCE_DIR}/tools/private-root)
    gtest_discover_tests(${name} NO_PRETTY_VALUES TEST_PREFIX ${label}. DISCOVERY_TIMEOUT 60
                         PROPERTIES LABELS ${label} TIMEOUT 120)
endfunction()

function(tavosso_test label name)
    add_executable(${name} ${ARGN})
    tavosso_options(${name})
    target_link_libraries(${name} PRIVATE tavosso test_support GTest::gmock_main)
    tavosso_discover_tests(${label} ${name})
endfunction()
