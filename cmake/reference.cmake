# The API reference, from the public headers alone: cmake --build BUILD --target reference, then
# BUILD/reference/html/index.html. A public name without documentation, or without that of a parameter, fails.
find_package(Doxygen)
if(NOT DOXYGEN_FOUND)
    return()
endif()

set(DOXYGEN_PROJECT_BRIEF ${PROJECT_DESCRIPTION})
set(DOXYGEN_OUTPUT_DIRECTORY ${PROJECT_BINARY_DIR}/reference)
set(DOXYGEN_JAVADOC_AUTOBRIEF YES)
set(DOXYGEN_WARN_AS_ERROR FAIL_ON_WARNINGS)
set(DOXYGEN_WARN_NO_PARAMDOC YES)
set(DOXYGEN_SORT_MEMBER_DOCS NO)
set(DOXYGEN_HIDE_UNDOC_RELATIONS NO)
set(DOXYGEN_FULL_PATH_NAMES NO)
set(DOXYGEN_VERBATIM_HEADERS NO)
set(DOXYGEN_HAVE_DOT NO)
set(DOXYGEN_HTML_TIMESTAMP NO)
doxygen_add_docs(reference sso/sso.h jwt/jwt.h)
