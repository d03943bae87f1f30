# The API reference of the public headers. The target "reference" writes BUILD/reference/html/index.html.
# It fails if a public name or a parameter is not documented.
find_package(Doxygen QUIET)
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
set(DOXYGEN_BUILTIN_STL_SUPPORT YES)
set(DOXYGEN_QUIET YES)
set(DOXYGEN_VERBATIM_HEADERS NO)
set(DOXYGEN_HAVE_DOT NO)
set(DOXYGEN_HTML_TIMESTAMP NO)
# Show the headers' names as programs include them.
set(DOXYGEN_STRIP_FROM_PATH ${installed_headers})
set(DOXYGEN_STRIP_FROM_INC_PATH ${installed_headers})
doxygen_add_docs(reference ${installed_headers}/tavosso/sso.h ${installed_headers}/tavosso/jwt.h
                 ${installed_headers}/tavosso/web.h)
